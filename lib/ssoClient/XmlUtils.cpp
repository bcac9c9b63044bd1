#include "ssoClient/XmlUtils.h"

#include <iomanip>
#include <sstream>

#include "ssoClient/Exceptions.h"
#include "tamber/Exception.h"
#include "tamber/xml/Parser.h"

namespace SsoClient {

using Tamber::Xml::ElementNode;
using Tamber::Xml::Node;
using Tamber::Xml::TextNode;

namespace {

const char XML_WHITESPACE[] = "\t\n\r ";
const int64_t MICROSECONDS_PER_MINUTE = 60 * 1000 * 1000;

}  // namespace

bool SkipWsAndCommentsFilter::Accept(Node* node) const {
  switch (node->GetKind()) {
    case Node::TEXT:
      return Tamber::DynamicCast<TextNode>(node)->GetText().find_first_not_of(XML_WHITESPACE) !=
             std::string::npos;
    case Node::COMMENT:
      return false;
    default:
      return true;
  }
}

// Both moves stay at the end once there: a reader that runs past the last child then finds
// nothing instead of dereferencing null.
NodeFilterIterator& NodeFilterIterator::MoveToSibling() {
  if (_node == nullptr) return *this;
  do {
    _node = _node->GetNextSibling();
  } while (_node != nullptr && !_filter->Accept(_node));
  return *this;
}

NodeFilterIterator& NodeFilterIterator::MoveToChild() {
  if (_node == nullptr) return *this;
  _node = _node->GetFirstChild();
  if (_node != nullptr && !_filter->Accept(_node)) MoveToSibling();
  return *this;
}

NodeFilterIterator NodeFilterIterator::GetChild() const {
  NodeFilterIterator child(*this);
  child.MoveToChild();
  return child;
}

ElementNode* IteratorToElement(const NodeFilterIterator& it) {
  Node* node = it.GetNode();
  if (node == nullptr || node->GetKind() != Node::ELEMENT) return nullptr;
  return Tamber::DynamicCast<ElementNode>(node);
}

void ParseXML(Tamber::Reader* reader, Tamber::Ref<Tamber::Xml::Document>& doc) {
  Tamber::Ref<Tamber::Xml::DocumentHandler> handler;
  Tamber::Xml::CreateXMLDocumentHandler(handler);
  Tamber::Ref<Tamber::Xml::XMLParser> parser;
  Tamber::Xml::CreateXMLParser(handler.get(), parser);

  Tamber::Ref<Tamber::Object> result;
  parser->Parse(reader, result);
  // Cast before storing, so that `doc` is untouched when the parser yields something else.
  Tamber::Ref<Tamber::Xml::Document> parsed(Tamber::DynamicCast<Tamber::Xml::Document>(result.get()));
  doc.swap(parsed);
}

void ParseXML(const std::string& text, Tamber::Ref<Tamber::Xml::Document>& doc) {
  Tamber::Ref<Tamber::Reader> reader;
  Tamber::CreateStringReader(text, reader);
  ParseXML(reader.get(), doc);
}

TextNode* GetTextNode(const Node* node) {
  if (node == nullptr) return nullptr;
  Node* child = node->GetFirstChild();
  if (child == nullptr || child->GetKind() != Node::TEXT) return nullptr;
  return Tamber::DynamicCast<TextNode>(child);
}

std::string GetText(const TextNode* node) { return node == nullptr ? std::string() : node->GetText(); }

void ResolveQName(const ElementNode* element, const std::string& name, const std::string& defaultNamespace,
                  Tamber::Xml::QName& result) {
  const std::string::size_type colon = name.find(':');
  if (colon == std::string::npos) {
    result = Tamber::Xml::QName(defaultNamespace, name);
    return;
  }

  const std::string prefix = name.substr(0, colon);
  std::string namespaceUri;
  // An empty prefix (":name") is not a qualified name; the core lookup would answer the default
  // namespace for it, so it is refused here like any unbound prefix.
  if (prefix.empty() || !element->LookupNamespace(prefix, namespaceUri)) {
    throw ParseException("Element " + element->GetLocalName() + "at " + std::to_string(element->GetLine()) +
                         "," + std::to_string(element->GetColumn()) + " uses undefined prefix: `" + prefix +
                         "'");
  }
  result = Tamber::Xml::QName(namespaceUri, name.substr(colon + 1));
}

std::string DateTimeFormatter(Tamber::System::DateTime date) {
  std::ostringstream out;
  out << std::setfill('0');
  out << std::setw(4) << date.GetCentury() * 100 + date.GetYearOfCentury() << '-';
  out << std::setw(2) << date.GetMonth() << '-';
  out << std::setw(2) << date.GetDay() << 'T';
  out << std::setw(2) << date.GetHour() << ':';
  out << std::setw(2) << date.GetMinute() << ':';
  out << std::setw(2) << date.GetSecond() << '.';
  out << std::setw(3) << date.GetMillisecond();
  out << date.ToShortStringBias();
  return out.str();
}

Tamber::System::DateTime AddMinutesToDate(Tamber::System::DateTime date, int minutes) {
  // 64-bit product: even INT_MIN or INT_MAX minutes stay far inside int64_t.
  const int64_t shift = static_cast<int64_t>(minutes) * MICROSECONDS_PER_MINUTE;
  return Tamber::System::DateTimeFromUtc(date.GetUtcTime() + shift, false);
}

}  // namespace SsoClient
