#include "DemoCommand.h"

#include <iostream>
#include <memory>
#include <sstream>
#include <string>

#include "AsyncResult.h"
#include "DemoReport.h"
#include "DevSts.h"
#include "ExitCodes.h"
#include "InputFiles.h"
#include "StsConnection.h"
#include "TemporaryDirectory.h"
#include "TokenFacts.h"

namespace Cli {
namespace {

using TokenPointer = boost::shared_ptr<const SsoClient::SamlToken>;

const char DEMO_USER[] = "alice@example.com";
const char DEMO_PASSWORD[] = "alice-password";
const char GSS_USER[] = "bob@example.com";
const char GSS_PASSWORD[] = "bob-password";
const char DELEGATE[] = "demo-solution@example.com";
const long long RENEWED_LIFETIME_SEC = 1200;

SsoClient::TokenSpec BearerSpec() {
  SsoClient::TokenSpec spec;
  spec.confirmation = SsoClient::TokenSpec::CONFIRMATION_BEARER;
  return spec;
}

SsoClient::TokenSpec RenewableSpec() {
  SsoClient::TokenSpec spec;
  spec.renewable = true;
  spec.delegable = true;
  return spec;
}

SsoClient::TokenSpec DelegationSpec() {
  SsoClient::TokenSpec spec;
  spec.delegateTo = std::string(DELEGATE);
  return spec;
}

// The token an operation needs from an earlier one that may have failed.
const SsoClient::SamlToken& Needed(const TokenPointer& token, const std::string& madeBy) {
  if (!token) throw CliError("Skipped", EXIT_CODE_OTHER, "needs the token of " + madeBy + ", which failed");
  return *token;
}

std::string SubjectAnswer(bool valid) {
  if (!valid)
    throw CliError("InvalidSubject", EXIT_CODE_INVALID_TOKEN, "the STS answered that the subject is not valid");
  return "subject valid: yes";
}

// Runs the six synchronous operations, their asynchronous twins and the relying-party check.
class DemoRun {
 public:
  DemoRun(const StsConnection& sts, std::chrono::milliseconds timeout, DemoReport& report)
      : _service(sts.Service()), _trusted(sts.TrustedCertificates()), _timeout(timeout), _report(report) {}

  void Synchronous() {
    _bearer = Token("AcquireToken (bearer)",
                    [this] { return _service.AcquireToken(DEMO_USER, DEMO_PASSWORD, BearerSpec()); });
    _holderOfKey = Token("AcquireToken (holder-of-key)",
                         [this] { return _service.AcquireToken(DEMO_USER, DEMO_PASSWORD, RenewableSpec()); });
    Token("AcquireTokenByCertificate", [this] { return _service.AcquireTokenByCertificate(SsoClient::TokenSpec()); });
    _delegated = Token("AcquireTokenByToken (delegated)", [this] {
      return _service.AcquireTokenByToken(Needed(_holderOfKey, "AcquireToken (holder-of-key)"), DelegationSpec());
    });
    Token("RenewToken", [this] {
      return _service.RenewToken(Needed(_holderOfKey, "AcquireToken (holder-of-key)"), RENEWED_LIFETIME_SEC);
    });
    _report.Run("ValidateSubject",
                [this] { return SubjectAnswer(_service.ValidateSubject(Needed(_bearer, "AcquireToken (bearer)"))); });
    Token("AcquireTokenByGSS", [this] {
      return _service.AcquireTokenByGSS(SsoClient::TokenSpec(),
                                        *DevSts::CreateTestMechanismHandler(GSS_USER, GSS_PASSWORD));
    });
  }

