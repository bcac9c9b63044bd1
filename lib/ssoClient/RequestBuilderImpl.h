#ifndef SSOCLIENT_REQUESTBUILDERIMPL_H
#define SSOCLIENT_REQUESTBUILDERIMPL_H

#include <string>
#include <vector>

#include <boost/optional.hpp>

#include "ssoClient/Request.h"
#include "ssoClient/SamlToken.h"
#include "ssoClient/TokenSpec.h"
#include "ssoClient/xmlCommonBuilders.h"

namespace SsoClient {

// Builds every request of the token service and decides how it is signed: not at all, with the
// holder-of-key key referencing its certificate, or with that key referencing a presented
// holder-of-key token. Immutable; every operation may run on several threads at once.
class RequestBuilderImpl final : public RequestBuilder {
 public:
  explicit RequestBuilderImpl(const boost::optional<HolderOfKeyConfig>& holderOfKeyConfig);

  void BuildUserPassTokenRequest(const std::string& userName, const std::string& password, const TokenSpec& spec,
                                 Request& request) const override;
  void BuildInitialSPNegoRequest(const TokenSpec& spec, const std::vector<unsigned char>& leg,
                                 Request& request) const override;
  void BuildContinuedSPNegoRequest(const std::string& contextId, const std::vector<unsigned char>& leg,
                                   Request& request) const override;
  void BuildCertificateTokenRequest(const TokenSpec& spec, Request& request) const override;
  void BuildExchangeTokenRequest(const SamlToken& token, const TokenSpec& spec, Request& request) const override;
  void BuildValidateSubjectRequest(const SamlToken& token, Request& request) const override;
  void BuildRenewRequest(const SamlToken& token, long long lifetimeSeconds, Request& request) const override;

 private:
  // Holder-of-key when key material is configured and the default confirmation is asked for.
  SamlToken::ConfirmationType GetEffectiveConfirmationType(TokenSpec::Confirmation confirmation) const;
  std::string BuildUnSignedRequest(const BuilderPtr& header, const BuilderPtr& body) const;
  std::string BuildCertRefSignedRequest(const BuilderPtr& header, const BuilderPtr& body) const;
  std::string BuildSamlRefSignedRequest(const std::string& tokenId, const BuilderPtr& header,
                                        const BuilderPtr& body) const;
  // Signed with the certificate reference when the effective confirmation is holder-of-key.
  std::string BuildTokenRequest(TokenSpec::Confirmation confirmation, const BuilderPtr& header,
                                const BuilderPtr& body) const;
  void ValidateTokenIsHok(const SamlToken& token, const std::string& operation) const;
  void ValidateHokIsConfigured(const std::string& operation) const;
  // The configured private key; raises Tamber::InvalidStateException when the configuration
  // lacks it (or, with `needsCertificate`, lacks the certificate).
  const HolderOfKeyConfig& SigningMaterial(bool needsCertificate) const;

  boost::optional<HolderOfKeyConfig> _holderOfKeyConfig;
};

// Raises Tamber::InvalidArgumentException unless `lifetimeSeconds` is positive.
void ValidateLifetime(long long lifetimeSeconds);
// Bearer when a delegate is named (a delegated request is never signed), else `spec.confirmation`.
TokenSpec::Confirmation ConfOverrideWithDelegate(const TokenSpec& spec);

}  // namespace SsoClient

#endif
