#ifndef SSOCLIENT_RESPONSEHANDLERIMPL_H
#define SSOCLIENT_RESPONSEHANDLERIMPL_H

// Turning the STS's answers into results: SOAP faults into exceptions, WS-Trust responses into
// assertion texts, validation verdicts and SPNEGO legs.

#include <string>

#include "ssoClient/Exceptions.h"
#include "ssoClient/SPNegoResponse.h"
#include "tamber/Ref.h"
#include "tamber/Stream.h"
#include "tamber/xml/Dom.h"

namespace SsoClient {

class ResponseHandler {
 public:
  virtual void HandleAcquireTokenResponse(Tamber::Reader* response, std::string& token) const = 0;
  virtual bool HandleValidateSubjectResponse(Tamber::Reader* response) const = 0;
  virtual void HandleRenewTokenResponse(Tamber::Reader* response, std::string& token) const = 0;
  virtual void HandleSPNegoResponse(Tamber::Reader* response, SPNegoResponse& result) const = 0;

 protected:
  // Owned by shared pointers made from the concrete type.
  ~ResponseHandler() = default;
};

// Stateless; one instance serves every operation and thread. Out-parameters are written only on
// success.
class ResponseHandlerImpl final : public ResponseHandler {
 public:
  void HandleAcquireTokenResponse(Tamber::Reader* response, std::string& token) const override;
  bool HandleValidateSubjectResponse(Tamber::Reader* response) const override;
  void HandleRenewTokenResponse(Tamber::Reader* response, std::string& token) const override;
  void HandleSPNegoResponse(Tamber::Reader* response, SPNegoResponse& result) const override;
};

// Parses the whole answer; XML that is not well-formed raises SsoException quoting the parser.
void ParseResponseDocument(Tamber::Reader* response, Tamber::Ref<Tamber::Xml::ElementNode>& root);

// Raises the exception for a SOAP fault in Body: InvalidCredentialsException for the
// authentication fault codes, SsoException for any other code or a fault without one. Returns
// when there is no fault.
void CheckForSoapFault(Tamber::Xml::ElementNode* root);

// The inclusive canonical form (Canonical XML 1.0) of `element`, namespaces in scope included,
// so that it parses on its own; empty for null.
std::string CanonicalizeToString(const Tamber::Xml::ElementNode* element);

// Parses the answer, raises its SOAP fault if it has one, and hands its Body to `function`,
// whose result it returns. The document lives until `function` has returned.
template <class F>
auto ProcessResponseWith(Tamber::Reader* response, F function) -> decltype(function(nullptr)) {
  Tamber::Ref<Tamber::Xml::ElementNode> root;
  ParseResponseDocument(response, root);
  CheckForSoapFault(root.get());
  // Answers are looked up by local name only, whatever their namespace.
  Tamber::Xml::ElementNode* body = root->FindChildElementByLocalName("Body");
  if (body == nullptr) throw SsoException("Unexpected response format: missing SAOP Body.");
  return function(body);
}

}  // namespace SsoClient

#endif
