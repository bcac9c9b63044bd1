#ifndef TOOLS_CLI_DEMOCOMMAND_H
#define TOOLS_CLI_DEMOCOMMAND_H

// demo: every operation of the library against a development STS started in-process.

#include "Command.h"
#include "CommonOptions.h"

namespace Cli {

Command AddDemoCommand(CLI::App& app, const CommonOptions& common);

}  // namespace Cli

#endif
