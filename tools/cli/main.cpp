// ssoclient: acquire, renew, exchange, validate and inspect single sign-on tokens from the
// command line, and demonstrate every operation against a development STS.

#include <CLI/CLI.hpp>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <iostream>
#include <string>
#include <vector>

#include "Command.h"
#include "CommonOptions.h"
#include "DemoCommand.h"
#include "ExitCodes.h"
#include "InspectCommand.h"
#include "ServiceCommands.h"
#include "ssoClient/Logger.h"

namespace {

// Checked before parsing, since a parser error would echo the value.
bool HasPasswordArgument(int argc, char** argv) {
  for (int i = 1; i < argc; ++i) {
    if (std::strcmp(argv[i], "--password") == 0 || std::strncmp(argv[i], "--password=", 11) == 0) return true;
  }
  return false;
}

// A parser error as one line. Unexpected arguments are not repeated: one may be a password.
int ReportUsageError(const CLI::ParseError& error) {
  if (dynamic_cast<const CLI::ExtrasError*>(&error) != nullptr) {
    Cli::ReportError(std::cerr, "ExtrasError",
                     "expected no further arguments, found some (see --help; passwords are never arguments)");
  } else {
    Cli::ReportError(std::cerr, error.get_name(), error.what());
  }
  return Cli::EXIT_CODE_USAGE;
}

int Run(const Cli::Command& command) {
  try {
    return command.run();
  } catch (const Cli::TimeoutError& error) {
    Cli::ReportException(std::cerr, error);
    // The operation still runs on a worker thread: end without destroying what it uses.
    std::cout.flush();
    std::_Exit(error.GetCode());
  } catch (const std::exception& error) {
    return Cli::ReportException(std::cerr, error);
  }
}

}  // namespace

int main(int argc, char** argv) {
  CLI::App app("Acquires, renews, exchanges, validates and inspects single sign-on tokens.", "ssoclient");
  app.require_subcommand(1);
  app.fallthrough();
  app.footer(Cli::EXIT_CODES_HELP);
  Cli::CommonOptions common;
  Cli::AddCommonOptions(app, common);
  std::vector<Cli::Command> commands = Cli::AddServiceCommands(app, common);
  commands.push_back(Cli::AddInspectCommand(app, common));
  commands.push_back(Cli::AddDemoCommand(app, common));

  if (HasPasswordArgument(argc, argv)) {
    Cli::ReportError(std::cerr, "UsageError",
                     "expected the password on a prompt, standard input or --password-file, found --password: "
                     "passwords are never taken as arguments");
    return Cli::EXIT_CODE_USAGE;
  }
  try {
    app.parse(argc, argv);
  } catch (const CLI::ParseError& error) {
    if (error.get_exit_code() == static_cast<int>(CLI::ExitCodes::Success)) return app.exit(error);
    return ReportUsageError(error);
  }

  if (common.verbose) SsoClient::getLogger()->SetLevel(Tamber::Service::LOG_TRACE);
  for (const Cli::Command& command : commands) {
    if (command.app->parsed()) return Run(command);
  }
  return Cli::EXIT_CODE_USAGE;
}
