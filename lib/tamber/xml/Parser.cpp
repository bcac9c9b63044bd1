#include "tamber/xml/Parser.h"

#include "tamber/xml/SafeParse.h"

namespace Tamber {
namespace Xml {

namespace {

// The one kind of handler: it asks for a Document.
class DocumentHandlerImpl : public DocumentHandler {};

class XMLParserImpl : public XMLParser {
 public:
  explicit XMLParserImpl(DocumentHandler* handler) : _handler(handler) {}

  void Parse(Reader* reader, Ref<Object>& result) override {
    Ref<Document> document;
    ParseUntrustedXml(reader, document);
    result = document;
  }

 private:
  const Ref<DocumentHandler> _handler;
};

}  // namespace

void CreateXMLDocumentHandler(Ref<DocumentHandler>& handler) { handler = new DocumentHandlerImpl(); }

void CreateXMLParser(DocumentHandler* handler, Ref<XMLParser>& parser) {
  if (dynamic_cast<DocumentHandlerImpl*>(handler) == nullptr) {
    throw InvalidArgumentException("the parser needs a handler made by CreateXMLDocumentHandler");
  }
  parser = new XMLParserImpl(handler);
}

}  // namespace Xml
}  // namespace Tamber
