#ifndef TAMBER_XML_SAFEPARSE_H
#define TAMBER_XML_SAFEPARSE_H

#include <cstddef>

#include "tamber/Stream.h"
#include "tamber/xml/Dom.h"

namespace Tamber {
namespace Xml {

// The bounds of what the parser accepts.
constexpr size_t kMaxDocumentBytes = 16 * 1024 * 1024;
constexpr int kMaxDepth = 256;
// Attributes of one element, namespace declarations included.
constexpr int kMaxAttributes = 256;
constexpr int kMaxNamespacesInScope = 256;

// Parses untrusted XML read from `reader` into a new document. Refuses a DOCTYPE (so no DTD,
// no entity), encodings that libxml2 does not decode itself, and input past the bounds above,
// never touching a file or the network; every refusal raises XMLParseException "XML parse error
// at line L, column C: what was wrong". An exception of the reader passes through unchanged.
void ParseUntrustedXml(Reader* reader, Ref<Document>& document);

}  // namespace Xml
}  // namespace Tamber

#endif
