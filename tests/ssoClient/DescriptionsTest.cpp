#include "ssoClient/Descriptions.h"

#include <gtest/gtest.h>

namespace SsoClient {
namespace {

using Tamber::System::DateTime;

// A token whose facts are set by the test. Its id, audience, advice, certificate and XML carry
// the word SECRET and count their reads, so that a description leaking them is caught.
class FakeSamlToken : public SamlToken {
 public:
  PrincipalId subject{"alice", "example.com"};
  DateTime start{"2011-07-01T10:00:00Z"};
  DateTime end{"2011-07-01T10:10:00.250Z"};
  bool renewable = false;
  bool delegable = false;
  bool solution = false;
  ConfirmationType confirmation = CONFIRM_BEARER;
  std::vector<PrincipalId> groups;
  std::vector<Delegate> chain;
  mutable int redactedReads = 0;

  const std::string& GetId() const override { return Redacted(_id); }
  const DateTime& GetStartDate() const override { return start; }
  const DateTime& GetEndDate() const override { return end; }
  const PrincipalId& GetSubject() const override { return subject; }
  bool IsRenewable() const override { return renewable; }
  bool IsDelegable() const override { return delegable; }
  bool IsSolution() const override { return solution; }
  ConfirmationType GetConfirmationMethod() const override { return confirmation; }
  void GetFullName(std::pair<std::string, std::string>& fullName) const override {
    fullName = {"SECRET-given", "SECRET-surname"};
  }
  void GetGroups(std::vector<PrincipalId>& out) const override { out = groups; }
  void GetDelegationChain(std::vector<Delegate>& out) const override { out = chain; }
  void GetAudience(std::set<std::string>& audience) const override {
    ++redactedReads;
    audience = {"urn:SECRET-audience"};
  }
  void GetAdvice(std::vector<Advice>& advice) const override {
    ++redactedReads;
    advice = {Advice{"urn:SECRET-advice", {}}};
  }
  const Tamber::Crypto::Certificate* GetConfirmationCertificate() const override {
    ++redactedReads;
    return nullptr;
  }
  const std::string& ToXml() const override { return Redacted(_xml); }

