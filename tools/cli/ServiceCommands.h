#ifndef TOOLS_CLI_SERVICECOMMANDS_H
#define TOOLS_CLI_SERVICECOMMANDS_H

// The subcommands that talk to the STS: acquire, acquire-by-cert, exchange, renew and
// validate-subject.

#include <vector>

#include "Command.h"
#include "CommonOptions.h"

namespace Cli {

std::vector<Command> AddServiceCommands(CLI::App& app, const CommonOptions& common);

}  // namespace Cli

#endif
