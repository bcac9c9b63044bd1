#ifndef SSOCLIENT_GSSNEGOTIATION_H
#define SSOCLIENT_GSSNEGOTIATION_H

// The GSS/SPNEGO negotiation one leg at a time. The one-call form driving a NegotiationHandler
// is SecurityTokenServiceImpl::AcquireTokenByGSS, defined in GssNegotiation.cpp beside it.

#include <string>

#include <boost/shared_ptr.hpp>

#include "ssoClient/GssNegotiationContext.h"
#include "ssoClient/Request.h"
#include "ssoClient/TokenSpec.h"

namespace SsoClient {

class ResponseHandler;
class TransportSession;

namespace InternalApi {

// A negotiation in one of two states: before the first step (no context id: the next step sends
// an initial request carrying the token specification) and negotiating (the next step sends a
// continued request of the STS's context). An answer without context id starts it over. Every
// step goes through the one session, so that all share its cookies.
class GssNegotiationContextImpl final : public virtual GssNegotiationContext {
 public:
  // Raises Tamber::InvalidArgumentException when `trustedCertificates` is empty.
  GssNegotiationContextImpl(const TokenSpec& spec, const boost::shared_ptr<const RequestBuilder>& requestBuilder,
                            const boost::shared_ptr<TransportSession>& session,
                            const boost::shared_ptr<const ResponseHandler>& responseHandler,
                            const CertificateList& trustedCertificates);

  NegotiationResult NegotiateToken(const Leg& leg) override;

 private:
  TokenSpec _tokenSpec;
  std::string _contextId;
  boost::shared_ptr<const RequestBuilder> _requestBuilder;
  boost::shared_ptr<TransportSession> _session;
  boost::shared_ptr<const ResponseHandler> _responseHandler;
  CertificateList _trustedCertificates;
};

}  // namespace InternalApi
}  // namespace SsoClient

#endif
