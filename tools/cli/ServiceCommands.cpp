#include "ServiceCommands.h"

#include <iostream>
#include <memory>
#include <nlohmann/json.hpp>
#include <string>

#include "AsyncResult.h"
#include "ExitCodes.h"
#include "InputFiles.h"
#include "PasswordInput.h"
#include "StsConnection.h"
#include "TokenOutput.h"

namespace Cli {
namespace {

using TokenPointer = boost::shared_ptr<const SsoClient::SamlToken>;

struct KeyOptions {
  std::string certificateFile;
  std::string keyFile;

  void AddTo(CLI::App* command, bool required) {
    command->add_option("--cert", certificateFile, "PEM certificate of the holder-of-key identity")
        ->check(CLI::ExistingFile)
        ->required(required);
    command->add_option("--key", keyFile, "PEM private key of that certificate (unencrypted)")
        ->check(CLI::ExistingFile)
        ->required(required);
  }
  boost::optional<SsoClient::HolderOfKeyConfig> Load() const { return LoadHolderOfKey(certificateFile, keyFile); }
};

struct TokenSpecOptions {
  long long lifetimeSec = 600;
  std::vector<std::string> audience;
  std::string delegateTo;
  bool renewable = false;
  bool delegable = false;
  bool bearer = false;

  void AddTo(CLI::App* command) {
    command->add_option("--lifetime", lifetimeSec, "requested token lifetime in seconds")
        ->capture_default_str()
        ->check(CLI::PositiveNumber);
    command->add_option("--audience", audience, "restrict the token to this audience URI (repeatable)");
    command->add_option("--delegate-to", delegateTo, "principal the token is delegated to");
    command->add_flag("--renewable", renewable, "ask for a renewable token");
    command->add_flag("--delegable", delegable, "ask for a token that may be delegated further");
    command->add_flag("--bearer", bearer, "ask for a bearer token even when --cert and --key are given");
  }

