#ifndef TESTS_E2E_DEVSTSENVIRONMENT_H
#define TESTS_E2E_DEVSTSENVIRONMENT_H

// A development STS with fresh keys on an ephemeral loopback port, and the configuration of a
// client that trusts it over real HTTPS: the ground of the end-to-end suites.

#include <memory>
#include <string>

#include <gtest/gtest.h>

#include "DevSts.h"
#include "KeyDirectory.h"
#include "ssoClient/SecurityTokenService.h"
#include "support/TemporaryDirectory.h"
#include "tamber/ssl/SSLContext.h"

namespace E2e {

class DevStsEnvironment {
 public:
  DevStsEnvironment() {
    DevSts::GenerateKeys(_keys.GetPath());
    _server.reset(new DevSts::Server(DevSts::DefaultConfig(_keys.GetPath())));
    _server->Start();
    Tamber::Ssl::SSLContextOptions options;
    options.trustedCertificatesPem = DevSts::ReadTextFile(KeyFile(DevSts::CA_CERTIFICATE_FILE));
    Tamber::Ssl::CreateSSLContext(options, _sslContext);
  }

  const std::string& GetKeyDirectory() const { return _keys.GetPath(); }
  std::string KeyFile(const char* fileName) const { return DevSts::KeyPath(_keys.GetPath(), fileName); }
  Tamber::Ref<const Tamber::Crypto::Certificate> Certificate(const char* fileName) const {
    return DevSts::ReadCertificate(KeyFile(fileName));
  }
  SsoClient::HolderOfKeyConfig ClientKeyMaterial() const {
    SsoClient::HolderOfKeyConfig material;
    material.privateKey = DevSts::ReadPrivateKey(KeyFile(DevSts::CLIENT_KEY_FILE));
    material.certificate = Certificate(DevSts::CLIENT_CERTIFICATE_FILE);
    return material;
  }

  // A client of this STS, trusting its CA for TLS and its signing certificate for tokens, with
  // the directory's client identity as holder-of-key material when `holderOfKey`.
  SsoClient::SecurityTokenServiceConfig ServiceConfig(bool holderOfKey = true) const {
    SsoClient::SecurityTokenServiceConfig config;
    config.stsUrl = _server->GetUrl();
    config.trustedCertificates.push_back(Certificate(DevSts::SIGNING_CERTIFICATE_FILE));
    config.sslContext = _sslContext.get();
    if (holderOfKey) config.holderOfKeyConfig = ClientKeyMaterial();
    return config;
  }

  const DevSts::Server& GetServer() const { return *_server; }

 private:
  TestSupport::TemporaryDirectory _keys;
  std::unique_ptr<DevSts::Server> _server;
  Tamber::Ref<Tamber::Ssl::SSLContext> _sslContext;
};

// Suites against one STS per suite: key generation is too slow to repeat per test.
class DevStsTest : public ::testing::Test {
 protected:
  static void SetUpTestSuite() { environment = new DevStsEnvironment(); }
  static void TearDownTestSuite() {
    delete environment;
    environment = nullptr;
  }

  static boost::shared_ptr<SsoClient::SecurityTokenService> Service(bool holderOfKey = true) {
    return SsoClient::CreateSecurityTokenService(environment->ServiceConfig(holderOfKey));
  }

  static inline DevStsEnvironment* environment = nullptr;
};

}  // namespace E2e

#endif
