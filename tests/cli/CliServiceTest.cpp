// The subcommands that talk to an STS, against a development STS started by the suite.

#include <gtest/gtest.h>
#include <netinet/in.h>
#include <sys/socket.h>
#include <sys/stat.h>
#include <unistd.h>

#include <memory>
#include <nlohmann/json.hpp>
#include <regex>
#include <stdexcept>
#include <string>
#include <vector>

#include "cli/CliProcess.h"
#include "e2e/DevStsEnvironment.h"
#include "ssoClient/SamlToken.h"
#include "tamber/crypto/Certificate.h"

namespace {

using CliTest::Lines;
using CliTest::RunCli;

const char USER[] = "alice@example.com";
const char PASSWORD[] = "alice-password";

class CliService : public E2e::DevStsTest {
 protected:
  static std::string Key(const char* file) { return environment->KeyFile(file); }

  // The options that reach the suite's STS, then `arguments`.
  static std::vector<std::string> Against(const std::vector<std::string>& arguments) {
    std::vector<std::string> all = {"--sts",      StsUrl(),
                                    "--ca",       Key(DevSts::CA_CERTIFICATE_FILE),
                                    "--sts-cert", Key(DevSts::SIGNING_CERTIFICATE_FILE)};
    all.insert(all.end(), arguments.begin(), arguments.end());
    return all;
  }

  static std::vector<std::string> ClientKeys() {
    return {"--cert", Key(DevSts::CLIENT_CERTIFICATE_FILE), "--key", Key(DevSts::CLIENT_KEY_FILE)};
  }

  // The token of a file, as a relying party trusting the STS's signer sees it.
  static boost::shared_ptr<const SsoClient::SamlToken> ParseTokenFile(const std::string& path) {
    return SsoClient::CreateSamlToken(DevSts::ReadTextFile(path),
                                      environment->Certificate(DevSts::SIGNING_CERTIFICATE_FILE).get());
  }

