#include "ssoClient/SamlTokenAttributes.h"

#include <gtest/gtest.h>

#include "ssoClient/Exceptions.h"
#include "ssoClient/SamlConstants.h"
#include "support/FixedClock.h"
#include "support/TestTokens.h"

namespace SsoClient {
namespace {

using TokenIssuer::AttributeRecord;
using TokenIssuer::TokenRecord;

// ---- Subject name identifiers ----------------------------------------------------------------

struct NameIdCase {
  const char* label;
  NameIDType nameId;
  const char* name;  // null: rejected with `message`
  const char* domain;
  std::string message;
};

class NameIdTest : public ::testing::TestWithParam<NameIdCase> {};

TEST_P(NameIdTest, SplitsAtTheLastAtSign) {
  const NameIdCase& c = GetParam();
  SCOPED_TRACE(c.label);
  if (c.name != nullptr) {
    const PrincipalId principal = ParseSamlNameId(c.nameId);
    EXPECT_EQ(c.name, principal.name);
    EXPECT_EQ(c.domain, principal.domain);
    return;
  }
  try {
    ParseSamlNameId(c.nameId);
    FAIL();
  } catch (const ParseException& e) {
    EXPECT_EQ(c.message, e.what());
  }
}

const std::string UPN = Saml::UPN_FORMAT;

INSTANTIATE_TEST_SUITE_P(
    Values, NameIdTest,
    ::testing::Values(
        NameIdCase{"plain", {UPN, "alice@example.com"}, "alice", "example.com", ""},
        NameIdCase{"two at signs", {UPN, "a@b@example.com"}, "a@b", "example.com", ""},
        NameIdCase{"unspecified format",
                   {"urn:oasis:names:tc:SAML:1.1:nameid-format:unspecified", "alice@example.com"},
                   nullptr,
                   nullptr,
                   "Invalid or unsupported NameId format 'urn:oasis:names:tc:SAML:1.1:nameid-format:unspecified'"},
        NameIdCase{"e-mail format",
                   {"urn:oasis:names:tc:SAML:1.1:nameid-format:emailAddress", "alice@example.com"},
                   nullptr,
                   nullptr,
                   "Invalid or unsupported NameId format 'urn:oasis:names:tc:SAML:1.1:nameid-format:emailAddress'"},
        NameIdCase{"format in another case", {"http://schemas.xmlsoap.org/claims/upn", "a@b"}, nullptr, nullptr,
                   "Invalid or unsupported NameId format 'http://schemas.xmlsoap.org/claims/upn'"},
        NameIdCase{"no at sign", {UPN, "alice"}, nullptr, nullptr,
                   "Failed to parse the UPN NameID: `alice'; name or domain part is missing."},
        NameIdCase{"no name", {UPN, "@example.com"}, nullptr, nullptr,
                   "Failed to parse the UPN NameID: `@example.com'; name or domain part is missing."},
        NameIdCase{"no domain", {UPN, "alice@"}, nullptr, nullptr,
                   "Failed to parse the UPN NameID: `alice@'; name or domain part is missing."},
        NameIdCase{"empty", {UPN, ""}, nullptr, nullptr,
                   "Failed to parse the UPN NameID: `'; name or domain part is missing."}),
    [](const ::testing::TestParamInfo<NameIdCase>& info) { return "Case" + std::to_string(info.index); });

TEST(DelegateTest, TakesPrincipalAndInstant) {
  const Tamber::System::DateTime instant("2027-06-01T09:00:00Z");
  const Delegate delegate = ParseToDelegate(DelegateType{instant, {UPN, "svc@example.com"}});
  EXPECT_EQ(PrincipalId("svc", "example.com"), delegate.principal);
  EXPECT_EQ(instant, delegate.delegationInstant);
}

// ---- Attribute predicates and values ---------------------------------------------------------

AttributeType Attribute(const std::string& name, const std::vector<std::string>& values) {
  return AttributeType{name, "urn:oasis:names:tc:SAML:2.0:attrname-format:uri", "", values};
}

TEST(AttributePredicatesTest, EachNamesExactlyItsUri) {
  const AttributeType groups = Attribute(Saml::ATTRIBUTE_GROUP_IDENTITY, {});
  const AttributeType solution = Attribute(Saml::ATTRIBUTE_IS_SOLUTION, {});
  const AttributeType given = Attribute(Saml::ATTRIBUTE_GIVEN_NAME, {});
  const AttributeType surname = Attribute(Saml::ATTRIBUTE_SURNAME, {});
  EXPECT_TRUE(SamlAttributeIsGroupIdentity(groups));
  EXPECT_TRUE(SamlAttributeIsSolution(solution));
  EXPECT_TRUE(SamlAttributeIsGivenName(given));
  EXPECT_TRUE(SamlAttributeIsSurName(surname));
  EXPECT_FALSE(SamlAttributeIsGroupIdentity(solution));
  EXPECT_FALSE(SamlAttributeIsSolution(given));
  EXPECT_FALSE(SamlAttributeIsGivenName(surname));
  EXPECT_FALSE(SamlAttributeIsSurName(groups));
  EXPECT_FALSE(SamlAttributeIsGivenName(Attribute("HTTP://schemas.xmlsoap.org/ws/2005/05/identity/claims/givenname", {})));
}

TEST(PrincipalNameAttributeTest, TakesTheFirstValueOrNothing) {
  EXPECT_EQ("", ParsePrincipalNameAttribute(Attribute(Saml::ATTRIBUTE_GIVEN_NAME, {})));
  EXPECT_EQ("Alice", ParsePrincipalNameAttribute(Attribute(Saml::ATTRIBUTE_GIVEN_NAME, {"Alice", "Bob"})));
}

struct SolutionCase {
  std::vector<std::string> values;
  bool expected;
  const char* message;  // null: accepted
};

class IsSolutionAttributeTest : public ::testing::TestWithParam<SolutionCase> {};

TEST_P(IsSolutionAttributeTest, ReadsExactlyOneWord) {
  const SolutionCase& c = GetParam();
  const AttributeType attribute = Attribute(Saml::ATTRIBUTE_IS_SOLUTION, c.values);
  if (c.message == nullptr) {
    EXPECT_EQ(c.expected, ParseIsSolutionAttribute(attribute));
    return;
  }
  try {
    ParseIsSolutionAttribute(attribute);
    FAIL();
  } catch (const ParseException& e) {
    EXPECT_STREQ(c.message, e.what());
  }
}

INSTANTIATE_TEST_SUITE_P(
    Values, IsSolutionAttributeTest,
    ::testing::Values(SolutionCase{{"true"}, true, nullptr}, SolutionCase{{"TRUE"}, true, nullptr},
                      SolutionCase{{"True"}, true, nullptr}, SolutionCase{{"1"}, false, nullptr},
                      SolutionCase{{"false"}, false, nullptr}, SolutionCase{{" true"}, false, nullptr},
                      SolutionCase{{""}, false, nullptr},
                      SolutionCase{{}, false, "No value found for attribute isSolution."},
                      SolutionCase{{"true", "true"}, false, "More than one value found for attribute isSolution."}));

// ---- What a token's attributes give ----------------------------------------------------------

class TokenAttributesTest : public ::testing::Test {
 protected:
  static boost::shared_ptr<const SamlToken> Token(const TokenRecord& record) {
    return CreateSamlToken(TestSupport::IssueTestToken(record), TestSupport::TrustedCertificates());
  }

