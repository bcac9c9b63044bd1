#include "ssoClient/TokenSpec.h"

#include <memory>

#include <gtest/gtest.h>

namespace SsoClient {
namespace {

TEST(TokenSpecTest, DefaultsAskForPlainTenMinuteToken) {
  const TokenSpec spec;
  EXPECT_EQ(600, spec.tokenLifetimeSec);
  EXPECT_TRUE(spec.audienceRestriction.empty());
  EXPECT_TRUE(spec.advice.empty());
  EXPECT_FALSE(spec.delegable);
  EXPECT_FALSE(spec.delegateTo);
  EXPECT_FALSE(spec.renewable);
  EXPECT_EQ(TokenSpec::CONFIRMATION_DEFAULT, spec.confirmation);
}

// An asynchronous operation keeps a copy while the caller goes on changing its own spec.
TEST(TokenSpecTest, CopyIsDeep) {
  auto original = std::make_unique<TokenSpec>();
  original->audienceRestriction = {"urn:a"};
  original->advice = {Advice{"urn:src", {AdviceAttribute{"urn:role", {"admin"}}}}};
  original->delegateTo = "svc@example.com";
  const TokenSpec copy(*original);

  original->audienceRestriction.insert("urn:b");
  original->advice[0].source = "urn:changed";
  original->advice[0].attributes[0].values[0] = "guest";
  *original->delegateTo = "other@example.com";
  original.reset();

  EXPECT_EQ(std::set<std::string>{"urn:a"}, copy.audienceRestriction);
  ASSERT_EQ(1u, copy.advice.size());
  EXPECT_EQ("urn:src", copy.advice[0].source);
  EXPECT_EQ(std::vector<std::string>{"admin"}, copy.advice[0].attributes[0].values);
  ASSERT_TRUE(copy.delegateTo);
  EXPECT_EQ("svc@example.com", *copy.delegateTo);
}

// Counts the references taken on it.
class CountedKey : public Tamber::Crypto::PrivateKey {
 public:
  std::string GetAlgorithm() const override { return "RSA"; }
  bool Matches(const Tamber::Crypto::Certificate&) const override { return false; }
  void AddRef() const override {
    ++references;
    PrivateKey::AddRef();
  }
  void Release() const override {
    --references;
    PrivateKey::Release();
  }
  static int references;
};
int CountedKey::references = 0;

TEST(HolderOfKeyConfigTest, CopySharesKeyAndAllowsNullCertificate) {
  {
    HolderOfKeyConfig config;
    config.privateKey = new CountedKey;
    EXPECT_EQ(1, CountedKey::references);
    {
      const HolderOfKeyConfig copy(config);
      EXPECT_EQ(config.privateKey, copy.privateKey);
      EXPECT_FALSE(copy.certificate);
      EXPECT_EQ(2, CountedKey::references);
    }
    EXPECT_EQ(1, CountedKey::references);
  }
  EXPECT_EQ(0, CountedKey::references);
}

}  // namespace
}  // namespace SsoClient
