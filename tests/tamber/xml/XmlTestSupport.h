#ifndef TESTS_TAMBER_XML_XMLTESTSUPPORT_H
#define TESTS_TAMBER_XML_XMLTESTSUPPORT_H

// Small helpers shared by the DOM, namespace and parser suites.

#include <string>

#include "tamber/Exception.h"
#include "tamber/Ref.h"
#include "tamber/Stream.h"
#include "tamber/xml/Dom.h"
#include "tamber/xml/Parser.h"

namespace XmlTest {

inline Tamber::Ref<Tamber::Xml::Document> ParseReader(Tamber::Reader* reader) {
  Tamber::Ref<Tamber::Xml::DocumentHandler> handler;
  Tamber::Xml::CreateXMLDocumentHandler(handler);
  Tamber::Ref<Tamber::Xml::XMLParser> parser;
  Tamber::Xml::CreateXMLParser(handler.get(), parser);
  Tamber::Ref<Tamber::Object> result;
  parser->Parse(reader, result);
  return Tamber::Ref<Tamber::Xml::Document>(Tamber::DynamicCast<Tamber::Xml::Document>(result.get()));
}

inline Tamber::Ref<Tamber::Xml::Document> Parse(const std::string& text) {
  Tamber::Ref<Tamber::Reader> reader;
  Tamber::CreateStringReader(text, reader);
  return ParseReader(reader.get());
}

inline std::string Serialize(const Tamber::Xml::ElementNode* element) {
  Tamber::Ref<Tamber::StringWriter> writer;
  Tamber::CreateStringWriter(writer);
  element->Serialize(writer.get());
  return writer->GetString();
}

inline Tamber::Ref<Tamber::Xml::ElementNode> Element(const std::string& prefix, const std::string& localName) {
  Tamber::Ref<Tamber::Xml::ElementNode> element;
  Tamber::Xml::CreateElementNode(prefix, localName, element);
  return element;
}

inline Tamber::Ref<Tamber::Xml::TextNode> Text(const std::string& text) {
  Tamber::Ref<Tamber::Xml::TextNode> node;
  Tamber::Xml::CreateTextNode(text, node);
  return node;
}

}  // namespace XmlTest

#endif
