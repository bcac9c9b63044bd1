#ifndef TOOLS_CLI_COMMAND_H
#define TOOLS_CLI_COMMAND_H

#include <CLI/CLI.hpp>
#include <functional>

namespace Cli {

// A subcommand and what runs when it was chosen; `run` returns the exit code or throws.
struct Command {
  CLI::App* app;
  std::function<int()> run;
};

}  // namespace Cli

#endif
