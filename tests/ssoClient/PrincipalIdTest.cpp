#include "ssoClient/PrincipalId.h"

#include <gtest/gtest.h>

#include "ssoClient/Exceptions.h"

namespace SsoClient {
namespace {

struct EqualityCase {
  const char* label;
  PrincipalId left;
  PrincipalId right;
  bool equal;
};

class PrincipalIdEqualityTest : public testing::TestWithParam<EqualityCase> {};

TEST_P(PrincipalIdEqualityTest, ComparesIgnoringAsciiCase) {
  const EqualityCase& row = GetParam();
  SCOPED_TRACE(row.label);
  EXPECT_EQ(row.equal, row.left == row.right);
  EXPECT_EQ(row.equal, row.right == row.left);
  EXPECT_EQ(!row.equal, row.left != row.right);
}

INSTANTIATE_TEST_SUITE_P(
    Table, PrincipalIdEqualityTest,
    testing::Values(
        EqualityCase{"identical", {"alice", "example.com"}, {"alice", "example.com"}, true},
        EqualityCase{"case differs", {"Alice", "EXAMPLE.com"}, {"aLICE", "example.COM"}, true},
        EqualityCase{"name and domain swapped", {"alice", "example"}, {"example", "alice"}, false},
        EqualityCase{"other name", {"alice", "example"}, {"alicia", "example"}, false},
        EqualityCase{"other domain", {"alice", "example"}, {"alice", "example.com"}, false},
        EqualityCase{"name moved into domain", {"ab", "c"}, {"a", "bc"}, false},
        // Upper-casing is ASCII only: e-acute and E-acute stay different.
        EqualityCase{"non-ASCII case", {"jos\xC3\xA9", "example"}, {"JOS\xC3\x89", "example"}, false}));

TEST(PrincipalIdTest, EqualsItself) {
  const PrincipalId alice("alice", "example");
  EXPECT_TRUE(alice == alice);
}

TEST(PrincipalIdTest, ToStringHasNoBlankAfterDomainColon) {
  EXPECT_EQ("{Name: alice; Domain:example}", PrincipalId("alice", "example").ToString());
}

#ifndef NDEBUG
TEST(PrincipalIdDeathTest, EmptyPartsBreakTheContract) {
  EXPECT_DEATH(PrincipalId("", "example"), "!name.empty\\(\\)");
  EXPECT_DEATH(PrincipalId("alice", ""), "!domain.empty\\(\\)");
}
#endif

struct GroupCase {
  const char* value;
  const char* name;
  const char* domain;
};

class ParseGroupIdentityTest : public testing::TestWithParam<GroupCase> {};

TEST_P(ParseGroupIdentityTest, SplitsAtFirstBackslash) {
  const GroupCase& row = GetParam();
  SCOPED_TRACE(row.value);
  const PrincipalId group = ParseGroupIdentity(row.value);
  EXPECT_EQ(row.name, group.name);
  EXPECT_EQ(row.domain, group.domain);
}

INSTANTIATE_TEST_SUITE_P(Table, ParseGroupIdentityTest,
                         testing::Values(GroupCase{"EXAMPLE\\Domain Users", "Domain Users", "EXAMPLE"},
                                         GroupCase{"EXAMPLE\\ops\\admins", "ops\\admins", "EXAMPLE"},
                                         GroupCase{"d\\g", "g", "d"},
                                         GroupCase{"example.com\\\\", "\\", "example.com"}));

class ParseGroupIdentityFailureTest : public testing::TestWithParam<const char*> {};

TEST_P(ParseGroupIdentityFailureTest, QuotesWholeValue) {
  const std::string value = GetParam();
  SCOPED_TRACE(value);
  try {
    ParseGroupIdentity(value);
    FAIL() << "no exception";
  } catch (const ParseException& e) {
    EXPECT_EQ("Failed to parse Group Identity value: `" + value + "'; domain or group missing", e.what());
  }
}

INSTANTIATE_TEST_SUITE_P(Table, ParseGroupIdentityFailureTest,
                         testing::Values("", "Domain Users", "\\Domain Users", "EXAMPLE\\", "\\",
                                         "\\EXAMPLE\\Domain Users"));

}  // namespace
}  // namespace SsoClient
