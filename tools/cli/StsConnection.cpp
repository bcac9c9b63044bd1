#include "StsConnection.h"

#include <iostream>

#include "ExitCodes.h"
#include "InputFiles.h"

namespace Cli {

StsConnection::StsConnection(const CommonOptions& options,
                             const boost::optional<SsoClient::HolderOfKeyConfig>& holderOfKey) {
  if (options.stsUrl.empty()) throw CliError("UsageError", EXIT_CODE_USAGE, "expected --sts URL, found none");
  if (options.stsCertificateFiles.empty()) {
    throw CliError("UsageError", EXIT_CODE_USAGE,
                   "expected --sts-cert FILE (the STS's token signing certificate), found none");
  }
  _trustedCertificates = LoadCertificates(options.stsCertificateFiles);

  Tamber::Ssl::SSLContextOptions sslOptions;
  if (!options.caFile.empty()) {
    const SsoClient::CertificateList anchors = LoadCertificates({options.caFile});
    sslOptions.trustedCertificates.assign(anchors.begin(), anchors.end());
  }
  Tamber::Ssl::CreateSSLContext(sslOptions, _sslContext);

  SsoClient::SecurityTokenServiceConfig config;
  config.stsUrl = options.stsUrl;
  config.trustedCertificates = _trustedCertificates;
  config.sslParameter = options.pin;
  config.holderOfKeyConfig = holderOfKey;
  config.sslContext = _sslContext.get();
  if (options.dumpSoap) {
    const int64_t timeoutMicros = static_cast<int64_t>(options.Timeout().count()) * 1000;
    _relay.reset(new SoapDumpRelay(options.stsUrl, _sslContext.get(), options.pin, timeoutMicros, std::cerr));
    config.stsUrl = _relay->GetUrl();
  }
  _service = SsoClient::CreateSecurityTokenService(config);
}

boost::shared_ptr<const SsoClient::SamlToken> StsConnection::LoadToken(const std::string& path) const {
  return SsoClient::CreateSamlToken(ReadTextFile(path), _trustedCertificates);
}

}  // namespace Cli
