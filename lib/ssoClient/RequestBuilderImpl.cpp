#include "ssoClient/RequestBuilderImpl.h"

#include "ssoClient/xmlRequestBuilders.h"
#include "ssoClient/xmlSoapBuilders.h"
#include "tamber/Exception.h"
#include "tamber/Panic.h"

namespace SsoClient {

namespace {

// Every request expires ten minutes after it was assembled.
const int kTimestampMinutes = 10;

const char kAcquireByCertificate[] = "acquire token by certificate";
const char kAcquireByToken[] = "acquire token by token";
const char kRenewToken[] = "renew token";

void VerifyHolderOfKey(const SamlToken& token) {
  TAMBER_VERIFY_TEXT(token.GetConfirmationMethod() == SamlToken::CONFIRM_HOLDER_OF_KEY,
                     "token.GetConfirmationMethod() == SamlToken::CONFIRM_HOLDER_OF_KEY");
}

}  // namespace

RequestBuilderImpl::RequestBuilderImpl(const boost::optional<HolderOfKeyConfig>& holderOfKeyConfig)
    : _holderOfKeyConfig(holderOfKeyConfig) {}

void RequestBuilderImpl::BuildUserPassTokenRequest(const std::string& userName, const std::string& password,
                                                   const TokenSpec& spec, Request& request) const {
  ValidateLifetime(spec.tokenLifetimeSec);
  BuilderPtr header =
      CompositeBuilder(WsSecurityHeaderBuilder(kTimestampMinutes), {WsseUsernameTokenBuilder(userName, password)});
  BuilderPtr body = AcquireSecurityTokenBuilder(GetEffectiveConfirmationType(spec.confirmation), spec);
  request.soapAction = Request::ISSUE;
  request.body = BuildTokenRequest(ConfOverrideWithDelegate(spec), header, body);
}

void RequestBuilderImpl::BuildInitialSPNegoRequest(const TokenSpec& spec, const std::vector<unsigned char>& leg,
                                                   Request& request) const {
  ValidateLifetime(spec.tokenLifetimeSec);
  BuilderPtr header = WsSecurityHeaderBuilder(kTimestampMinutes);
  BuilderPtr body(new XMLBodyBuilderInitialSPNego(GetEffectiveConfirmationType(spec.confirmation), spec, leg));
  request.soapAction = Request::ISSUE;
  request.body = BuildTokenRequest(ConfOverrideWithDelegate(spec), header, body);
}

void RequestBuilderImpl::BuildContinuedSPNegoRequest(const std::string& contextId,
                                                     const std::vector<unsigned char>& leg, Request& request) const {
  BuilderPtr header = WsSecurityHeaderBuilder(kTimestampMinutes);
  BuilderPtr body(new XMLBodyBuilderContinuedSPNego(contextId, leg));
  request.soapAction = Request::CHALLANGE;
  request.body = BuildUnSignedRequest(header, body);
}

void RequestBuilderImpl::BuildCertificateTokenRequest(const TokenSpec& spec, Request& request) const {
  ValidateLifetime(spec.tokenLifetimeSec);
  ValidateHokIsConfigured(kAcquireByCertificate);
  if (spec.confirmation != TokenSpec::CONFIRMATION_DEFAULT) {
    throw Tamber::InvalidArgumentException(std::string("TokenSpec::confirmation must be CONFIRMATION_DEFAULT for ") +
                                           kAcquireByCertificate);
  }
  BuilderPtr header = CompositeBuilder(WsSecurityHeaderBuilder(kTimestampMinutes), {});
  BuilderPtr body = AcquireSecurityTokenBuilder(GetEffectiveConfirmationType(spec.confirmation), spec);
  request.soapAction = Request::ISSUE;
  request.body = BuildCertRefSignedRequest(header, body);
}

void RequestBuilderImpl::BuildExchangeTokenRequest(const SamlToken& token, const TokenSpec& spec,
                                                   Request& request) const {
  ValidateLifetime(spec.tokenLifetimeSec);
  ValidateHokIsConfigured(kAcquireByToken);
  BuilderPtr header = CompositeBuilder(WsSecurityHeaderBuilder(kTimestampMinutes), {InsertSamlTokenBuilder(token)});
  BuilderPtr body = ExchangeSecurityTokenBuilder(GetEffectiveConfirmationType(spec.confirmation), spec);
  request.soapAction = Request::ISSUE;
  request.body = BuildSamlRefSignedRequest(token.GetId(), header, body);
}

void RequestBuilderImpl::BuildValidateSubjectRequest(const SamlToken& token, Request& request) const {
  request.soapAction = Request::VALIDATE;
  BuilderPtr header = WsSecurityHeaderBuilder(kTimestampMinutes);
  BuilderPtr body = ValidateSecurityTokenBuilder(token);
  request.body = BuildUnSignedRequest(header, body);
}

void RequestBuilderImpl::BuildRenewRequest(const SamlToken& token, long long lifetimeSeconds, Request& request) const {
  ValidateLifetime(lifetimeSeconds);
  ValidateHokIsConfigured(kRenewToken);
  ValidateTokenIsHok(token, kRenewToken);
  VerifyHolderOfKey(token);
  BuilderPtr header = WsSecurityHeaderBuilder(kTimestampMinutes);
  BuilderPtr body = RenewSecurityTokenBuilder(token, lifetimeSeconds);
  request.soapAction = Request::RENEW;
  request.body = BuildCertRefSignedRequest(header, body);
}

SamlToken::ConfirmationType RequestBuilderImpl::GetEffectiveConfirmationType(
    TokenSpec::Confirmation confirmation) const {
  return _holderOfKeyConfig && confirmation == TokenSpec::CONFIRMATION_DEFAULT ? SamlToken::CONFIRM_HOLDER_OF_KEY
                                                                              : SamlToken::CONFIRM_BEARER;
}

std::string RequestBuilderImpl::BuildUnSignedRequest(const BuilderPtr& header, const BuilderPtr& body) const {
  return SerializeToXML(SoapBuilder(header, body));
}

std::string RequestBuilderImpl::BuildCertRefSignedRequest(const BuilderPtr& header, const BuilderPtr& body) const {
  const HolderOfKeyConfig& config = SigningMaterial(true);
  return SerializeToXML(CertRefSignedSoapBuilder(header, body, config.privateKey.get(), config.certificate.get()));
}

std::string RequestBuilderImpl::BuildSamlRefSignedRequest(const std::string& tokenId, const BuilderPtr& header,
                                                          const BuilderPtr& body) const {
  const HolderOfKeyConfig& config = SigningMaterial(false);
  return SerializeToXML(SamlRefSignedSoapBuilder(header, body, config.privateKey.get(), tokenId));
}

std::string RequestBuilderImpl::BuildTokenRequest(TokenSpec::Confirmation confirmation, const BuilderPtr& header,
                                                  const BuilderPtr& body) const {
  return GetEffectiveConfirmationType(confirmation) == SamlToken::CONFIRM_HOLDER_OF_KEY
             ? BuildCertRefSignedRequest(header, body)
             : BuildUnSignedRequest(header, body);
}

void RequestBuilderImpl::ValidateTokenIsHok(const SamlToken& token, const std::string& operation) const {
  if (token.GetConfirmationMethod() != SamlToken::CONFIRM_HOLDER_OF_KEY) {
    throw Tamber::InvalidArgumentException("Unable to " + operation + ": the provided token must be Holder Of Key");
  }
}

void RequestBuilderImpl::ValidateHokIsConfigured(const std::string& operation) const {
  if (!_holderOfKeyConfig) {
    throw Tamber::InvalidStateException("No HolderOfKeyConfig provided. Unable to " + operation);
  }
}

const HolderOfKeyConfig& RequestBuilderImpl::SigningMaterial(bool needsCertificate) const {
  TAMBER_VERIFY_TEXT(_holderOfKeyConfig.is_initialized(), "_holderOfKeyConfig.is_initialized()");
  // The configuration is taken as given when the service is made; a record with a missing half
  // is refused here rather than signed with.
  if (!_holderOfKeyConfig->privateKey) {
    throw Tamber::InvalidStateException("HolderOfKeyConfig has no privateKey. Unable to sign the request");
  }
  if (needsCertificate && !_holderOfKeyConfig->certificate) {
    throw Tamber::InvalidStateException("HolderOfKeyConfig has no certificate. Unable to sign the request");
  }
  return *_holderOfKeyConfig;
}

void ValidateLifetime(long long lifetimeSeconds) {
  if (lifetimeSeconds <= 0) {
    throw Tamber::InvalidArgumentException("Token lifetime must be positive");
  }
}

TokenSpec::Confirmation ConfOverrideWithDelegate(const TokenSpec& spec) {
  return spec.delegateTo ? TokenSpec::CONFIRMATION_BEARER : spec.confirmation;
}

}  // namespace SsoClient