  static std::string StsUrl() { return environment->GetServer().GetUrl(); }
};

void ExpectOneErrorLine(const CliTest::CliResult& result, int exitCode, const std::string& prefix) {
  EXPECT_EQ(result.exitCode, exitCode);
  ASSERT_EQ(Lines(result.err).size(), 1u) << result.err;
  EXPECT_EQ(result.err.rfind(prefix, 0), 0u) << result.err;
}

TEST_F(CliService, AcquireReadsThePasswordFromStdinAndWritesAParsableTokenFile) {
  const std::string tokenFile = CliTest::TempPath("acquired.xml");
  const CliTest::CliResult result =
      RunCli(Against({"acquire", "--user", USER, "--bearer", "--lifetime", "900", "-o", tokenFile}),
             std::string(PASSWORD) + "\n");
  ASSERT_EQ(result.exitCode, 0) << result.err;
  EXPECT_EQ(result.out.rfind("token written to " + tokenFile + "\n", 0), 0u) << result.out;

  const auto token = ParseTokenFile(tokenFile);
  EXPECT_EQ(token->GetSubject().name + "@" + token->GetSubject().domain, USER);
  EXPECT_EQ(token->GetConfirmationMethod(), SsoClient::SamlToken::CONFIRM_BEARER);
  struct stat status;
  ASSERT_EQ(stat(tokenFile.c_str(), &status), 0);
  EXPECT_EQ(status.st_mode & 0777, 0600u) << "a token is a credential";
}

TEST_F(CliService, AcquireWithJsonPrintsTheFactsAndTheTokenOnStdout) {
  const std::string passwordFile = CliTest::TempPath("password");
  CliTest::WriteFile(passwordFile, std::string(PASSWORD) + "\n");
  const CliTest::CliResult result =
      RunCli(Against({"--json", "acquire", "--user", USER, "--password-file", passwordFile}));
  ASSERT_EQ(result.exitCode, 0) << result.err;
  const nlohmann::json answer = nlohmann::json::parse(result.out);
  EXPECT_EQ(answer["subject"]["domain"], "example.com");
  EXPECT_EQ(answer["confirmation"]["method"], "bearer");
  const std::string tokenFile = CliTest::TempPath("from-json.xml");
  CliTest::WriteFile(tokenFile, answer["xml"].get<std::string>());
  EXPECT_EQ(ParseTokenFile(tokenFile)->GetId(), answer["id"]);
}

TEST_F(CliService, WrongPasswordEndsWithExitCodeThree) {
  const CliTest::CliResult result = RunCli(Against({"acquire", "--user", USER}), "not-the-password\n");
  ExpectOneErrorLine(result, 3, "ssoclient: SsoClient::InvalidCredentialsException: ");
  EXPECT_EQ(result.out, "");
}

TEST_F(CliService, VerboseTracesEachOperationOnStderrWithoutThePassword) {
  const CliTest::CliResult result = RunCli(Against({"--verbose", "acquire", "--user", USER}), "not-the-password\n");
  EXPECT_EQ(result.exitCode, 3);
  EXPECT_NE(result.err.find("START operation SecurityTokenServiceImpl::AcquireToken"), std::string::npos) << result.err;
  EXPECT_NE(result.err.find("END operation SecurityTokenServiceImpl::AcquireToken"), std::string::npos) << result.err;
  EXPECT_EQ(result.err.find("not-the-password"), std::string::npos) << result.err;
  EXPECT_EQ(Lines(result.err).back().rfind("ssoclient: SsoClient::InvalidCredentialsException: ", 0), 0u);
}

// A loopback socket on an ephemeral port that is never accepted from; it holds the port, so that
// no other process can answer on it.
class SilentPort {
 public:
  explicit SilentPort(bool listening) : _fd(socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0)) {
    sockaddr_in address = {};
    address.sin_family = AF_INET;
    address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
    socklen_t length = sizeof address;
    if (bind(_fd, reinterpret_cast<sockaddr*>(&address), length) != 0 ||
        getsockname(_fd, reinterpret_cast<sockaddr*>(&address), &length) != 0 || (listening && listen(_fd, 8) != 0)) {
      throw std::runtime_error("cannot set up a loopback socket");
    }
    _port = ntohs(address.sin_port);
  }
  ~SilentPort() { close(_fd); }
  std::string Url() const { return "https://127.0.0.1:" + std::to_string(_port) + "/sts/STSService"; }

 private:
  int _fd;
  int _port = 0;
};

TEST_F(CliService, UnreachableStsEndsWithExitCodeFive) {
  const SilentPort refusing(false);
  const CliTest::CliResult result =
      RunCli({"--sts", refusing.Url(), "--sts-cert", Key(DevSts::SIGNING_CERTIFICATE_FILE), "acquire", "--user", USER},
             std::string(PASSWORD) + "\n");
  ExpectOneErrorLine(result, 5, "ssoclient: SsoClient::CommunicationException: ");
}

TEST_F(CliService, StsThatNeverAnswersEndsWithExitCodeFiveAfterTheTimeout) {
  const SilentPort silent(true);
  const CliTest::CliResult result = RunCli({"--sts", silent.Url(), "--sts-cert", Key(DevSts::SIGNING_CERTIFICATE_FILE),
                                            "--timeout", "1", "acquire", "--user", USER},
                                           std::string(PASSWORD) + "\n");
  EXPECT_EQ(result.exitCode, 5);
  EXPECT_EQ(result.err, "ssoclient: TimeoutError: expected an answer from the STS within 1000 ms, found none\n");
}

