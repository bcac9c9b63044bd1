// Acquires a token for a user from an STS and writes its XML to standard output.
// Usage: AcquireToken STS_URL TLS_CA_PEM STS_SIGNING_CERT_PEM USER  (password on standard input)
#include <iostream>

#include <ssoClient/ssoClient.h>
#include <tamber/tamber.h>

#include "ReadFile.h"

int main(int argc, char** argv) {
  if (argc != 5) {
    std::cerr << "usage: AcquireToken STS_URL TLS_CA_PEM STS_SIGNING_CERT_PEM USER < PASSWORD\n";
    return 2;
  }
  try {
    Tamber::Ssl::SSLContextOptions tls;  // trust only the given CA for the STS's TLS certificate
    tls.trustedCertificatesPem = ReadFile(argv[2]);
    Tamber::Ref<Tamber::Ssl::SSLContext> sslContext;
    Tamber::Ssl::CreateSSLContext(tls, sslContext);
    Tamber::Ref<const Tamber::Crypto::Certificate> stsCertificate;
    Tamber::Crypto::CreateCertificateFromPem(ReadFile(argv[3]), stsCertificate);

    SsoClient::SecurityTokenServiceConfig config;
    config.stsUrl = argv[1];
    config.trustedCertificates.push_back(stsCertificate);
    config.sslContext = sslContext.get();
    auto sts = SsoClient::CreateSecurityTokenService(config);

    std::string password;
    std::getline(std::cin, password);
    SsoClient::TokenSpec spec;  // a ten-minute bearer token: no key material is configured
    auto token = sts->AcquireToken(argv[4], password, spec);
    std::cout << token->ToXml() << std::endl;
    return 0;
  } catch (const SsoClient::InvalidCredentialsException& e) {
    std::cerr << "wrong user name or password: " << e.what() << "\n";
    return 3;
  } catch (const std::exception& e) {
    std::cerr << "failed: " << e.what() << "\n";
    return 1;
  }
}
