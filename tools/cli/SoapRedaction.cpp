#include "SoapRedaction.h"

#include <regex>

namespace Cli {

std::string RedactSoap(const std::string& soap) {
  // Element text cannot hold '<' (it is escaped), so "up to the next tag" is the whole value.
  static const std::regex secretElement(
      R"((<(?:[A-Za-z_][-.\w]*:)?(?:Password|SignatureValue|BinaryExchange)(?:\s[^>]*[^/>])?\s*>)[^<]*)");
  return std::regex_replace(soap, secretElement, "$1[redacted]");
}

}  // namespace Cli