TEST_F(CliService, PinnedTlsCertificateReplacesTheCaAndAWrongPinIsRefused) {
  const Tamber::Ref<const Tamber::Crypto::Certificate> tls = environment->Certificate(DevSts::TLS_CERTIFICATE_FILE);
  const std::vector<std::string> pinned = {"--sts",
                                           StsUrl(),
                                           "--sts-cert",
                                           Key(DevSts::SIGNING_CERTIFICATE_FILE),
                                           "acquire-by-cert",
                                           "--cert",
                                           Key(DevSts::CLIENT_CERTIFICATE_FILE),
                                           "--key",
                                           Key(DevSts::CLIENT_KEY_FILE),
                                           "--pin"};

  std::vector<std::string> right = pinned;
  right.push_back(tls->GetSha256Thumbprint());
  const CliTest::CliResult accepted = RunCli(right);
  EXPECT_EQ(accepted.exitCode, 0) << accepted.err;

  std::vector<std::string> wrong = pinned;
  wrong.push_back(std::string(64, 'a'));
  ExpectOneErrorLine(RunCli(wrong), 5, "ssoclient: SsoClient::CommunicationException: ");
}

TEST_F(CliService, HolderOfKeyTokenIsRenewedExchangedAndItsSubjectValidated) {
  const std::string tokenFile = CliTest::TempPath("hok.xml");
  std::vector<std::string> acquire = {"acquire", "--user", USER, "--renewable", "--delegable", "-o", tokenFile};
  for (const std::string& option : ClientKeys()) acquire.push_back(option);
  const CliTest::CliResult acquired = RunCli(Against(acquire), std::string(PASSWORD) + "\n");
  ASSERT_EQ(acquired.exitCode, 0) << acquired.err;
  EXPECT_EQ(ParseTokenFile(tokenFile)->GetConfirmationMethod(), SsoClient::SamlToken::CONFIRM_HOLDER_OF_KEY);

  std::vector<std::string> renew = {"--json", "renew", "--token", tokenFile, "--lifetime", "1200"};
  for (const std::string& option : ClientKeys()) renew.push_back(option);
  const CliTest::CliResult renewed = RunCli(Against(renew));
  ASSERT_EQ(renewed.exitCode, 0) << renewed.err;
  EXPECT_EQ(nlohmann::json::parse(renewed.out)["subject"]["name"], "alice");

  std::vector<std::string> exchange = {"--json",  "exchange",      "--token",
                                       tokenFile, "--delegate-to", "demo-solution@example.com"};
  for (const std::string& option : ClientKeys()) exchange.push_back(option);
  const CliTest::CliResult exchanged = RunCli(Against(exchange));
  ASSERT_EQ(exchanged.exitCode, 0) << exchanged.err;
  EXPECT_EQ(nlohmann::json::parse(exchanged.out)["subject"]["name"], "alice");

  const CliTest::CliResult validated = RunCli(Against({"validate-subject", "--token", tokenFile}));
  EXPECT_EQ(validated.exitCode, 0) << validated.err;
  EXPECT_EQ(validated.out, "subject valid: yes\n");
}

TEST_F(CliService, DumpSoapShowsEachMessageWithoutPasswordOrSignatureValue) {
  std::vector<std::string> acquire = {"--dump-soap", "acquire", "--user", USER};
  for (const std::string& option : ClientKeys()) acquire.push_back(option);
  const CliTest::CliResult result = RunCli(Against(acquire), std::string(PASSWORD) + "\n");
  ASSERT_EQ(result.exitCode, 0) << result.err;

  EXPECT_NE(result.err.find("=== request to " + StsUrl()), std::string::npos) << result.err;
  EXPECT_NE(result.err.find("=== answer 200"), std::string::npos) << result.err;
  EXPECT_NE(result.err.find("UsernameToken"), std::string::npos) << result.err;
  EXPECT_EQ(result.err.find(PASSWORD), std::string::npos) << "the password leaked";
  // The signed request and the issued token both carry signature values; none may show.
  const std::regex signatureValue(R"(<(?:[-.\w]+:)?SignatureValue(\s[^>]*)?>([^<]*)<)");
  int shown = 0;
  for (std::sregex_iterator it(result.err.begin(), result.err.end(), signatureValue), end; it != end; ++it) {
    EXPECT_EQ((*it)[2].str(), "[redacted]");
    ++shown;
  }
  EXPECT_GE(shown, 2) << result.err;
}

}  // namespace
