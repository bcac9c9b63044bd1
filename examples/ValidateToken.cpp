// A relying party's check of a token handed to it: parses the assertion, validates it against
// the STS's signing certificates (or the CA that issued them) and prints what it says.
// Usage: ValidateToken TOKEN_XML TRUSTED_CERTS_PEM
#include <iostream>

#include <ssoClient/ssoClient.h>
#include <tamber/tamber.h>

#include "ReadFile.h"

int main(int argc, char** argv) {
  if (argc != 3) {
    std::cerr << "usage: ValidateToken TOKEN_XML TRUSTED_CERTS_PEM\n";
    return 2;
  }
  try {
    std::vector<Tamber::Ref<const Tamber::Crypto::Certificate>> certificates;
    Tamber::Crypto::CreateCertificatesFromPem(ReadFile(argv[2]), certificates);
    SsoClient::CertificateList trusted(certificates.begin(), certificates.end());

    auto token = SsoClient::CreateSamlToken(ReadFile(argv[1]), trusted);  // 600 s clock tolerance
    std::cout << "subject: " << token->GetSubject().ToString() << "\n"
              << "valid: " << token->GetStartDate().ToString() << " to " << token->GetEndDate().ToString() << "\n"
              << "confirmation: "
              << (token->GetConfirmationMethod() == SsoClient::SamlToken::CONFIRM_BEARER ? "bearer" : "holder-of-key")
              << "\n";
    std::vector<SsoClient::PrincipalId> groups;
    token->GetGroups(groups);
    for (const auto& group : groups) std::cout << "group: " << group.ToString() << "\n";
    return 0;
  } catch (const SsoClient::InvalidTokenException& e) {
    std::cerr << "token rejected: " << e.what() << "\n";
    return 4;
  } catch (const std::exception& e) {
    std::cerr << "failed: " << e.what() << "\n";
    return 1;
  }
}