  void Asynchronous() {
    Token("AcquireTokenAsync", [this] {
      AsyncResult<TokenPointer> result;
      _service.AcquireTokenAsync(DEMO_USER, DEMO_PASSWORD, RenewableSpec(), result.Callback());
      return result.Wait(_timeout);
    });
    Token("AcquireTokenByCertificateAsync", [this] {
      AsyncResult<TokenPointer> result;
      _service.AcquireTokenByCertificateAsync(SsoClient::TokenSpec(), result.Callback());
      return result.Wait(_timeout);
    });
    Token("AcquireTokenByTokenAsync (delegated)", [this] {
      Needed(_holderOfKey, "AcquireToken (holder-of-key)");
      AsyncResult<TokenPointer> result;
      _service.AcquireTokenByTokenAsync(_holderOfKey, DelegationSpec(), result.Callback());
      return result.Wait(_timeout);
    });
    Token("RenewTokenAsync", [this] {
      Needed(_holderOfKey, "AcquireToken (holder-of-key)");
      AsyncResult<TokenPointer> result;
      _service.RenewTokenAsync(_holderOfKey, RENEWED_LIFETIME_SEC, result.Callback());
      return result.Wait(_timeout);
    });
    _report.Run("ValidateSubjectAsync", [this] {
      Needed(_bearer, "AcquireToken (bearer)");
      AsyncResult<boost::optional<bool>> result;
      _service.ValidateSubjectAsync(_bearer, result.Callback());
      return SubjectAnswer(result.Wait(_timeout).value_or(false));
    });
    Token("AcquireTokenByGssAsync", [this] {
      AsyncResult<TokenPointer> result;
      _service.AcquireTokenByGssAsync(SsoClient::TokenSpec(),
                                      DevSts::CreateTestMechanismHandler(GSS_USER, GSS_PASSWORD), result.Callback());
      return result.Wait(_timeout);
    });
  }

  // What a relying party handed the delegated token (or, failing that, the holder-of-key one)
  // learns from it with nothing but the STS's signing certificate.
  void RelyingPartyCheck() {
    _report.Run("CreateSamlToken (relying party)", [this] {
      const SsoClient::SamlToken& issued =
          _delegated ? *_delegated : Needed(_holderOfKey, "AcquireToken (holder-of-key)");
      const TokenPointer token = SsoClient::CreateSamlToken(issued.ToXml(), _trusted);
      std::ostringstream facts;
      WriteTokenFacts(facts, *token);
      return facts.str();
    });
  }

 private:
  // Reports a token-returning operation; the token, or null when it failed.
  TokenPointer Token(const std::string& name, const std::function<TokenPointer()>& operation) {
    TokenPointer token;
    _report.Run(name, [&token, &operation] {
      token = operation();
      if (!token) throw CliError("SsoException", EXIT_CODE_OTHER, "expected a token, found none");
      return TokenSummary(*token);
    });
    return token;
  }

  const SsoClient::SecurityTokenService& _service;
  const SsoClient::CertificateList& _trusted;
  std::chrono::milliseconds _timeout;
  DemoReport& _report;
  TokenPointer _bearer;
  TokenPointer _holderOfKey;
  TokenPointer _delegated;
};

int RunDemo(const CommonOptions& common) {
  const TemporaryDirectory keys("ssoclient-demo-");
  DevSts::GenerateKeys(keys.GetPath());
  DevSts::Server server(DevSts::DefaultConfig(keys.GetPath()));
  server.Start();

  CommonOptions options = common;
  options.stsUrl = server.GetUrl();
  options.caFile = keys.File(DevSts::CA_CERTIFICATE_FILE);
  options.pin.clear();
  options.stsCertificateFiles = {keys.File(DevSts::SIGNING_CERTIFICATE_FILE)};
  const StsConnection sts(
      options, LoadHolderOfKey(keys.File(DevSts::CLIENT_CERTIFICATE_FILE), keys.File(DevSts::CLIENT_KEY_FILE)));

  std::cout << "Development STS at " << server.GetUrl() << ", fresh keys in " << keys.GetPath() << "\n\n"
            << "Synchronous operations\n";
  DemoReport report(std::cout);
  DemoRun run(sts, options.Timeout(), report);
  run.Synchronous();
  std::cout << "\nAsynchronous operations\n";
  run.Asynchronous();
  std::cout << "\nRelying party\n";
  run.RelyingPartyCheck();

  const int succeeded = report.GetRunCount() - report.GetFailureCount();
  std::cout << "\n" << succeeded << " of " << report.GetRunCount() << " operations succeeded\n" << std::flush;
  return report.GetFailureCount() == 0 ? EXIT_CODE_OK : EXIT_CODE_OTHER;
}

}  // namespace

Command AddDemoCommand(CLI::App& app, const CommonOptions& common) {
  CLI::App* command = app.add_subcommand(
      "demo", "start a development STS with fresh keys and run every operation against it (exit 0 if all succeed)");
  return {command, [&common] { return RunDemo(common); }};
}

}  // namespace Cli
