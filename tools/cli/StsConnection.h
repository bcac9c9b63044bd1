#ifndef TOOLS_CLI_STSCONNECTION_H
#define TOOLS_CLI_STSCONNECTION_H

// The library's service for the STS named by the common options, with the TLS trust, the
// trusted token signers and, with --dump-soap, the relay that shows the traffic.

#include <boost/optional.hpp>
#include <boost/shared_ptr.hpp>
#include <memory>
#include <string>

#include "CommonOptions.h"
#include "SoapDumpRelay.h"
#include "ssoClient/SamlToken.h"
#include "ssoClient/SecurityTokenService.h"
#include "tamber/Ref.h"
#include "tamber/ssl/SSLContext.h"

namespace Cli {

class StsConnection {
 public:
  // Requires --sts and at least one --sts-cert.
  StsConnection(const CommonOptions& options, const boost::optional<SsoClient::HolderOfKeyConfig>& holderOfKey);

  const SsoClient::SecurityTokenService& Service() const { return *_service; }
  const SsoClient::CertificateList& TrustedCertificates() const { return _trustedCertificates; }
  // The token of a file, validated against the trusted signing certificates.
  boost::shared_ptr<const SsoClient::SamlToken> LoadToken(const std::string& path) const;

 private:
  Tamber::Ref<Tamber::Ssl::SSLContext> _sslContext;
  SsoClient::CertificateList _trustedCertificates;
  std::unique_ptr<SoapDumpRelay> _relay;
  boost::shared_ptr<SsoClient::SecurityTokenService> _service;
};

}  // namespace Cli

#endif
