// Runs the programs of examples/ as a user would, and keeps the README's copies of them honest.
#include <sys/wait.h>
#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <sstream>
#include <string>

#include <gtest/gtest.h>

#include "support/TestTokens.h"

namespace {

const std::string EXAMPLES_DIR = std::string(SSOCLIENT_BINARY_DIR) + "/examples/";
const std::string SOURCE_DIR = std::string(SSOCLIENT_TEST_DATA_DIR) + "/../../";
const std::string KEYS_DIR = std::string(SSOCLIENT_TEST_DATA_DIR) + "/keys/";

std::string ReadFile(const std::string& path) {
  std::ifstream in(path, std::ios::binary);
  EXPECT_TRUE(in) << "cannot read " << path;
  std::ostringstream content;
  content << in.rdbuf();
  return content.str();
}

struct Outcome {
  int exitCode;
  std::string out;
  std::string err;
};

// A scratch folder of the test's own, removed with it.
class ScratchFolder {
 public:
  ScratchFolder() {
    std::string pattern = (std::filesystem::temp_directory_path() / "examples-XXXXXX").string();
    if (mkdtemp(pattern.data()) == nullptr) throw std::runtime_error("mkdtemp failed");
    _path = pattern;
  }
  ~ScratchFolder() { std::filesystem::remove_all(_path); }
  std::string File(const std::string& name) const { return (_path / name).string(); }
  std::string Write(const std::string& name, const std::string& content) const {
    std::ofstream(File(name), std::ios::binary) << content;
    return File(name);
  }

 private:
  std::filesystem::path _path;
};

// Runs a shell command line; its standard error goes through a file of `scratch`.
Outcome Run(const ScratchFolder& scratch, const std::string& commandLine) {
  const std::string errFile = scratch.File("stderr");
  FILE* pipe = popen((commandLine + " 2>'" + errFile + "'").c_str(), "r");
  if (pipe == nullptr) throw std::runtime_error("popen failed");
  std::string out;
  char buffer[4096];
  for (size_t n; (n = fread(buffer, 1, sizeof buffer, pipe)) > 0;) out.append(buffer, n);
  const int status = pclose(pipe);
  return {WIFEXITED(status) ? WEXITSTATUS(status) : -1, out, ReadFile(errFile)};
}

std::string Quote(const std::string& word) { return "'" + word + "'"; }

class ValidateTokenExampleTest : public ::testing::Test {
 protected:
  Outcome Validate(const std::string& token, const std::string& trustedPem) {
    return Run(_scratch, Quote(EXAMPLES_DIR + "ValidateToken") + " " + Quote(_scratch.Write("token.xml", token)) +
                             " " + Quote(trustedPem));
  }
  // A token issued now, valid for an hour, signed by the test STS.
  static std::string FreshToken() {
    TokenIssuer::TokenRecord record;
    record.groups = {"example.com\\Users", "example.com\\Auditors"};
    return TestSupport::IssueTestToken(record);
  }

  ScratchFolder _scratch;
};

TEST_F(ValidateTokenExampleTest, PrintsTheFactsOfATokenSignedByTheTrustedSigner) {
  for (const char* trusted : {"sts.pem", "ca.pem"}) {
    SCOPED_TRACE(trusted);
    const Outcome outcome = Validate(FreshToken(), KEYS_DIR + trusted);
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
  const Outcome untrusted = Validate(FreshToken(), KEYS_DIR + "untrusted.pem");
  EXPECT_EQ(4, untrusted.exitCode);
  EXPECT_EQ(0u, untrusted.err.rfind("token rejected: ", 0)) << untrusted.err;
  EXPECT_EQ("", untrusted.out);

  std::string tampered = FreshToken();
  const size_t subject = tampered.find("alice@example.com");
  ASSERT_NE(std::string::npos, subject);
  tampered.replace(subject, 5, "mallo");
  const Outcome edited = Validate(tampered, KEYS_DIR + "sts.pem");
  EXPECT_EQ(4, edited.exitCode);
  EXPECT_EQ(0u, edited.err.rfind("token rejected: ", 0)) << edited.err;
}

TEST_F(ValidateTokenExampleTest, ExplainsUsageAndUnreadableFiles) {
  const Outcome usage = Run(_scratch, Quote(EXAMPLES_DIR + "ValidateToken"));
  EXPECT_EQ(2, usage.exitCode);
  EXPECT_EQ("usage: ValidateToken TOKEN_XML TRUSTED_CERTS_PEM\n", usage.err);

  const Outcome missing = Validate(FreshToken(), _scratch.File("no-such.pem"));
  EXPECT_EQ(1, missing.exitCode);
  EXPECT_EQ("failed: cannot read " + _scratch.File("no-such.pem") + "\n", missing.err);
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
