#include "tamber/xml/Dom.h"

#include <new>

#include "tamber/xml/LibXml.h"
#include "tamber/xml/NodeImpl.h"
#include "tamber/xml/XmlText.h"

namespace Tamber {
namespace Xml {

namespace {

xmlDocPtr NewDocument() {
  EnsureLibXmlInitialized();
  xmlDocPtr doc = xmlNewDoc(reinterpret_cast<const xmlChar*>("1.0"));
  if (doc == nullptr) throw std::bad_alloc();
  return doc;
}

}  // namespace

void CreateElementNode(const std::string& prefix, const std::string& localName, Ref<ElementNode>& element) {
  if (!IsNCName(localName) || (!prefix.empty() && (!IsNCName(prefix) || prefix == "xmlns"))) {
    throw InvalidArgumentException("'" + (prefix.empty() ? localName : prefix + ":" + localName) +
                                   "' is not a valid element name");
  }
  const std::string name = prefix.empty() ? localName : prefix + ":" + localName;
  xmlDocPtr doc = NewDocument();
  auto* tree = new DocumentImpl(doc);
  // Named "prefix:localName" with no namespace until a declaration of the prefix is in scope.
  xmlNodePtr node = xmlNewDocNode(doc, nullptr, reinterpret_cast<const xmlChar*>(name.c_str()), nullptr);
  if (node == nullptr) {
    Ref<Document> release(tree);
    throw std::bad_alloc();
  }
  LinkAsLastChild(reinterpret_cast<xmlNodePtr>(doc), node);
  element = WrapXmlElement(node);
}

void CreateTextNode(const std::string& text, Ref<TextNode>& node) {
  RequireXmlText(text, "the text");
  xmlDocPtr doc = NewDocument();
  auto* tree = new DocumentImpl(doc);
  xmlNodePtr textNode = xmlNewDocTextLen(doc, reinterpret_cast<const xmlChar*>(text.data()),
                                         static_cast<int>(text.size()));
  if (textNode == nullptr) {
    Ref<Document> release(tree);
    throw std::bad_alloc();
  }
  tree->AddLooseNode(textNode);
  node = static_cast<TextNodeImpl*>(WrapXmlNode(textNode));
}

}  // namespace Xml
}  // namespace Tamber
