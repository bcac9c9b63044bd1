// Runs the programs of examples/ as a user would, and keeps the README's copies of them honest.

#include <fstream>
#include <sstream>
#include <string>

#include <gtest/gtest.h>

#include "e2e/DevStsEnvironment.h"
#include "support/ChildProcess.h"
#include "support/TemporaryDirectory.h"
#include "support/TestTokens.h"

namespace {

const std::string EXAMPLES_DIR = std::string(SSOCLIENT_BINARY_DIR) + "/examples/";
const std::string SOURCE_DIR = std::string(SSOCLIENT_TEST_DATA_DIR) + "/../../";
const std::string KEYS_DIR = std::string(SSOCLIENT_TEST_DATA_DIR) + "/keys/";
const std::string SIGNATURE_REJECTED = "Failed to verify signature: token might have been tampered with.\n";

std::string ReadFile(const std::string& path) {
  std::ifstream in(path, std::ios::binary);
  EXPECT_TRUE(in) << "cannot read " << path;
  std::ostringstream content;
  content << in.rdbuf();
  return content.str();
}

std::string WriteFile(const std::string& path, const std::string& content) {
  std::ofstream(path, std::ios::binary) << content;
  return path;
}

using TestSupport::ProcessResult;
using TestSupport::RunProgram;

ProcessResult ValidateToken(const TestSupport::TemporaryDirectory& scratch, const std::string& token,
                            const std::string& trustedPem) {
  return RunProgram(EXAMPLES_DIR + "ValidateToken", {WriteFile(scratch.GetPath() + "/token.xml", token), trustedPem});
}

class ValidateTokenExampleTest : public ::testing::Test {
 protected:
  // A token issued now, valid for an hour, signed by the test STS.
  static std::string FreshToken() {
    TokenIssuer::TokenRecord record;
    record.groups = {"example.com\\Users", "example.com\\Auditors"};
    return TestSupport::IssueTestToken(record);
  }

  TestSupport::TemporaryDirectory _scratch;
};

TEST_F(ValidateTokenExampleTest, PrintsTheFactsOfATokenSignedByTheTrustedSigner) {
  for (const char* trusted : {"sts.pem", "ca.pem"}) {
    SCOPED_TRACE(trusted);
    const ProcessResult outcome = ValidateToken(_scratch, FreshToken(), KEYS_DIR + trusted);
    EXPECT_EQ(0, outcome.exitCode) << outcome.err;
    EXPECT_EQ("", outcome.err);
    EXPECT_NE(std::string::npos, outcome.out.find("subject: {Name: alice; Domain:example.com}\n")) << outcome.out;
    EXPECT_NE(std::string::npos, outcome.out.find("confirmation: bearer\n")) << outcome.out;
    EXPECT_NE(std::string::npos,
              outcome.out.find("group: {Name: Users; Domain:example.com}\n"
                               "group: {Name: Auditors; Domain:example.com}\n"))
        << outcome.out;
  }
}

TEST_F(ValidateTokenExampleTest, RejectsAForeignSignerAndATamperedToken) {
  const ProcessResult untrusted = ValidateToken(_scratch, FreshToken(), KEYS_DIR + "untrusted.pem");
  EXPECT_EQ(4, untrusted.exitCode);
  EXPECT_EQ("token rejected: " + SIGNATURE_REJECTED, untrusted.err);
  EXPECT_EQ("", untrusted.out);

  std::string tampered = FreshToken();
  const size_t subject = tampered.find("alice@example.com");
  ASSERT_NE(std::string::npos, subject);
  tampered.replace(subject, 5, "mallo");
  const ProcessResult edited = ValidateToken(_scratch, tampered, KEYS_DIR + "sts.pem");
  EXPECT_EQ(4, edited.exitCode);
  EXPECT_EQ("token rejected: " + SIGNATURE_REJECTED, edited.err);
}

TEST_F(ValidateTokenExampleTest, ExplainsUsageAndUnreadableFiles) {
  const ProcessResult usage = RunProgram(EXAMPLES_DIR + "ValidateToken", {});
  EXPECT_EQ(2, usage.exitCode);
  EXPECT_EQ("usage: ValidateToken TOKEN_XML TRUSTED_CERTS_PEM\n", usage.err);

  const std::string missing = _scratch.GetPath() + "/no-such.pem";
  const ProcessResult unreadable = ValidateToken(_scratch, FreshToken(), missing);
  EXPECT_EQ(1, unreadable.exitCode);
  EXPECT_EQ("failed: cannot read " + missing + "\n", unreadable.err);
}

// The README's road end to end: AcquireToken against a development STS, then ValidateToken on
// what it wrote.
class AcquireTokenExampleTest : public E2e::DevStsTest {
 protected:
  ProcessResult AcquireToken(const std::string& password, const std::string& trustedTokenSigner) {
    return RunProgram(EXAMPLES_DIR + "AcquireToken",
                      {environment->GetServer().GetUrl(), environment->KeyFile(DevSts::CA_CERTIFICATE_FILE),
                       trustedTokenSigner, "alice@example.com"},
                      password + "\n");
  }

  TestSupport::TemporaryDirectory _scratch;
};

TEST_F(AcquireTokenExampleTest, AcquiresATokenThatValidateTokenAccepts) {
  const std::string signer = environment->KeyFile(DevSts::SIGNING_CERTIFICATE_FILE);
  const ProcessResult acquired = AcquireToken("alice-password", signer);
  ASSERT_EQ(0, acquired.exitCode) << acquired.err;
  EXPECT_EQ("", acquired.err);

  const ProcessResult validated = ValidateToken(_scratch, acquired.out, signer);
  EXPECT_EQ(0, validated.exitCode) << validated.err;
  EXPECT_NE(std::string::npos, validated.out.find("subject: {Name: alice; Domain:example.com}\n")) << validated.out;
}

TEST_F(AcquireTokenExampleTest, TellsAWrongPasswordFromAnUntrustedSigner) {
  const ProcessResult refused =
      AcquireToken("not-her-password", environment->KeyFile(DevSts::SIGNING_CERTIFICATE_FILE));
  EXPECT_EQ(3, refused.exitCode);
  EXPECT_EQ(0u, refused.err.rfind("wrong user name or password: ", 0)) << refused.err;
  EXPECT_EQ("", refused.out);

  const ProcessResult untrusted = AcquireToken("alice-password", KEYS_DIR + "untrusted.pem");
  EXPECT_EQ(1, untrusted.exitCode);
  EXPECT_EQ("failed: " + SIGNATURE_REJECTED, untrusted.err);
  EXPECT_EQ("", untrusted.out);
}

// The README's quick start shows the example programs; a change to either must reach the other.
TEST(ReadmeTest, QuotesTheExampleProgramsVerbatim) {
  const std::string readme = ReadFile(SOURCE_DIR + "README.md");
  for (const char* example : {"AcquireToken.cpp", "ValidateToken.cpp"}) {
    SCOPED_TRACE(example);
    const std::string block = "```cpp\n" + ReadFile(SOURCE_DIR + "examples/" + example) + "```\n";
    EXPECT_NE(std::string::npos, readme.find(block)) << "README.md does not quote examples/" << example;
  }
}

}  // namespace
