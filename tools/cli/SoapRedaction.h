#ifndef TOOLS_CLI_SOAPREDACTION_H
#define TOOLS_CLI_SOAPREDACTION_H

#include <string>

namespace Cli {

// `soap` with the text of every password, signature value and SPNEGO leg replaced by
// "[redacted]", whatever the prefix: what a dump must not show, since each is a secret or
// makes a captured message replayable.
std::string RedactSoap(const std::string& soap);

}  // namespace Cli

#endif