  SsoClient::TokenSpec ToTokenSpec() const {
    SsoClient::TokenSpec spec;
    spec.tokenLifetimeSec = lifetimeSec;
    spec.audienceRestriction.insert(audience.begin(), audience.end());
    if (!delegateTo.empty()) spec.delegateTo = delegateTo;
    spec.renewable = renewable;
    spec.delegable = delegable;
    spec.confirmation = bearer ? SsoClient::TokenSpec::CONFIRMATION_BEARER : SsoClient::TokenSpec::CONFIRMATION_DEFAULT;
    return spec;
  }
};

TokenPointer Issued(const TokenPointer& token) {
  if (!token) throw CliError("SsoException", EXIT_CODE_OTHER, "expected a token in the STS's answer, found none");
  return token;
}

int PrintToken(const TokenPointer& token, const CommonOptions& common) {
  WriteTokenResult(*Issued(token), common, std::cout);
  return EXIT_CODE_OK;
}

Command AddAcquire(CLI::App& app, const CommonOptions& common) {
  struct Options {
    std::string user;
    std::string passwordFile;
    KeyOptions keys;
    TokenSpecOptions spec;
  };
  auto options = std::make_shared<Options>();
  CLI::App* command = app.add_subcommand(
      "acquire", "acquire a token for a user; the password comes from a prompt, stdin or --password-file");
  command->add_option("--user", options->user, "user name, e.g. alice@example.com")->required();
  command->add_option("--password-file", options->passwordFile, "read the password from the first line of this file")
      ->check(CLI::ExistingFile);
  options->keys.AddTo(command, false);
  options->spec.AddTo(command);
  return {command, [options, &common] {
            const StsConnection sts(common, options->keys.Load());
            const std::string password = ReadPassword(options->user, options->passwordFile);
            AsyncResult<TokenPointer> result;
            sts.Service().AcquireTokenAsync(options->user, password, options->spec.ToTokenSpec(), result.Callback());
            return PrintToken(result.Wait(common.Timeout()), common);
          }};
}

Command AddAcquireByCertificate(CLI::App& app, const CommonOptions& common) {
  struct Options {
    KeyOptions keys;
    TokenSpecOptions spec;
  };
  auto options = std::make_shared<Options>();
  CLI::App* command = app.add_subcommand("acquire-by-cert", "acquire a token for the holder of a certificate");
  options->keys.AddTo(command, true);
  options->spec.AddTo(command);
  return {command, [options, &common] {
            const StsConnection sts(common, options->keys.Load());
            AsyncResult<TokenPointer> result;
            sts.Service().AcquireTokenByCertificateAsync(options->spec.ToTokenSpec(), result.Callback());
            return PrintToken(result.Wait(common.Timeout()), common);
          }};
}

Command AddExchange(CLI::App& app, const CommonOptions& common) {
  struct Options {
    std::string tokenFile;
    KeyOptions keys;
    TokenSpecOptions spec;
  };
  auto options = std::make_shared<Options>();
  CLI::App* command =
      app.add_subcommand("exchange", "exchange a holder-of-key token for a new one, e.g. to delegate it");
  command->add_option("--token", options->tokenFile, "file of the token to exchange")
      ->required()
      ->check(CLI::ExistingFile);
  options->keys.AddTo(command, true);
  options->spec.AddTo(command);
  return {command, [options, &common] {
            const StsConnection sts(common, options->keys.Load());
            AsyncResult<TokenPointer> result;
            sts.Service().AcquireTokenByTokenAsync(sts.LoadToken(options->tokenFile), options->spec.ToTokenSpec(),
                                                   result.Callback());
            return PrintToken(result.Wait(common.Timeout()), common);
          }};
}

Command AddRenew(CLI::App& app, const CommonOptions& common) {
  struct Options {
    std::string tokenFile;
    KeyOptions keys;
    long long lifetimeSec = 600;
  };
  auto options = std::make_shared<Options>();
  CLI::App* command = app.add_subcommand("renew", "renew a renewable holder-of-key token");
  command->add_option("--token", options->tokenFile, "file of the token to renew")
      ->required()
      ->check(CLI::ExistingFile);
  options->keys.AddTo(command, true);
  command->add_option("--lifetime", options->lifetimeSec, "lifetime of the renewed token in seconds")
      ->capture_default_str()
      ->check(CLI::PositiveNumber);
  return {command, [options, &common] {
            const StsConnection sts(common, options->keys.Load());
            AsyncResult<TokenPointer> result;
            sts.Service().RenewTokenAsync(sts.LoadToken(options->tokenFile), options->lifetimeSec, result.Callback());
            return PrintToken(result.Wait(common.Timeout()), common);
          }};
}

Command AddValidateSubject(CLI::App& app, const CommonOptions& common) {
  auto tokenFile = std::make_shared<std::string>();
  CLI::App* command =
      app.add_subcommand("validate-subject", "ask the STS whether a token's subject is still valid (exit 4 if not)");
  command->add_option("--token", *tokenFile, "file of the token")->required()->check(CLI::ExistingFile);
  return {command, [tokenFile, &common] {
            const StsConnection sts(common, boost::none);
            AsyncResult<boost::optional<bool>> result;
            sts.Service().ValidateSubjectAsync(sts.LoadToken(*tokenFile), result.Callback());
            const bool valid = result.Wait(common.Timeout()).value_or(false);
            if (common.json) {
              std::cout << nlohmann::json{{"subjectValid", valid}}.dump() << std::endl;
            } else {
              std::cout << "subject valid: " << (valid ? "yes" : "no") << std::endl;
            }
            if (!valid) {
              throw CliError("InvalidSubject", EXIT_CODE_INVALID_TOKEN,
                             "the STS no longer holds the token's subject valid");
            }
            return EXIT_CODE_OK;
          }};
}

}  // namespace

std::vector<Command> AddServiceCommands(CLI::App& app, const CommonOptions& common) {
  return {AddAcquire(app, common), AddAcquireByCertificate(app, common), AddExchange(app, common),
          AddRenew(app, common), AddValidateSubject(app, common)};
}

}  // namespace Cli
