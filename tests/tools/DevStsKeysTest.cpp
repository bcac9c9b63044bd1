// The development STS's key directory and configuration files.

#include <openssl/pem.h>
#include <openssl/x509.h>
#include <openssl/x509v3.h>

#include <fstream>
#include <memory>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "DevSts.h"
#include "KeyDirectory.h"
#include "support/TemporaryDirectory.h"
#include "tamber/crypto/OpenSsl.h"

namespace {

using ::testing::HasSubstr;

using Tamber::Crypto::X509Ptr;

X509Ptr ReadX509(const std::string& path) {
  std::unique_ptr<FILE, int (*)(FILE*)> file(fopen(path.c_str(), "r"), fclose);
  if (!file) return X509Ptr();
  return X509Ptr(PEM_read_X509(file.get(), nullptr, nullptr, nullptr));
}

// Whether `leaf` chains to `ca` for `purpose` (X509_PURPOSE_...).
bool Chains(X509* leaf, X509* ca, int purpose) {
  const Tamber::Crypto::X509StorePtr store(X509_STORE_new());
  const Tamber::Crypto::X509StoreCtxPtr context(X509_STORE_CTX_new());
  X509_STORE_add_cert(store.get(), ca);
  X509_STORE_CTX_init(context.get(), store.get(), leaf, nullptr);
  X509_STORE_CTX_set_purpose(context.get(), purpose);
  return X509_verify_cert(context.get()) == 1;
}

class DevStsKeysTest : public ::testing::Test {
 protected:
  std::string Path(const char* file) const { return DevSts::KeyPath(_directory.GetPath(), file); }

  TestSupport::TemporaryDirectory _directory;
};

TEST_F(DevStsKeysTest, GeneratedIdentitiesChainToTheCaForTheirPurpose) {
  DevSts::GenerateKeys(_directory.GetPath() + "/created/on/demand");
  DevSts::GenerateKeys(_directory.GetPath());
  const X509Ptr ca = ReadX509(Path(DevSts::CA_CERTIFICATE_FILE));
  ASSERT_TRUE(ca);
  const X509Ptr tls = ReadX509(Path(DevSts::TLS_CERTIFICATE_FILE));
  const X509Ptr client = ReadX509(Path(DevSts::CLIENT_CERTIFICATE_FILE));
  const X509Ptr signer = ReadX509(Path(DevSts::SIGNING_CERTIFICATE_FILE));
  ASSERT_TRUE(tls && client && signer);

  EXPECT_TRUE(Chains(tls.get(), ca.get(), X509_PURPOSE_SSL_SERVER));
  EXPECT_TRUE(Chains(client.get(), ca.get(), X509_PURPOSE_SSL_CLIENT));
  EXPECT_FALSE(Chains(client.get(), ca.get(), X509_PURPOSE_SSL_SERVER));
  EXPECT_TRUE(Chains(signer.get(), ca.get(), X509_PURPOSE_ANY));
  EXPECT_EQ(X509_check_host(tls.get(), "localhost", 0, 0, nullptr), 1);
  EXPECT_EQ(X509_check_ip_asc(tls.get(), "127.0.0.1", 0), 1);
  EXPECT_EQ(X509_check_ip_asc(tls.get(), "::1", 0), 1);
  EXPECT_EQ(X509_check_ca(tls.get()), 0);
}

TEST_F(DevStsKeysTest, EachKeyMatchesItsCertificateAndFreshKeysDiffer) {
  DevSts::GenerateKeys(_directory.GetPath());
  const std::pair<const char*, const char*> identities[] = {
      {DevSts::CA_CERTIFICATE_FILE, DevSts::CA_KEY_FILE},
      {DevSts::SIGNING_CERTIFICATE_FILE, DevSts::SIGNING_KEY_FILE},
      {DevSts::TLS_CERTIFICATE_FILE, DevSts::TLS_KEY_FILE},
      {DevSts::CLIENT_CERTIFICATE_FILE, DevSts::CLIENT_KEY_FILE}};
  for (const auto& identity : identities) {
    SCOPED_TRACE(identity.first);
    EXPECT_TRUE(DevSts::ReadPrivateKey(Path(identity.second))->Matches(*DevSts::ReadCertificate(Path(identity.first))));
  }
  const std::string before = DevSts::ReadTextFile(Path(DevSts::SIGNING_KEY_FILE));
  DevSts::GenerateKeys(_directory.GetPath());
  EXPECT_NE(DevSts::ReadTextFile(Path(DevSts::SIGNING_KEY_FILE)), before);
}

class DevStsConfigTest : public DevStsKeysTest {
 protected:
  void SetUp() override { DevSts::GenerateKeys(_directory.GetPath()); }

