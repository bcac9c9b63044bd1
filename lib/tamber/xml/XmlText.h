#ifndef TAMBER_XML_XMLTEXT_H
#define TAMBER_XML_XMLTEXT_H

#include <string>

namespace Tamber {
namespace Xml {

// True when `text` is well-formed UTF-8 made only of characters that XML 1.0 allows (no NUL, no
// control character but tab, line feed and carriage return, no surrogate, no U+FFFE/U+FFFF).
bool IsXmlText(const std::string& text);

// Raises InvalidArgumentException naming `what` when IsXmlText(text) is false: such text could
// not be written as XML that parses back to it.
void RequireXmlText(const std::string& text, const char* what);

// True when `name` is an XML name without a colon (a prefix or a local name).
bool IsNCName(const std::string& name);

}  // namespace Xml
}  // namespace Tamber

#endif
