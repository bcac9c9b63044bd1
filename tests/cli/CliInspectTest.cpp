// inspect: the offline check of token files, as text and as JSON, and its refusals.

#include <gtest/gtest.h>

#include <algorithm>
#include <nlohmann/json.hpp>
#include <string>
#include <vector>

#include "cli/CliProcess.h"
#include "support/TestTokens.h"

namespace {

using CliTest::Lines;
using CliTest::RunCli;

const std::string DATA = SSOCLIENT_TEST_DATA_DIR;
const std::string CA = DATA + "/keys/ca.pem";
// The vectors are valid in June 2027 only; a tolerance of decades lets them pass at any date.
const std::string VECTOR_TOLERANCE = "2000000000";

CliTest::CliResult InspectVector(const std::string& file, const std::vector<std::string>& extra = {}) {
  std::vector<std::string> arguments = {"inspect", "--token",           DATA + "/tokens/" + file, "--sts-cert",
                                        CA,        "--clock-tolerance", VECTOR_TOLERANCE};
  arguments.insert(arguments.end(), extra.begin(), extra.end());
  return RunCli(arguments);
}

TEST(CliInspect, PrintsTheFactsOfAValidTokenAsText) {
  const CliTest::CliResult result = InspectVector("valid-holder-of-key.xml");
  ASSERT_EQ(result.exitCode, 0) << result.err;
  EXPECT_EQ(result.err, "");
  const std::vector<std::string> expected = {
      "id:               _holder-of-key-token",
      "subject:          alice@example.com",
      "full name:        Alice Example",
      "valid from:       2027-06-01T10:00:00.000Z",
      "valid until:      2027-06-01T11:00:00.000Z",
      "renewable:        yes",
      "delegable:        yes",
      "audience:         https://service.example/one, https://service.example/two",
  };
  const std::vector<std::string> lines = Lines(result.out);
  for (const std::string& line : expected) {
    EXPECT_NE(std::find(lines.begin(), lines.end(), line), lines.end()) << line << "\n" << result.out;
  }
  EXPECT_NE(result.out.find("confirmation:     holder-of-key (CN=Test Holder-of-Key Client"), std::string::npos);
  EXPECT_NE(result.out.find("groups:           EXAMPLE\\Users, EXAMPLE\\Readers,"), std::string::npos);
}

TEST(CliInspect, PrintsTheFactsOfADelegatedTokenAsJson) {
  const CliTest::CliResult result = InspectVector("valid-delegated.xml", {"--json"});
  ASSERT_EQ(result.exitCode, 0) << result.err;
  const nlohmann::json facts = nlohmann::json::parse(result.out);
  EXPECT_EQ(facts["id"], "_delegated-token");
  EXPECT_EQ(facts["subject"], (nlohmann::json{{"name", "alice"}, {"domain", "example.com"}}));
  EXPECT_EQ(facts["confirmation"]["method"], "bearer");
  EXPECT_EQ(facts["validity"]["notOnOrAfter"], "2027-06-01T11:00:00.000Z");
  ASSERT_EQ(facts["delegationChain"].size(), 2u);
  EXPECT_EQ(facts["delegationChain"][0]["name"], "service-a");
  EXPECT_EQ(facts["delegationChain"][1]["name"], "service-b");
  EXPECT_EQ(facts["delegationChain"][1]["delegationInstant"], "2027-06-01T09:59:00.000Z");
  EXPECT_EQ(facts["audience"], (nlohmann::json{"https://service.example/one"}));
  EXPECT_EQ(facts.count("xml"), 0u) << "inspect never prints the token itself";
}

TEST(CliInspect, AcceptsATokenIssuedNowWithTheDefaultTolerance) {
  const TokenIssuer::TokenRecord record = TestSupport::HolderOfKeyRecord();
  const std::string path = CliTest::TempPath("fresh-token.xml");
  CliTest::WriteFile(path, TestSupport::IssueTestToken(record));
  const CliTest::CliResult result = RunCli({"--json", "inspect", "--token", path, "--sts-cert", CA});
  ASSERT_EQ(result.exitCode, 0) << result.err;
  const nlohmann::json facts = nlohmann::json::parse(result.out);
  EXPECT_EQ(facts["id"], record.id);
  EXPECT_EQ(facts["confirmation"]["method"], "holder-of-key");
  EXPECT_EQ(facts["confirmation"]["certificate"]["sha256"],
            TestSupport::LoadTestCertificate("client")->GetSha256Thumbprint());
}

TEST(CliInspect, RejectedTokensEndWithExitCodeFourAndOneLineNamingTheReason) {
  struct Case {
    const char* file;
    const char* error;
  };
  const Case cases[] = {
      {"tampered-group.xml",
       "ssoclient: SsoClient::InvalidSignatureException: Failed to verify signature: token might have been tampered "
       "with."},
      {"tampered-subject.xml",
       "ssoclient: SsoClient::InvalidSignatureException: Failed to verify signature: token might have been tampered "
       "with."},
      {"untrusted-signer.xml", "ssoclient: SsoClient::InvalidSignatureException: "},
      {"signature-removed.xml", "ssoclient: SsoClient::ParseException: "},
      {"reference-uri-other-id.xml",
       "ssoclient: SsoClient::ParseException: Token's signature must cover the entire token"},
      {"doctype-external-entity.xml", "ssoclient: Tamber::Xml::XMLParseException: "},
  };
  for (const Case& rejected : cases) {
    SCOPED_TRACE(rejected.file);
    const CliTest::CliResult result = InspectVector(rejected.file);
    EXPECT_EQ(result.exitCode, 4);
    EXPECT_EQ(result.out, "");
    ASSERT_EQ(Lines(result.err).size(), 1u) << result.err;
    EXPECT_EQ(result.err.rfind(rejected.error, 0), 0u) << result.err;
  }
}

TEST(CliInspect, RequiresATrustedSigningCertificate) {
  const CliTest::CliResult result = RunCli({"inspect", "--token", DATA + "/tokens/valid-bearer.xml"});
  EXPECT_EQ(result.exitCode, 2);
  EXPECT_EQ(result.err,
            "ssoclient: UsageError: expected --sts-cert FILE (a trusted token signing certificate), found none\n");
}

TEST(CliInspect, AFileThatIsNoCertificateIsAUsageErrorNamingTheFile) {
  const std::string notPem = DATA + "/tokens/valid-bearer.xml";
  const CliTest::CliResult result =
      RunCli({"inspect", "--token", notPem, "--sts-cert", notPem, "--clock-tolerance", VECTOR_TOLERANCE});
  EXPECT_EQ(result.exitCode, 2);
  EXPECT_EQ(result.err.rfind("ssoclient: FileError: file '" + notPem + "': expected PEM certificates: ", 0), 0u)
      << result.err;
}

}  // namespace
