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

Tamber::Ref<const Tamber::Crypto::Certificate> ReadCertificate(const std::string& path) {
  Tamber::Ref<const Tamber::Crypto::Certificate> certificate;
  try {
    Tamber::Crypto::CreateCertificateFromPem(ReadTextFile(path), certificate);
  } catch (const Tamber::Exception& e) {
    throw std::runtime_error("Expected a PEM certificate in " + path + ": " + e.what());
  }
  return certificate;
}

Tamber::Ref<const Tamber::Crypto::PrivateKey> ReadPrivateKey(const std::string& path) {
  Tamber::Ref<const Tamber::Crypto::PrivateKey> key;
  try {
    Tamber::Crypto::CreatePrivateKeyFromPem(ReadTextFile(path), key);
  } catch (const Tamber::Exception& e) {
    throw std::runtime_error("Expected a PEM private key in " + path + ": " + e.what());
  }
  return key;
}

}  // namespace DevSts
