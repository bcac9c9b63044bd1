#include "tamber/ssl/SSLContext.h"

#include <string>

#include <gtest/gtest.h>

#include "tamber/Exception.h"
#include "tamber/crypto/TestKeys.h"

namespace Tamber {
namespace Ssl {
namespace {

Ref<SSLContext> Create(const SSLContextOptions& options) {
  Ref<SSLContext> context;
  CreateSSLContext(options, context);
  return context;
}

TEST(CreateSSLContext, VerifiesPeerAndHostNameByDefaultWithTheSystemStore) {
  Ref<SSLContext> context = Create(SSLContextOptions());
  EXPECT_TRUE(context->VerifiesPeer());
  EXPECT_TRUE(context->VerifiesHostName());
  EXPECT_TRUE(context->GetTrustedCertificates().empty());
  EXPECT_EQ(nullptr, context->GetClientCertificate());
}

TEST(CreateSSLContext, TrustsThePemCertificatesThenTheListedOnes) {
  SSLContextOptions options;
  options.trustedCertificatesPem = TestKeys::ReadDataFile("keys/ca.pem") + TestKeys::ReadDataFile("keys/sts.pem");
  options.trustedCertificates.push_back(TestKeys::Certificate("untrusted"));
  Ref<SSLContext> context = Create(options);
  ASSERT_EQ(3u, context->GetTrustedCertificates().size());
  EXPECT_EQ("CN=Test CA,O=SsoClient Tests", context->GetTrustedCertificates()[0]->GetSubjectName());
  EXPECT_EQ("CN=Test STS Signer,O=SsoClient Tests", context->GetTrustedCertificates()[1]->GetSubjectName());
  EXPECT_EQ("CN=Untrusted Signer,O=Somebody Else", context->GetTrustedCertificates()[2]->GetSubjectName());
}

TEST(CreateSSLContext, KeepsTheClientIdentity) {
  SSLContextOptions options;
  options.clientCertificate = TestKeys::Certificate("client");
  options.clientKey = TestKeys::PrivateKey("client");
  Ref<SSLContext> context = Create(options);
  EXPECT_EQ(options.clientCertificate.get(), context->GetClientCertificate());
}

TEST(CreateSSLContext, RefusesPemWithoutCertificate) {
  SSLContextOptions options;
  options.trustedCertificatesPem = "no certificate here";
  EXPECT_THROW(Create(options), Crypto::CryptoException);
}

struct BadOptions {
  const char* what;
  SSLContextOptions options;
  std::string message;
};

class CreateSSLContextRefuses : public testing::TestWithParam<BadOptions> {};

TEST_P(CreateSSLContextRefuses, WithInvalidArgument) {
  SCOPED_TRACE(GetParam().what);
  try {
    Create(GetParam().options);
    FAIL() << "accepted";
  } catch (const InvalidArgumentException& e) {
    EXPECT_EQ("Invalid argument : " + GetParam().message, e.what());
  }
}

std::vector<BadOptions> BadOptionRows() {
  std::vector<BadOptions> rows;
  BadOptions nullCertificate{"null trusted certificate", {}, "The trusted certificates of an SSL context must not be null"};
  nullCertificate.options.trustedCertificates.push_back(nullptr);
  rows.push_back(nullCertificate);
  BadOptions certificateOnly{"certificate without key", {},
                             "A client certificate for TLS needs its private key, and a key its certificate"};
  certificateOnly.options.clientCertificate = TestKeys::Certificate("client");
  rows.push_back(certificateOnly);
  BadOptions keyOnly{"key without certificate", {},
                     "A client certificate for TLS needs its private key, and a key its certificate"};
  keyOnly.options.clientKey = TestKeys::PrivateKey("client");
  rows.push_back(keyOnly);
  BadOptions mismatch{"key of another certificate", {},
                      "The client private key does not match the client certificate \"CN=Test Holder-of-Key "
                      "Client,O=SsoClient Tests\""};
  mismatch.options.clientCertificate = TestKeys::Certificate("client");
  mismatch.options.clientKey = TestKeys::PrivateKey("sts");
  rows.push_back(mismatch);
  return rows;
}

INSTANTIATE_TEST_SUITE_P(Options, CreateSSLContextRefuses, testing::ValuesIn(BadOptionRows()));

}  // namespace
}  // namespace Ssl
}  // namespace Tamber
