#ifndef TOOLS_CLI_COMMONOPTIONS_H
#define TOOLS_CLI_COMMONOPTIONS_H

// The options every subcommand understands, given before or after the subcommand's name.

#include <CLI/CLI.hpp>
#include <chrono>
#include <string>
#include <vector>

namespace Cli {

struct CommonOptions {
  std::string stsUrl;
  std::string caFile;
  std::string pin;
  std::vector<std::string> stsCertificateFiles;
  double timeoutSec = 240;
  bool verbose = false;
  bool dumpSoap = false;
  bool json = false;
  std::string outFile;

  std::chrono::milliseconds Timeout() const;
};

void AddCommonOptions(CLI::App& app, CommonOptions& options);

}  // namespace Cli

#endif