  TestSupport::FixedClock _clock{"2027-06-01T10:00:00Z"};
};

TEST_F(TokenAttributesTest, NoAttributesGiveEmptyNamesNoGroupsAndNoSolution) {
  const auto token = Token(TokenRecord());
  std::pair<std::string, std::string> fullName("x", "y");
  token->GetFullName(fullName);
  EXPECT_EQ(std::make_pair(std::string(), std::string()), fullName);
  std::vector<PrincipalId> groups{PrincipalId("stale", "entry")};
  token->GetGroups(groups);
  EXPECT_TRUE(groups.empty());
  EXPECT_FALSE(token->IsSolution());
}

TEST_F(TokenAttributesTest, GroupsAccumulateInOrderAndTheLastNameAttributeWins) {
  TokenRecord record;
  record.groups = {"EXAMPLE\\Users", "EXAMPLE\\A\\B"};
  record.givenName = "First";
  record.surname = "Surname";
  record.isSolution = false;
  record.otherAttributes = {AttributeRecord{Saml::ATTRIBUTE_GROUP_IDENTITY, {"OTHER\\Admins"}},
                            AttributeRecord{Saml::ATTRIBUTE_GIVEN_NAME, {"Second"}},
                            AttributeRecord{Saml::ATTRIBUTE_IS_SOLUTION, {"TRUE"}},
                            AttributeRecord{Saml::ATTRIBUTE_GROUP_IDENTITY, {}},
                            AttributeRecord{"urn:example:ignored", {"x", "y"}}};
  const auto token = Token(record);
  std::vector<PrincipalId> groups;
  token->GetGroups(groups);
  ASSERT_EQ(3u, groups.size());
  EXPECT_EQ("Users", groups[0].name);
  EXPECT_EQ("EXAMPLE", groups[0].domain);
  EXPECT_EQ("A\\B", groups[1].name);
  EXPECT_EQ("Admins", groups[2].name);
  EXPECT_EQ("OTHER", groups[2].domain);
  std::pair<std::string, std::string> fullName;
  token->GetFullName(fullName);
  EXPECT_EQ(std::make_pair(std::string("Second"), std::string("Surname")), fullName);
  EXPECT_TRUE(token->IsSolution());
}

struct RejectedAttributeCase {
  const char* label;
  AttributeRecord attribute;
  const char* message;
};

class RejectedTokenAttributeTest : public TokenAttributesTest,
                                   public ::testing::WithParamInterface<RejectedAttributeCase> {};

TEST_P(RejectedTokenAttributeTest, TokenIsRefused) {
  const RejectedAttributeCase& c = GetParam();
  SCOPED_TRACE(c.label);
  TokenRecord record;
  record.otherAttributes = {c.attribute};
  try {
    Token(record);
    FAIL();
  } catch (const ParseException& e) {
    EXPECT_STREQ(c.message, e.what());
  }
}

INSTANTIATE_TEST_SUITE_P(
    Values, RejectedTokenAttributeTest,
    ::testing::Values(
        RejectedAttributeCase{"group without domain", AttributeRecord{Saml::ATTRIBUTE_GROUP_IDENTITY, {"Users"}},
                              "Failed to parse Group Identity value: `Users'; domain or group missing"},
        RejectedAttributeCase{"group ending in its backslash",
                              AttributeRecord{Saml::ATTRIBUTE_GROUP_IDENTITY, {"EXAMPLE\\Users", "EXAMPLE\\"}},
                              "Failed to parse Group Identity value: `EXAMPLE\\'; domain or group missing"},
        RejectedAttributeCase{"solution flag without value", AttributeRecord{Saml::ATTRIBUTE_IS_SOLUTION, {}},
                              "No value found for attribute isSolution."},
        RejectedAttributeCase{"two solution flags", AttributeRecord{Saml::ATTRIBUTE_IS_SOLUTION, {"true", "false"}},
                              "More than one value found for attribute isSolution."}),
    [](const ::testing::TestParamInfo<RejectedAttributeCase>& info) { return "Case" + std::to_string(info.index); });

}  // namespace
}  // namespace SsoClient
