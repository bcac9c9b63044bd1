#ifndef SSOCLIENT_SECURITYTOKENSERVICEIMPL_H
#define SSOCLIENT_SECURITYTOKENSERVICEIMPL_H

#include <string>

#include <boost/shared_ptr.hpp>

#include "ssoClient/Request.h"
#include "ssoClient/SecurityTokenService.h"
#include "ssoClient/Verify.h"
#include "tamber/Stream.h"

namespace SsoClient {

class ResponseHandler;
struct SPNegoResponse;
class Transport;
class TransportSession;

// The token service over a request builder, a transport and a response handler. Immutable after
// construction; copies share the three collaborators, which is how an asynchronous operation
// keeps the service alive on its worker thread.
class SecurityTokenServiceImpl final : public SecurityTokenService {
 public:
  SecurityTokenServiceImpl(const boost::shared_ptr<const RequestBuilder>& requestBuilder,
                           const boost::shared_ptr<const Transport>& transport,
                           const boost::shared_ptr<const ResponseHandler>& responseHandler,
                           const CertificateList& trustedCertificates);

  // SecurityTokenServiceImpl.cpp
  boost::shared_ptr<const SamlToken> AcquireToken(const std::string& user, const std::string& password,
                                                  const TokenSpec& spec) const override;
  boost::shared_ptr<const SamlToken> AcquireTokenByCertificate(const TokenSpec& spec) const override;
  boost::shared_ptr<const SamlToken> AcquireTokenByToken(const SamlToken& token, const TokenSpec& spec) const override;
  bool ValidateSubject(const SamlToken& token) const override;
  boost::shared_ptr<const SamlToken> RenewToken(const SamlToken& token, long long lifetimeSec) const override;

  // GssNegotiation.cpp
  boost::shared_ptr<const SamlToken> AcquireTokenByGSS(const TokenSpec& spec,
                                                       NegotiationHandler& handler) const override;

  // AsyncOperations.cpp
  void AcquireTokenAsync(const std::string& user, const std::string& password, const TokenSpec& spec,
                         const TokenCallback& callback) const override;
  void AcquireTokenByGssAsync(const TokenSpec& spec, const boost::shared_ptr<NegotiationHandler>& handler,
                              const TokenCallback& callback) const override;
  void AcquireTokenByCertificateAsync(const TokenSpec& spec, const TokenCallback& callback) const override;
  void AcquireTokenByTokenAsync(const boost::shared_ptr<const SamlToken>& token, const TokenSpec& spec,
                                const TokenCallback& callback) const override;
  void ValidateSubjectAsync(const boost::shared_ptr<const SamlToken>& token,
                            const ValidateCallback& callback) const override;
  void RenewTokenAsync(const boost::shared_ptr<const SamlToken>& token, long long lifetimeSec,
                       const TokenCallback& callback) const override;

 private:
  // The validated token of an STS answer, null for an empty text. A ParseException of the
  // assertion becomes an SsoException with the same message: the STS, not the caller, sent it.
  boost::shared_ptr<const SamlToken> ToSamlToken(const std::string& assertionXml) const;
  // Sends `request` on a session of its own, released as soon as the answer is there.
  void Send(const Request& request, Tamber::Ref<Tamber::Reader>& response) const;
  // One SPNEGO exchange on `session`: the first leg, or a further leg of `contextId` (which may
  // be response.contextId itself: the request is built before `response` is written).
  void StartSPNegotiation(TransportSession& session, const Leg& leg, const TokenSpec& spec,
                          SPNegoResponse& response) const;
  void ContinueSPNegotiation(TransportSession& session, const Leg& leg, const std::string& contextId,
                             SPNegoResponse& response) const;
  // A private copy of this service for a work item.
  boost::shared_ptr<const SecurityTokenService> CopyForWorkItem() const;

  boost::shared_ptr<const RequestBuilder> _requestBuilder;
  boost::shared_ptr<const Transport> _transport;
  boost::shared_ptr<const ResponseHandler> _responseHandler;
  CertificateList _trustedCertificates;
};

// Hands an object owned by a shared pointer to a bound call as a reference, keeping the object
// alive for as long as any copy of the binding exists. A null pointer is a broken contract of the
// caller and ends the process.
template <class T>
class PassByRefHelper {
 public:
  explicit PassByRefHelper(const boost::shared_ptr<T>& p) : _p(p) { TAMBER_VERIFY_TEXT(_p, "_p"); }

  operator T&() const { return *_p; }

 private:
  boost::shared_ptr<T> _p;
};

}  // namespace SsoClient

#endif
