#ifndef TOOLS_CLI_PASSWORDINPUT_H
#define TOOLS_CLI_PASSWORDINPUT_H

#include <string>

namespace Cli {

// The password of `user`: the first line of `passwordFile` when one is named, else a prompt
// without echo when stdin is a terminal, else the first line of stdin. Never an argument, so
// that it shows neither in the process list nor in the shell history.
std::string ReadPassword(const std::string& user, const std::string& passwordFile);

}  // namespace Cli

#endif