  std::string WriteConfig(const std::string& json) const {
    const std::string path = _directory.GetPath() + "/users.json";
    std::ofstream(path) << json;
    return path;
  }

  std::string LoadError(const std::string& json) const {
    try {
      DevSts::LoadConfig(WriteConfig(json), _directory.GetPath());
    } catch (const std::runtime_error& e) {
      return e.what();
    }
    return "no error";
  }
};

TEST_F(DevStsConfigTest, DefaultConfigHasTheDemoUsersAndTheClientAsSolution) {
  const DevSts::Config config = DevSts::DefaultConfig(_directory.GetPath());
  ASSERT_EQ(config.users.size(), 2u);
  EXPECT_EQ(config.users[0].name, "alice@example.com");
  EXPECT_EQ(config.users[0].password, "alice-password");
  ASSERT_EQ(config.solutionUsers.size(), 1u);
  EXPECT_EQ(config.solutionUsers[0].certificatePem, DevSts::ReadTextFile(Path(DevSts::CLIENT_CERTIFICATE_FILE)));
}

TEST_F(DevStsConfigTest, LoadConfigReadsUsersSolutionsAndLimits) {
  std::ofstream(_directory.GetPath() + "/other.pem") << DevSts::ReadTextFile(Path(DevSts::TLS_CERTIFICATE_FILE));
  const DevSts::Config config = DevSts::LoadConfig(
      WriteConfig(R"({"users": [{"name": "carol@example.com", "password": "p", "groups": ["example.com\\Ops"]}],
                      "solutionUsers": [{"name": "a@example.com"}, {"name": "b@example.com", "certificate": "other.pem"}],
                      "maxLifetimeSec": 60})"),
      _directory.GetPath());
  ASSERT_EQ(config.users.size(), 1u);
  EXPECT_EQ(config.users[0].groups, std::vector<std::string>({"example.com\\Ops"}));
  EXPECT_EQ(config.users[0].givenName, "");
  ASSERT_EQ(config.solutionUsers.size(), 2u);
  EXPECT_EQ(config.solutionUsers[0].certificatePem, DevSts::ReadTextFile(Path(DevSts::CLIENT_CERTIFICATE_FILE)));
  EXPECT_EQ(config.solutionUsers[1].certificatePem, DevSts::ReadTextFile(Path(DevSts::TLS_CERTIFICATE_FILE)));
  EXPECT_EQ(config.maxLifetimeSec, 60);
  EXPECT_EQ(config.clockToleranceSec, DevSts::Config().clockToleranceSec);
}

TEST_F(DevStsConfigTest, LoadConfigSaysWhatIsWrongWithTheFile) {
  EXPECT_THAT(LoadError("{\"users\": [{\"name\": \"x@example.com\"}]}"),
              ::testing::AllOf(HasSubstr("users.json: "), HasSubstr("'password'")));
  EXPECT_THAT(LoadError("{\"users\": [{\"name\": 7, \"password\": \"p\"}]}"), HasSubstr("must be string"));
  EXPECT_THAT(LoadError("not json"), HasSubstr("parse error"));
  EXPECT_THAT(LoadError("{}"), HasSubstr("expected \"users\" or \"solutionUsers\", found neither"));
  EXPECT_THAT(LoadError("{\"solutionUsers\": [{\"name\": \"s@example.com\", \"certificate\": \"missing.pem\"}]}"),
              HasSubstr("Cannot read "));
}

}  // namespace
