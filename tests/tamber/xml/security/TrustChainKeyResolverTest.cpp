#include "tamber/xml/security/TrustChainKeyResolver.h"

#include <gtest/gtest.h>

#include <string>
#include <thread>
#include <vector>

#include "support/FixedClock.h"
#include "tamber/crypto/TestKeys.h"
#include "tamber/xml/security/SignatureTestSupport.h"

namespace Tamber {
namespace Xml {
namespace Security {
namespace {

using Certificates = std::vector<Ref<const Crypto::Certificate>>;

Certificates Presented(const std::vector<std::string>& names) {
  Certificates certificates;
  for (const std::string& name : names) certificates.push_back(TestKeys::Certificate(name));
  return certificates;
}

// Subjects' common names of the selected certificates, for readable expectations.
std::vector<std::string> Select(const std::vector<std::string>& trusted, const std::vector<std::string>& presented) {
  TrustChainKeyResolverImpl resolver(SignatureTest::Trusting(trusted));
  std::vector<std::string> names;
  for (const Ref<const Crypto::Certificate>& certificate : resolver.SelectCertificates(Presented(presented))) {
    names.push_back(certificate->GetSubjectName());
  }
  return names;
}

const std::string kSts = "CN=Test STS Signer,O=SsoClient Tests";
const std::string kExpired = "CN=Expired STS Signer,O=SsoClient Tests";
const std::string kCa = "CN=Test CA,O=SsoClient Tests";
const std::string kClient = "CN=Test Holder-of-Key Client,O=SsoClient Tests";
using Names = std::vector<std::string>;

struct Case {
  const char* name;
  Names trusted;
  Names presented;
  Names selected;
};

class SelectionTest : public testing::TestWithParam<Case> {};

TEST_P(SelectionTest, SelectsTheAcceptedKeys) {
  SCOPED_TRACE(GetParam().name);
  EXPECT_EQ(GetParam().selected, Select(GetParam().trusted, GetParam().presented));
}

INSTANTIATE_TEST_SUITE_P(
    Table, SelectionTest,
    testing::Values(Case{"listed itself", {"sts"}, {"sts"}, {kSts}},
                    Case{"chains to the listed CA", {"ca"}, {"sts"}, {kSts}},
                    Case{"chains to the second listed", {"client", "ca"}, {"sts"}, {kSts}},
                    Case{"self-signed stranger", {"ca"}, {"untrusted"}, {}},
                    Case{"sibling is no anchor", {"client"}, {"sts"}, {}},
                    Case{"expired, chained", {"ca"}, {"expired-sts"}, {}},
                    Case{"expired, listed", {"expired-sts"}, {"expired-sts"}, {kExpired}},
                    Case{"empty list", {}, {"sts"}, {}},
                    Case{"empty list, no KeyInfo", {}, {}, {}},
                    Case{"no KeyInfo: every listed", {"ca", "sts", "ca"}, {}, {kCa, kSts}},
                    Case{"only the trusted of several", {"ca"}, {"untrusted", "sts"}, {kSts}}),
    [](const testing::TestParamInfo<Case>& info) { return "Row" + std::to_string(info.index); });

TEST(TrustChainKeyResolverTest, ChecksTheChainsDatesAgainstTheClockOnEveryUse) {
  // The verdict is cached after the first use; the dates still follow the clock.
  EXPECT_EQ(Names(), Select({"ca"}, {"expired-sts"}));
  {
    TestSupport::FixedClock clock("2001-06-01T00:00:00Z");
    EXPECT_EQ(Names(), Select({"ca"}, {"expired-sts"}));  // the CA itself was not valid yet
  }
  Certificates ca = Presented({"ca"});
  TestSupport::FixedClock clock(ca[0]->GetNotAfter());
  EXPECT_EQ(Names{kSts}, Select({"ca"}, {"sts"}));
  clock.AdvanceSeconds(1);
  EXPECT_EQ(Names(), Select({"ca"}, {"sts"}));  // the anchor has just expired
  clock.Set(Presented({"sts"})[0]->GetNotBefore().GetUtcTime() - 1000000);
  EXPECT_EQ(Names(), Select({"ca"}, {"sts"}));
  clock.AdvanceSeconds(1);
  EXPECT_EQ(Names{kSts}, Select({"ca"}, {"sts"}));
}

TEST(TrustChainKeyResolverTest, VerdictsAreKeptPerTrustedList) {
  EXPECT_EQ(Names{kSts}, Select({"ca"}, {"sts"}));
  EXPECT_EQ(Names(), Select({"client"}, {"sts"}));
  EXPECT_EQ(Names{kSts}, Select({"ca", "client"}, {"sts"}));
  EXPECT_EQ(Names{kSts}, Select({"client", "ca"}, {"sts"}));
}

TEST(TrustChainKeyResolverTest, OneResolverServesManyThreads) {
  TrustChainKeyResolverImpl resolver(SignatureTest::Trusting({"ca"}));
  Certificates trusted = Presented({"sts"});
  Certificates stranger = Presented({"untrusted"});
  std::vector<std::thread> threads;
  std::vector<int> accepted(4, 0);
  for (int t = 0; t < 4; ++t) {
    threads.emplace_back([&, t] {
      for (int i = 0; i < 50; ++i) {
        accepted[t] += static_cast<int>(resolver.SelectCertificates(trusted).size());
        accepted[t] += static_cast<int>(resolver.SelectCertificates(stranger).size());
      }
    });
  }
  for (std::thread& thread : threads) thread.join();
  EXPECT_EQ(std::vector<int>(4, 50), accepted);
}

TEST(TrustChainKeyResolverTest, RefusesANullCertificate) {
  std::list<Ref<const Crypto::Certificate>> list{TestKeys::Certificate("ca"), nullptr};
  Ref<KeyInfoResolver> resolver;
  EXPECT_THROW(CreateTrustChainKeyResolver(list, resolver), InvalidArgumentException);
  EXPECT_FALSE(resolver);
}

}  // namespace
}  // namespace Security
}  // namespace Xml
}  // namespace Tamber
