// A program outside the project built against the installed package: it reads a certificate
// through the core layer and has the library reject a token, catching the library's own class,
// which only works when the exported types and their type information cross the shared-library
// boundary intact.
#include <fstream>
#include <iostream>
#include <sstream>

#include <ssoClient/ssoClient.h>
#include <tamber/tamber.h>

int main(int argc, char** argv) {
  if (argc != 2) {
    std::cerr << "usage: Consumer CERTIFICATE_PEM\n";
    return 2;
  }
  std::ifstream in(argv[1]);
  std::ostringstream pem;
  pem << in.rdbuf();
  Tamber::Ref<const Tamber::Crypto::Certificate> certificate;
  Tamber::Crypto::CreateCertificateFromPem(pem.str(), certificate);
  try {
    SsoClient::CreateSamlToken("<NotAnAssertion/>", SsoClient::CertificateList{certificate});
  } catch (const SsoClient::InvalidTokenException& e) {
    std::cout << "rejected as expected: " << e.what() << "\n";
    return 0;
  }
  std::cerr << "an element that is no assertion was accepted\n";
  return 1;
}
