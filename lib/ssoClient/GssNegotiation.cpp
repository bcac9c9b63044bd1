#include "ssoClient/GssNegotiation.h"

#include <boost/make_shared.hpp>

#include "ssoClient/Descriptions.h"
#include "ssoClient/Exceptions.h"
#include "ssoClient/HttpsClient.h"
#include "ssoClient/Log.h"
#include "ssoClient/OperationFrame.h"
#include "ssoClient/RequestBuilderImpl.h"
#include "ssoClient/ResponseHandlerImpl.h"
#include "ssoClient/SPNegoResponse.h"
#include "ssoClient/SecurityTokenServiceImpl.h"
#include "tamber/Exception.h"

namespace SsoClient {

using Tamber::Service::LOG_TRACE;
using Tamber::Service::LOG_WARNING;

namespace {

// Bounds each wait for an answer of a step-by-step negotiation.
const long long kNegotiationRequestTimeout = 40000000;

// The handler's next leg, which must be there and, since it is sent, not empty.
const Leg& CheckUserLeg(const boost::shared_ptr<Leg>& userLeg) {
  if (!userLeg) throw Tamber::InvalidArgumentException("Invalid NegotiationHandler: the returned leg may not be NULL");
  if (userLeg->empty()) {
    throw Tamber::InvalidArgumentException(
        "Invalid NegotiationHandler: the returned leg may not be empty while the negotiation goes on");
  }
  return *userLeg;
}

}  // namespace

boost::shared_ptr<const SamlToken> SecurityTokenServiceImpl::AcquireTokenByGSS(const TokenSpec& spec,
                                                                               NegotiationHandler& handler) const {
  OperationFrame frame("AcquireTokenByGSS");
  SSOCLIENT_LOG(LOG_TRACE, "Requested token with spec `%1'", WriteTokenSpec(spec));
  // One session for every leg: the STS keeps the negotiation in the session's cookies.
  const boost::shared_ptr<TransportSession> session = _transport->CreateSession();
  SPNegoResponse response;
  do {
    const boost::shared_ptr<Leg> userLeg = handler.NegotiateLeg(response.leg);
    const Leg& leg = CheckUserLeg(userLeg);
    if (response.contextId.empty()) {
      StartSPNegotiation(*session, leg, spec, response);
    } else {
      ContinueSPNegotiation(*session, leg, response.contextId, response);
    }
    if (response.contextId.empty()) {
      throw CommunicationException(
          "Error processing the response to SPNego token request: no Context ID was returned.");
    }
  } while (response.token.empty());

  // The mechanism completes on the STS's last leg; what it answers is never sent.
  if (!response.leg.empty()) {
    const boost::shared_ptr<Leg> finalLeg = handler.NegotiateLeg(response.leg);
    if (finalLeg && !finalLeg->empty()) {
      SSOCLIENT_LOG(LOG_WARNING, "GSS contract error: non-empty user leg after negotiation is complete");
    }
  }
  return ToSamlToken(response.token);
}

void SecurityTokenServiceImpl::StartSPNegotiation(TransportSession& session, const Leg& leg, const TokenSpec& spec,
                                                  SPNegoResponse& response) const {
  TAMBER_VERIFY_TEXT(!leg.empty(), "!leg.empty()");
  Request request;
  _requestBuilder->BuildInitialSPNegoRequest(spec, leg, request);
  Tamber::Ref<Tamber::Reader> reader;
  session.SendRequest(request, reader);
  _responseHandler->HandleSPNegoResponse(reader.get(), response);
}

void SecurityTokenServiceImpl::ContinueSPNegotiation(TransportSession& session, const Leg& leg,
                                                     const std::string& contextId, SPNegoResponse& response) const {
  TAMBER_VERIFY_TEXT(!leg.empty(), "!leg.empty()");
  Request request;
  _requestBuilder->BuildContinuedSPNegoRequest(contextId, leg, request);
  Tamber::Ref<Tamber::Reader> reader;
  session.SendRequest(request, reader);
  _responseHandler->HandleSPNegoResponse(reader.get(), response);
}

namespace InternalApi {

GssNegotiationContextImpl::GssNegotiationContextImpl(const TokenSpec& spec,
                                                     const boost::shared_ptr<const RequestBuilder>& requestBuilder,
                                                     const boost::shared_ptr<TransportSession>& session,
                                                     const boost::shared_ptr<const ResponseHandler>& responseHandler,
                                                     const CertificateList& trustedCertificates)
    : _tokenSpec(spec),
      _requestBuilder(requestBuilder),
      _session(session),
      _responseHandler(responseHandler),
      _trustedCertificates(trustedCertificates) {
  if (_trustedCertificates.empty()) throw Tamber::InvalidArgumentException("No STS trusted certificates provided");
}

NegotiationResult GssNegotiationContextImpl::NegotiateToken(const Leg& leg) {
  Request request;
  if (_contextId.empty()) {
    _requestBuilder->BuildInitialSPNegoRequest(_tokenSpec, leg, request);
  } else {
    _requestBuilder->BuildContinuedSPNegoRequest(_contextId, leg, request);
  }
  Tamber::Ref<Tamber::Reader> reader;
  _session->SendRequest(request, reader);
  SPNegoResponse response;
  _responseHandler->HandleSPNegoResponse(reader.get(), response);

  _contextId = response.contextId;
  NegotiationResult result;
  result.leg = boost::make_shared<Leg>(response.leg);
  if (!response.token.empty()) result.token = CreateSamlToken(response.token, _trustedCertificates);
  return result;
}

boost::shared_ptr<GssNegotiationContext> CreateGssNegotiationContext(const SecurityTokenServiceConfig& config,
                                                                     const TokenSpec& spec) {
  boost::shared_ptr<const RequestBuilder> requestBuilder(new RequestBuilderImpl(config.holderOfKeyConfig));
  const HttpsClient client(config.stsUrl, config.sslContext, config.sslParameter, kNegotiationRequestTimeout);
  boost::shared_ptr<const ResponseHandler> responseHandler(new ResponseHandlerImpl());
  return boost::shared_ptr<GssNegotiationContext>(new GssNegotiationContextImpl(
      spec, requestBuilder, client.CreateSession(), responseHandler, config.trustedCertificates));
}

}  // namespace InternalApi
}  // namespace SsoClient
