#ifndef TOOLS_CLI_TOKENFACTS_H
#define TOOLS_CLI_TOKENFACTS_H

// What a relying party learns from a validated token, as text for people and as JSON for
// scripts. Never the token's XML or its signature.

#include <nlohmann/json.hpp>
#include <ostream>
#include <string>

#include "ssoClient/SamlToken.h"

namespace Cli {

// The facts that tell tokens apart, on one line: subject, groups, validity, confirmation and
// delegation chain.
std::string TokenSummary(const SsoClient::SamlToken& token);
nlohmann::json TokenFactsJson(const SsoClient::SamlToken& token);
// One "label: value" line per fact.
void WriteTokenFacts(std::ostream& out, const SsoClient::SamlToken& token, const std::string& indent = "");

}  // namespace Cli

#endif
