#include "support/TestTokens.h"

#include <fstream>
#include <map>
#include <mutex>
#include <sstream>
#include <stdexcept>

namespace TestSupport {

const char TOKEN_VECTORS_CLOCK[] = "2027-06-01T10:30:00Z";

std::string ReadTestData(const std::string& relativePath) {
  const std::string path = std::string(SSOCLIENT_TEST_DATA_DIR) + "/" + relativePath;
  std::ifstream in(path, std::ios::binary);
  if (!in) throw std::runtime_error("cannot read test data " + path);
  std::ostringstream content;
  content << in.rdbuf();
  return content.str();
}

Tamber::Ref<const Tamber::Crypto::Certificate> LoadTestCertificate(const std::string& name) {
  Tamber::Ref<const Tamber::Crypto::Certificate> certificate;
  Tamber::Crypto::CreateCertificateFromPem(ReadTestData("keys/" + name + ".pem"), certificate);
  return certificate;
}

const TestKeyPair& LoadTestKeyPair(const std::string& name) {
  static std::mutex mutex;
  static std::map<std::string, TestKeyPair> loaded;
  std::lock_guard<std::mutex> lock(mutex);
  auto found = loaded.find(name);
  if (found == loaded.end()) {
    TestKeyPair pair;
    Tamber::Crypto::CreatePrivateKeyFromPem(ReadTestData("keys/" + name + ".key"), pair.key);
    pair.certificate = LoadTestCertificate(name);
    found = loaded.emplace(name, pair).first;
  }
  return found->second;
}

boost::optional<SsoClient::HolderOfKeyConfig> ClientKeyMaterial() {
  SsoClient::HolderOfKeyConfig config;
  config.privateKey = LoadTestKeyPair("client").key;
  config.certificate = LoadTestKeyPair("client").certificate;
  return config;
}

SsoClient::CertificateList TrustedCertificates() { return {LoadTestCertificate("ca")}; }

std::string IssueTestToken(const TokenIssuer::TokenRecord& record, const std::string& signer) {
  const TestKeyPair& pair = LoadTestKeyPair(signer);
  return TokenIssuer::IssueToken(record, *pair.key, *pair.certificate);
}

TokenIssuer::TokenRecord HolderOfKeyRecord() {
  TokenIssuer::TokenRecord record;
  record.confirmation = SsoClient::SamlToken::CONFIRM_HOLDER_OF_KEY;
  record.confirmationCertificate = LoadTestKeyPair("client").certificate;
  return record;
}

}  // namespace TestSupport
