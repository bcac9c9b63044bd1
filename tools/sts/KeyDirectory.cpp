#include "KeyDirectory.h"

#include <fstream>
#include <sstream>
#include <stdexcept>

#include "DevSts.h"
#include "tamber/Exception.h"

namespace DevSts {

const char CA_CERTIFICATE_FILE[] = "ca.pem";
const char CA_KEY_FILE[] = "ca.key";
const char SIGNING_CERTIFICATE_FILE[] = "sts.pem";
const char SIGNING_KEY_FILE[] = "sts.key";
const char TLS_CERTIFICATE_FILE[] = "tls.pem";
const char TLS_KEY_FILE[] = "tls.key";
const char CLIENT_CERTIFICATE_FILE[] = "client.pem";
const char CLIENT_KEY_FILE[] = "client.key";

std::string KeyPath(const std::string& directory, const std::string& fileName) { return directory + "/" + fileName; }

std::string ReadTextFile(const std::string& path) {
  std::ifstream in(path, std::ios::binary);
  std::ostringstream content;
  if (!in || !(content << in.rdbuf())) throw std::runtime_error("Cannot read " + path);
  return content.str();
}

namespace {

// What `create` makes of `pem`; std::runtime_error "`expected`: <reason>" when it fails.
template <class T>
Tamber::Ref<const T> ParsePem(const std::string& pem, const std::string& expected,
                              void (*create)(const std::string&, Tamber::Ref<const T>&)) {
  Tamber::Ref<const T> parsed;
  try {
    create(pem, parsed);
  } catch (const Tamber::Exception& e) {
    throw std::runtime_error(expected + ": " + e.what());
  }
  return parsed;
}

}  // namespace

Tamber::Ref<const Tamber::Crypto::Certificate> ParseCertificatePem(const std::string& pem,
                                                                   const std::string& expected) {
  return ParsePem<Tamber::Crypto::Certificate>(pem, expected, &Tamber::Crypto::CreateCertificateFromPem);
}

Tamber::Ref<const Tamber::Crypto::PrivateKey> ParsePrivateKeyPem(const std::string& pem, const std::string& expected) {
  return ParsePem<Tamber::Crypto::PrivateKey>(pem, expected, &Tamber::Crypto::CreatePrivateKeyFromPem);
}

Tamber::Ref<const Tamber::Crypto::Certificate> ReadCertificate(const std::string& path) {
  return ParseCertificatePem(ReadTextFile(path), "Expected a PEM certificate in " + path);
}

Tamber::Ref<const Tamber::Crypto::PrivateKey> ReadPrivateKey(const std::string& path) {
  return ParsePrivateKeyPem(ReadTextFile(path), "Expected a PEM private key in " + path);
}

}  // namespace DevSts
