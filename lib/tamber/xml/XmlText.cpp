#include "tamber/xml/XmlText.h"

#include <libxml/tree.h>

#include "tamber/Exception.h"

namespace Tamber {
namespace Xml {

namespace {

bool IsXmlChar(unsigned long c) {
  return c == 0x9 || c == 0xA || c == 0xD || (c >= 0x20 && c <= 0xD7FF) || (c >= 0xE000 && c <= 0xFFFD) ||
         (c >= 0x10000 && c <= 0x10FFFF);
}

}  // namespace

bool IsXmlText(const std::string& text) {
  const auto* p = reinterpret_cast<const unsigned char*>(text.data());
  const auto* end = p + text.size();
  while (p < end) {
    const unsigned char lead = *p;
    if (lead < 0x80) {
      if (!IsXmlChar(lead)) return false;
      ++p;
      continue;
    }
    int length;
    unsigned long c;
    unsigned long minimum;
    if ((lead & 0xE0) == 0xC0) {
      length = 2, c = lead & 0x1F, minimum = 0x80;
    } else if ((lead & 0xF0) == 0xE0) {
      length = 3, c = lead & 0x0F, minimum = 0x800;
    } else if ((lead & 0xF8) == 0xF0) {
      length = 4, c = lead & 0x07, minimum = 0x10000;
    } else {
      return false;
    }
    if (end - p < length) return false;
    for (int i = 1; i < length; ++i) {
      if ((p[i] & 0xC0) != 0x80) return false;
      c = (c << 6) | (p[i] & 0x3F);
    }
    // Overlong forms and surrogates are not UTF-8.
    if (c < minimum || !IsXmlChar(c)) return false;
    p += length;
  }
  return true;
}

void RequireXmlText(const std::string& text, const char* what) {
  if (!IsXmlText(text)) {
    throw InvalidArgumentException(std::string(what) +
                                   " is not UTF-8 text made of characters that XML allows");
  }
}

bool IsNCName(const std::string& name) {
  return !name.empty() && name.find('\0') == std::string::npos &&
         xmlValidateNCName(reinterpret_cast<const xmlChar*>(name.c_str()), 0) == 0;
}

}  // namespace Xml
}  // namespace Tamber
