#include "ssoClient/SecurityTokenServiceImpl.h"

#include "ssoClient/Descriptions.h"
#include "ssoClient/Exceptions.h"
#include "ssoClient/HttpsClient.h"
#include "ssoClient/Log.h"
#include "ssoClient/OperationFrame.h"
#include "ssoClient/RequestBuilderImpl.h"
#include "ssoClient/ResponseHandlerImpl.h"
#include "tamber/MessageFormatter.h"

namespace SsoClient {

using Tamber::Service::LOG_TRACE;

namespace {

// Bounds each synchronous wait of the service's transport for an answer.
const long long kRequestTimeout = 240000000;

}  // namespace

boost::shared_ptr<SecurityTokenService> CreateSecurityTokenService(const SecurityTokenServiceConfig& config) {
  boost::shared_ptr<const RequestBuilder> requestBuilder(new RequestBuilderImpl(config.holderOfKeyConfig));
  boost::shared_ptr<const Transport> transport(
      new HttpsClient(config.stsUrl, config.sslContext, config.sslParameter, kRequestTimeout));
  boost::shared_ptr<const ResponseHandler> responseHandler(new ResponseHandlerImpl());
  return boost::shared_ptr<SecurityTokenService>(
      new SecurityTokenServiceImpl(requestBuilder, transport, responseHandler, config.trustedCertificates));
}

SecurityTokenServiceImpl::SecurityTokenServiceImpl(const boost::shared_ptr<const RequestBuilder>& requestBuilder,
                                                   const boost::shared_ptr<const Transport>& transport,
                                                   const boost::shared_ptr<const ResponseHandler>& responseHandler,
                                                   const CertificateList& trustedCertificates)
    : _requestBuilder(requestBuilder),
      _transport(transport),
      _responseHandler(responseHandler),
      _trustedCertificates(trustedCertificates) {}

boost::shared_ptr<const SamlToken> SecurityTokenServiceImpl::AcquireToken(const std::string& user,
                                                                          const std::string& password,
                                                                          const TokenSpec& spec) const {
  OperationFrame frame("AcquireToken");
  SSOCLIENT_LOG(LOG_TRACE, "Requested token for subject `%1', spec `%2'", user, WriteTokenSpec(spec));
  Request request;
  _requestBuilder->BuildUserPassTokenRequest(user, password, spec, request);
  SSOCLIENT_LOG(LOG_TRACE, "SecurityTokenServiceImpl::AcquireToken sending request");
  Tamber::Ref<Tamber::Reader> response;
  Send(request, response);
  SSOCLIENT_LOG(LOG_TRACE, "SecurityTokenServiceImpl::AcquireToken processing response");
  std::string assertion;
  _responseHandler->HandleAcquireTokenResponse(response.get(), assertion);
  return ToSamlToken(assertion);
}

boost::shared_ptr<const SamlToken> SecurityTokenServiceImpl::AcquireTokenByCertificate(const TokenSpec& spec) const {
  OperationFrame frame("AcquireTokenByCertificate");
  SSOCLIENT_LOG(LOG_TRACE, "Requested token with spec `%1'", WriteTokenSpec(spec));
  Request request;
  _requestBuilder->BuildCertificateTokenRequest(spec, request);
  Tamber::Ref<Tamber::Reader> response;
  Send(request, response);
  std::string assertion;
  _responseHandler->HandleAcquireTokenResponse(response.get(), assertion);
  return ToSamlToken(assertion);
}

boost::shared_ptr<const SamlToken> SecurityTokenServiceImpl::AcquireTokenByToken(const SamlToken& token,
                                                                                 const TokenSpec& spec) const {
  OperationFrame frame("AcquireTokenByToken");
  SSOCLIENT_LOG(LOG_TRACE, "Requested token for %1 with spec `%2'", CreateRedactedDescription(token),
                WriteTokenSpec(spec));
  Request request;
  _requestBuilder->BuildExchangeTokenRequest(token, spec, request);
  Tamber::Ref<Tamber::Reader> response;
  Send(request, response);
  std::string assertion;
  _responseHandler->HandleAcquireTokenResponse(response.get(), assertion);
  return ToSamlToken(assertion);
}

boost::shared_ptr<const SamlToken> SecurityTokenServiceImpl::RenewToken(const SamlToken& token,
                                                                        long long lifetimeSec) const {
  OperationFrame frame("RenewToken");
  SSOCLIENT_LOG(LOG_TRACE, "Renewing token %1 for %2 more seconds", CreateRedactedDescription(token), lifetimeSec);
  Request request;
  _requestBuilder->BuildRenewRequest(token, lifetimeSec, request);
  Tamber::Ref<Tamber::Reader> response;
  Send(request, response);
  std::string assertion;
  _responseHandler->HandleRenewTokenResponse(response.get(), assertion);
  return ToSamlToken(assertion);
}

bool SecurityTokenServiceImpl::ValidateSubject(const SamlToken& token) const {
  OperationFrame frame("ValidateSubject");
  SSOCLIENT_LOG(LOG_TRACE, "Validating subject of token %1", CreateRedactedDescription(token));
  Request request;
  _requestBuilder->BuildValidateSubjectRequest(token, request);
  Tamber::Ref<Tamber::Reader> response;
  Send(request, response);
  const bool result = _responseHandler->HandleValidateSubjectResponse(response.get());
  SSOCLIENT_LOG(LOG_TRACE, "Result: %1", Tamber::MessageFormatter::BoolPrintFormatter(result));
  return result;
}

boost::shared_ptr<const SamlToken> SecurityTokenServiceImpl::ToSamlToken(const std::string& assertionXml) const {
  if (assertionXml.empty()) return boost::shared_ptr<const SamlToken>();
  boost::shared_ptr<const SamlToken> token;
  try {
    token = CreateSamlToken(assertionXml, _trustedCertificates);
  } catch (const ParseException& e) {
    throw SsoException(e.what());
  }
  SSOCLIENT_LOG(LOG_TRACE, "Successfully acquired token: %1", CreateRedactedDescription(*token));
  return token;
}

void SecurityTokenServiceImpl::Send(const Request& request, Tamber::Ref<Tamber::Reader>& response) const {
  const boost::shared_ptr<TransportSession> session = _transport->CreateSession();
  session->SendRequest(request, response);
}

}  // namespace SsoClient
