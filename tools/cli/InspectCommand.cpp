#include "InspectCommand.h"

#include <iostream>
#include <memory>
#include <string>

#include "ExitCodes.h"
#include "InputFiles.h"
#include "TokenFacts.h"

namespace Cli {

Command AddInspectCommand(CLI::App& app, const CommonOptions& common) {
  struct Options {
    std::string tokenFile;
    long long clockToleranceSec = 600;
  };
  auto options = std::make_shared<Options>();
  CLI::App* command = app.add_subcommand(
      "inspect", "validate a token file offline against --sts-cert and print what it says (exit 4 if invalid)");
  command->add_option("--token", options->tokenFile, "file of the token")->required()->check(CLI::ExistingFile);
  command->add_option("--clock-tolerance", options->clockToleranceSec, "allowed clock skew in seconds")
      ->capture_default_str()
      ->check(CLI::NonNegativeNumber);
  return {command, [options, &common] {
            if (common.stsCertificateFiles.empty()) {
              throw CliError("UsageError", EXIT_CODE_USAGE,
                             "expected --sts-cert FILE (a trusted token signing certificate), found none");
            }
            const boost::shared_ptr<const SsoClient::SamlToken> token =
                SsoClient::CreateSamlToken(ReadTextFile(options->tokenFile),
                                           LoadCertificates(common.stsCertificateFiles), options->clockToleranceSec);
            if (common.json) {
              std::cout << TokenFactsJson(*token).dump(2) << std::endl;
            } else {
              WriteTokenFacts(std::cout, *token);
            }
            return EXIT_CODE_OK;
          }};
}

}  // namespace Cli
