#ifndef TAMBER_XML_PARSER_H
#define TAMBER_XML_PARSER_H

#include "tamber/Ref.h"
#include "tamber/Stream.h"
#include "tamber/xml/Dom.h"

namespace Tamber {
namespace Xml {

// Builds the object that a parse yields (a Document). One handler serves one parser.
class TAMBER_API DocumentHandler : public Object {};

// The hardened XML parser for untrusted input. It never loads a DTD, expands an entity or touches
// the network: a document with a DOCTYPE is refused. Input size (16 MiB), nesting depth (256) and
// attributes per element (256) are bounded. Every refusal raises XMLParseException naming the
// line and what was wrong. Namespaces are resolved; whitespace and comments are kept.
class TAMBER_API XMLParser : public Object {
 public:
  // Reads the whole stream and hands back what the handler built (a Xml::Document, see
  // DynamicCast). Raises XMLParseException; `result` is written only on success.
  virtual void Parse(Reader* reader, Ref<Object>& result) = 0;
};

// A handler that builds a Document.
TAMBER_API void CreateXMLDocumentHandler(Ref<DocumentHandler>& handler);
// A hardened parser yielding what `handler` builds; a handler not made by
// CreateXMLDocumentHandler raises InvalidArgumentException.
TAMBER_API void CreateXMLParser(DocumentHandler* handler, Ref<XMLParser>& parser);

}  // namespace Xml
}  // namespace Tamber

#endif
