// demo: every operation against its own development STS, in one run.

#include <gtest/gtest.h>
#include <unistd.h>

#include <string>

#include "cli/CliProcess.h"

namespace {

bool EndsWith(const std::string& text, const std::string& end) {
  return text.size() >= end.size() && text.compare(text.size() - end.size(), end.size(), end) == 0;
}

TEST(CliDemo, RunsAndNamesEveryOperationThenRemovesItsKeys) {
  const CliTest::CliResult result = CliTest::RunCli({"demo"});
  ASSERT_EQ(result.exitCode, 0) << result.out << result.err;
  for (const char* operation :
       {"AcquireToken (bearer)", "AcquireToken (holder-of-key)", "AcquireTokenByCertificate",
        "AcquireTokenByToken (delegated)", "RenewToken", "ValidateSubject", "AcquireTokenByGSS", "AcquireTokenAsync",
        "AcquireTokenByCertificateAsync", "AcquireTokenByTokenAsync (delegated)", "RenewTokenAsync",
        "ValidateSubjectAsync", "AcquireTokenByGssAsync", "CreateSamlToken (relying party)"}) {
    SCOPED_TRACE(operation);
    const size_t at = result.out.find(std::string("\n  ") + operation + " ");
    ASSERT_NE(at, std::string::npos) << result.out;
    const std::string entry = result.out.substr(at + 1, result.out.find('\n', at + 1) - at - 1);
    EXPECT_TRUE(EndsWith(entry, " ms  ok")) << entry;
  }
  EXPECT_NE(result.out.find("\n14 of 14 operations succeeded\n"), std::string::npos) << result.out;

  const std::string marker = "fresh keys in ";
  const size_t at = result.out.find(marker);
  ASSERT_NE(at, std::string::npos) << result.out;
  const std::string directory = result.out.substr(at + marker.size(), result.out.find('\n', at) - at - marker.size());
  EXPECT_NE(access(directory.c_str(), F_OK), 0) << directory << " is left behind";
}

}  // namespace
