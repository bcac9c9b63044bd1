#ifndef SSOCLIENT_REQUEST_H
#define SSOCLIENT_REQUEST_H

// A request to the STS as it goes on the wire, and the interface that builds one per operation.

#include <string>
#include <vector>

#include "ssoClient/SamlToken.h"
#include "ssoClient/TokenSpec.h"

namespace SsoClient {

struct Request {
  // SOAP actions.
  static const char* const ISSUE;
  static const char* const RENEW;
  static const char* const VALIDATE;
  // The action of a continued SPNEGO leg; the name is spelled so on purpose.
  static const char* const CHALLANGE;

  // Sent as the SOAPAction header.
  std::string soapAction;
  // The serialised SOAP envelope.
  std::string body;
};

// Turns each operation of the token service into a request. Every operation checks its
// arguments first and raises before building anything; soapAction is set before the envelope is
// built, body last.
class RequestBuilder {
 public:
  virtual void BuildUserPassTokenRequest(const std::string& userName, const std::string& password,
                                         const TokenSpec& spec, Request& request) const = 0;
  virtual void BuildInitialSPNegoRequest(const TokenSpec& spec, const std::vector<unsigned char>& leg,
                                         Request& request) const = 0;
  virtual void BuildContinuedSPNegoRequest(const std::string& contextId, const std::vector<unsigned char>& leg,
                                           Request& request) const = 0;
  virtual void BuildCertificateTokenRequest(const TokenSpec& spec, Request& request) const = 0;
  virtual void BuildExchangeTokenRequest(const SamlToken& token, const TokenSpec& spec, Request& request) const = 0;
  virtual void BuildValidateSubjectRequest(const SamlToken& token, Request& request) const = 0;
  virtual void BuildRenewRequest(const SamlToken& token, long long lifetimeSeconds, Request& request) const = 0;

 protected:
  // Owned by shared pointers made from the concrete type.
  ~RequestBuilder() = default;
};

}  // namespace SsoClient

#endif
