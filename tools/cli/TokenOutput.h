#ifndef TOOLS_CLI_TOKENOUTPUT_H
#define TOOLS_CLI_TOKENOUTPUT_H

#include <ostream>

#include "CommonOptions.h"
#include "ssoClient/SamlToken.h"

namespace Cli {

// Hands a token to the user. With --out the XML goes to that file (readable by the owner only)
// and the facts to `out`; without it `out` receives the XML alone, or with --json one object
// holding the facts and the XML.
void WriteTokenResult(const SsoClient::SamlToken& token, const CommonOptions& options, std::ostream& out);

}  // namespace Cli

#endif