 private:
  const std::string& Redacted(const std::string& value) const {
    ++redactedReads;
    return value;
  }
  std::string _id = "_SECRET-id";
  std::string _xml = "<saml:Assertion>SECRET</saml:Assertion>";
};

TEST(CreateRedactedDescriptionTest, DescribesEveryPublicFact) {
  FakeSamlToken token;
  token.groups = {PrincipalId("Domain Users", "EXAMPLE"), PrincipalId("Admins", "EXAMPLE")};
  token.chain = {Delegate{PrincipalId("svc-a", "example.com"), DateTime("2011-07-01T09:00:00Z")},
                 Delegate{PrincipalId("svc-b", "example.com"), DateTime("2011-07-01T09:30:00.5Z")}};
  token.renewable = true;
  token.solution = true;
  token.confirmation = SamlToken::CONFIRM_HOLDER_OF_KEY;

  EXPECT_EQ(
      "SamlToken [subject={Name: alice; Domain:example.com}, "
      "groups=[{Name: Domain Users; Domain:EXAMPLE}, {Name: Admins; Domain:EXAMPLE}], "
      "delegationChain=[{Name: svc-a; Domain:example.com} at 2011-07-01T09:00:00.000Z, "
      "{Name: svc-b; Domain:example.com} at 2011-07-01T09:30:00.500Z], "
      "startTime=2011-07-01T10:00:00.000Z, expirationTime=2011-07-01T10:10:00.250Z, "
      "renewable=true, delegable=false, isSolution=true,confirmationType=1]",
      CreateRedactedDescription(token));
}

TEST(CreateRedactedDescriptionTest, EmptyListsLeaveEmptyBrackets) {
  FakeSamlToken token;
  token.delegable = true;
  EXPECT_EQ(
      "SamlToken [subject={Name: alice; Domain:example.com}, groups=[], delegationChain=[], "
      "startTime=2011-07-01T10:00:00.000Z, expirationTime=2011-07-01T10:10:00.250Z, "
      "renewable=false, delegable=true, isSolution=false,confirmationType=0]",
      CreateRedactedDescription(token));
}

TEST(CreateRedactedDescriptionTest, NeverReadsRedactedFacts) {
  FakeSamlToken token;
  const std::string description = CreateRedactedDescription(token);
  EXPECT_EQ(0, token.redactedReads);
  EXPECT_EQ(std::string::npos, description.find("SECRET"));
}

TEST(CreateRedactedDescriptionTest, PlaceholdersInValuesAreNotExpanded) {
  FakeSamlToken token;
  token.subject = PrincipalId("%2", "%9");
  EXPECT_EQ(0u,
            CreateRedactedDescription(token).find("SamlToken [subject={Name: %2; Domain:%9}, groups=[], "));
}

TEST(WriteTokenSpecTest, DescribesEveryField) {
  TokenSpec spec;
  spec.tokenLifetimeSec = int64_t{1} << 40;
  spec.audienceRestriction = {"urn:b", "urn:a"};
  spec.advice = {Advice{"urn:src", {AdviceAttribute{"urn:role", {"admin", "ops"}}}}};
  spec.delegable = true;
  spec.delegateTo = "svc-a@example.com";
  spec.renewable = true;
  spec.confirmation = TokenSpec::CONFIRMATION_BEARER;

  EXPECT_EQ(
      "TokenSpec [tokenLifetimeSec=1099511627776, delegable=true, delegateTo=svc-a@example.com, "
      "renewable=true, confirmationType=1,audienceRestriction=urn:a, urn:b, "
      "advice=[Advice [source=urn:src, attributes=[[source=urn:role, attributes=[admin, ops]]]]]",
      WriteTokenSpec(spec));
}

TEST(WriteTokenSpecTest, UnsetFieldsLeaveMarkerAndEmptyPlaces) {
  TokenSpec spec;
  spec.tokenLifetimeSec = -5;
  EXPECT_EQ(
      "TokenSpec [tokenLifetimeSec=-5, delegable=false, delegateTo=<unset>, renewable=false, "
      "confirmationType=0,audienceRestriction=, advice=[]",
      WriteTokenSpec(spec));
}

TEST(WriteTokenSpecTest, EmptyDelegateIsNotUnset) {
  TokenSpec spec;
  spec.delegateTo = std::string();
  spec.confirmation = static_cast<TokenSpec::Confirmation>(7);
  EXPECT_EQ(
      "TokenSpec [tokenLifetimeSec=600, delegable=false, delegateTo=, renewable=false, "
      "confirmationType=7,audienceRestriction=, advice=[]",
      WriteTokenSpec(spec));
}

TEST(WriteDelegateTest, PrincipalAtInstant) {
  const Delegate delegate{PrincipalId("carol", "example"), DateTime("2011-07-01T10:00:00.000123Z")};
  EXPECT_EQ("{Name: carol; Domain:example} at 2011-07-01T10:00:00.000123Z", WriteDelegate(&delegate));
}

TEST(WriteAdviceTest, NestsAttributes) {
  const Advice advice{"urn:src",
                      {AdviceAttribute{"urn:a", {"1"}}, AdviceAttribute{"urn:empty", {}},
                       AdviceAttribute{"urn:b", {"x", "", "y"}}}};
  EXPECT_EQ(
      "Advice [source=urn:src, attributes=[[source=urn:a, attributes=[1]], "
      "[source=urn:empty, attributes=[]], [source=urn:b, attributes=[x, , y]]]]",
      WriteAdvice(&advice));
}

TEST(WriteAdviceAttributeTest, JoinsValues) {
  const AdviceAttribute attribute{"urn:role", {"admin", "ops"}};
  EXPECT_EQ("[source=urn:role, attributes=[admin, ops]]", WriteAdviceAttribute(&attribute));
}

struct AsStringCase {
  const char* label;
  std::vector<std::string> descriptions;
  const char* expected;
};

class AsStringTest : public testing::TestWithParam<AsStringCase> {};

// The writer describes each advice by its source, so the descriptions are under the test's control.
TEST_P(AsStringTest, SeparatesNonEmptyText) {
  const AsStringCase& row = GetParam();
  SCOPED_TRACE(row.label);
  std::vector<Advice> items;
  for (const std::string& description : row.descriptions) items.push_back(Advice{description, {}});
  EXPECT_EQ(row.expected, AsString<Advice>(items, [](const Advice* advice) { return advice->source; }));
}

INSTANTIATE_TEST_SUITE_P(Table, AsStringTest,
                         testing::Values(AsStringCase{"no items", {}, ""},
                                         AsStringCase{"in order", {"a", "b", "c"}, "a, b, c"},
                                         AsStringCase{"first empty", {"", "b"}, "b"},
                                         AsStringCase{"middle empty", {"a", "", "c"}, "a, c"},
                                         AsStringCase{"last empty", {"a", ""}, "a"},
                                         AsStringCase{"all empty", {"", ""}, ""}));

}  // namespace
}  // namespace SsoClient
