// Usage errors, the exit-code documentation and the refusal of passwords as arguments.

#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "cli/CliProcess.h"

namespace {

using CliTest::Lines;
using CliTest::RunCli;

void ExpectOneLineUsageError(const CliTest::CliResult& result) {
  EXPECT_EQ(result.exitCode, 2);
  EXPECT_EQ(result.out, "");
  ASSERT_EQ(Lines(result.err).size(), 1u) << result.err;
  EXPECT_EQ(result.err.rfind("ssoclient: ", 0), 0u) << result.err;
}

TEST(CliUsage, MalformedCommandLinesEndWithExitCodeTwoAndOneLine) {
  const std::vector<std::vector<std::string>> commandLines = {
      {},
      {"frobnicate"},
      {"inspect", "--bogus"},
      {"acquire"},
      {"inspect", "--token", "/nonexistent/token.xml", "--sts-cert", "/nonexistent/sts.pem"},
      {"--timeout", "0", "demo"},
      {"renew", "--lifetime", "ten"},
  };
  for (const auto& arguments : commandLines) {
    SCOPED_TRACE(testing::PrintToString(arguments));
    ExpectOneLineUsageError(RunCli(arguments));
  }
}

TEST(CliUsage, MissingRequiredOptionIsNamed) {
  const CliTest::CliResult result = RunCli({"acquire"});
  EXPECT_EQ(result.err, "ssoclient: RequiredError: --user is required\n");
}

TEST(CliUsage, PasswordIsNeverTakenFromAnArgumentNorEchoed) {
  const std::string secret = "s3cret-Value";
  const std::vector<std::vector<std::string>> commandLines = {
      {"acquire", "--user", "alice@example.com", "--password", secret},
      {"acquire", "--user", "alice@example.com", "--password=" + secret},
      {"--sts", "https://127.0.0.1:1/sts", "acquire", "--user", "alice@example.com", secret},
  };
  for (const auto& arguments : commandLines) {
    SCOPED_TRACE(testing::PrintToString(arguments));
    const CliTest::CliResult result = RunCli(arguments, "from-stdin\n");
    ExpectOneLineUsageError(result);
    EXPECT_EQ(result.err.find(secret), std::string::npos) << result.err;
  }
}

TEST(CliUsage, HelpDocumentsEveryExitCode) {
  const CliTest::CliResult result = RunCli({"--help"});
  EXPECT_EQ(result.exitCode, 0);
  for (const char* line : {"  0  success", "  1  any other failure", "  2  bad usage", "  3  bad credentials",
                           "  4  invalid token", "  5  communication failure"}) {
    EXPECT_NE(result.out.find(line), std::string::npos) << line;
  }
}

}  // namespace
