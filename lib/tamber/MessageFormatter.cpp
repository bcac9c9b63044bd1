#include "tamber/MessageFormatter.h"

namespace Tamber {
namespace MessageFormatter {

std::string ASPrintArray(const char* format, const PrintFormatter* const* arguments, size_t count) {
  std::string result;
  if (format == nullptr) return result;
  for (const char* p = format; *p != '\0'; ++p) {
    if (*p != '%') {
      result += *p;
      continue;
    }
    const char next = p[1];
    if (next == '%') {
      result += "%%";
      ++p;
    } else if (next >= '1' && next <= '9' && static_cast<size_t>(next - '1') < count) {
      result += arguments[next - '1']->GetText();
      ++p;
    } else {
      result += '%';
    }
  }
  return result;
}

}  // namespace MessageFormatter
}  // namespace Tamber
