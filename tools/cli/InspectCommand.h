#ifndef TOOLS_CLI_INSPECTCOMMAND_H
#define TOOLS_CLI_INSPECTCOMMAND_H

// inspect: a relying party's offline check of a token file against trusted signers.

#include "Command.h"
#include "CommonOptions.h"

namespace Cli {

Command AddInspectCommand(CLI::App& app, const CommonOptions& common);

}  // namespace Cli

#endif
