#include <cstring>
#include <exception>

#include <libxml/xmlsave.h>

#include "tamber/xml/LibXml.h"
#include "tamber/xml/Namespace.h"
#include "tamber/xml/NodeImpl.h"
#include "tamber/xml/XmlText.h"

namespace Tamber {
namespace Xml {

namespace {

const xmlChar* AsXml(const std::string& text) { return reinterpret_cast<const xmlChar*>(text.c_str()); }
const char* AsChars(const xmlChar* text) { return reinterpret_cast<const char*>(text); }

const std::string kXmlnsPrefix = "xmlns:";

bool IsDeclarationName(const std::string& name) { return name == "xmlns" || name.compare(0, 6, kXmlnsPrefix) == 0; }

std::string AttributeValue(xmlAttrPtr attribute) {
  xmlNodePtr text = attribute->children;
  if (text != nullptr && text->next == nullptr && text->type == XML_TEXT_NODE) {
    return text->content != nullptr ? AsChars(text->content) : "";
  }
  xmlChar* content = xmlNodeGetContent(reinterpret_cast<xmlNodePtr>(attribute));
  std::string value = content != nullptr ? AsChars(content) : "";
  xmlFree(content);
  return value;
}

bool MatchesQName(xmlNodePtr node, const QName& name) {
  // A name whose prefix is unbound belongs to no namespace that a QName could name.
  if (IsUnbound(node)) return false;
  return LocalNameOf(node) == name.GetLocalName() && NamespaceOf(node) == name.GetNamespace();
}

// Gathers what the serialiser writes and hands it to the Writer; a Writer's exception is kept
// until libxml2 has returned.
struct SerializeSink {
  Writer* writer;
  std::exception_ptr failure;

  static int Write(void* context, const char* data, int length) {
    auto* sink = static_cast<SerializeSink*>(context);
    try {
      sink->writer->Write(data, static_cast<size_t>(length));
      return length;
    } catch (...) {
      sink->failure = std::current_exception();
      return -1;
    }
  }
};

}  // namespace

std::string ElementNodeImpl::GetLocalName() const { return LocalNameOf(_node); }

std::string ElementNodeImpl::GetPrefix() const { return PrefixOf(_node); }

std::string ElementNodeImpl::GetNamespaceURI() const { return NamespaceOf(_node); }

bool ElementNodeImpl::LookupNamespace(const std::string& prefix, std::string& namespaceUri) const {
  if (prefix == "xml") {
    namespaceUri = AsChars(XML_XML_NAMESPACE);
    return true;
  }
  // Walked by hand: xmlSearchNs may add the "xml" declaration to the document, and this is a
  // reading call.
  for (xmlNodePtr element = _node; element != nullptr && element->type == XML_ELEMENT_NODE;
       element = element->parent) {
    for (xmlNsPtr ns = element->nsDef; ns != nullptr; ns = ns->next) {
      const bool samePrefix = ns->prefix == nullptr ? prefix.empty() : prefix == AsChars(ns->prefix);
      if (!samePrefix) continue;
      if (ns->href == nullptr || ns->href[0] == 0) return false;
      namespaceUri = AsChars(ns->href);
      return true;
    }
  }
  return false;
}

bool ElementNodeImpl::GetAttribute(const std::string& qualifiedName, std::string& value) const {
  if (IsDeclarationName(qualifiedName)) {
    const std::string prefix = qualifiedName == "xmlns" ? "" : qualifiedName.substr(kXmlnsPrefix.size());
    for (xmlNsPtr ns = _node->nsDef; ns != nullptr; ns = ns->next) {
      if (ns->prefix == nullptr ? prefix.empty() : prefix == AsChars(ns->prefix)) {
        value = ns->href != nullptr ? AsChars(ns->href) : "";
        return true;
      }
    }
    return false;
  }
  for (xmlAttrPtr attribute = _node->properties; attribute != nullptr; attribute = attribute->next) {
    if (QualifiedNameOf(reinterpret_cast<xmlNodePtr>(attribute)) == qualifiedName) {
      value = AttributeValue(attribute);
      return true;
    }
  }
  return false;
}

bool ElementNodeImpl::GetAttribute(const QName& name, std::string& value) const {
  for (xmlAttrPtr attribute = _node->properties; attribute != nullptr; attribute = attribute->next) {
    if (MatchesQName(reinterpret_cast<xmlNodePtr>(attribute), name)) {
      value = AttributeValue(attribute);
      return true;
    }
  }
  return false;
}

std::vector<std::string> ElementNodeImpl::GetAttributeNames() const {
  std::vector<std::string> names;
  for (xmlAttrPtr attribute = _node->properties; attribute != nullptr; attribute = attribute->next) {
    names.push_back(QualifiedNameOf(reinterpret_cast<xmlNodePtr>(attribute)));
  }
  for (xmlNsPtr ns = _node->nsDef; ns != nullptr; ns = ns->next) {
    names.push_back(ns->prefix != nullptr ? kXmlnsPrefix + AsChars(ns->prefix) : "xmlns");
  }
  return names;
}

void ElementNodeImpl::SetAttribute(const std::string& qualifiedName, const std::string& value) {
  RequireXmlText(value, ("the value of attribute '" + qualifiedName + "'").c_str());
  if (qualifiedName == "xmlns") {
    SetNamespaceDeclaration(nullptr, value);
    return;
  }
  if (qualifiedName.compare(0, kXmlnsPrefix.size(), kXmlnsPrefix) == 0) {
    const std::string prefix = qualifiedName.substr(kXmlnsPrefix.size());
    if (!IsNCName(prefix) || prefix == "xml" || prefix == "xmlns") {
      throw InvalidArgumentException("'" + qualifiedName + "' is not a namespace declaration that can be made");
    }
    if (value.empty()) {
      throw InvalidArgumentException("the prefix '" + prefix + "' cannot be bound to an empty namespace");
    }
    SetNamespaceDeclaration(AsXml(prefix), value);
    return;
  }
  const size_t colon = qualifiedName.find(':');
  const std::string prefix = colon == std::string::npos ? "" : qualifiedName.substr(0, colon);
  const std::string localName = colon == std::string::npos ? qualifiedName : qualifiedName.substr(colon + 1);
  if ((colon != std::string::npos && !IsNCName(prefix)) || !IsNCName(localName)) {
    throw InvalidArgumentException("'" + qualifiedName + "' is not a valid attribute name");
  }
  xmlNsPtr ns = prefix.empty() ? nullptr : xmlSearchNs(_node->doc, _node, AsXml(prefix));
  // Without a declaration in scope yet, the attribute keeps its whole name until one appears.
  const std::string& storedName = ns != nullptr || prefix.empty() ? localName : qualifiedName;
  xmlAttrPtr attribute = xmlSetNsProp(_node, ns, AsXml(storedName), AsXml(value));
  if (attribute == nullptr) throw std::bad_alloc();
}

void ElementNodeImpl::SetNamespaceDeclaration(const xmlChar* prefix, const std::string& uri) {
  xmlNsPtr declaration = nullptr;
  for (xmlNsPtr ns = _node->nsDef; ns != nullptr; ns = ns->next) {
    if (ns->prefix == prefix || (ns->prefix != nullptr && prefix != nullptr && xmlStrEqual(ns->prefix, prefix))) {
      declaration = ns;
      break;
    }
  }
  if (declaration != nullptr) {
    xmlChar* href = xmlStrdup(AsXml(uri));
    if (href == nullptr) throw std::bad_alloc();
    xmlFree(const_cast<xmlChar*>(declaration->href));
    declaration->href = href;
  } else if (xmlNewNs(_node, AsXml(uri), prefix) == nullptr) {
    throw std::bad_alloc();
  }
  RebindPrefix(_node, prefix);
}

ElementNode* ElementNodeImpl::FindChildElement(const QName& name) const {
  for (xmlNodePtr child = _node->children; child != nullptr; child = child->next) {
    if (child->type == XML_ELEMENT_NODE && MatchesQName(child, name)) return WrapXmlElement(child);
  }
  return nullptr;
}

ElementNode* ElementNodeImpl::FindChildElementByLocalName(const std::string& localName) const {
  for (xmlNodePtr child = _node->children; child != nullptr; child = child->next) {
    if (child->type == XML_ELEMENT_NODE && LocalNameOf(child) == localName) return WrapXmlElement(child);
  }
  return nullptr;
}

void ElementNodeImpl::AppendChild(Node* child) {
  xmlNodePtr node = ToXmlNode(child);
  if (node == nullptr) throw InvalidArgumentException("the child to append is not a node of a tree");
  switch (node->type) {
    case XML_ELEMENT_NODE:
    case XML_TEXT_NODE:
    case XML_CDATA_SECTION_NODE:
    case XML_COMMENT_NODE:
    case XML_PI_NODE:
      break;
    default:
      throw InvalidArgumentException("only elements, text, comments and processing instructions can be appended");
  }
  for (xmlNodePtr ancestor = _node; ancestor != nullptr; ancestor = ancestor->parent) {
    if (ancestor == node) throw InvalidArgumentException("an element cannot be appended to itself or its descendants");
  }
  DocumentImpl* source = TreeOf(node);
  if (!source->TakeLooseNode(node)) xmlUnlinkNode(node);
  MoveSubtree(node, TreeOf(_node), _node);
  if (node->type == XML_ELEMENT_NODE) BindUnboundNames(node);
}

void ElementNodeImpl::Serialize(Writer* writer) const {
  if (writer == nullptr) throw InvalidArgumentException("the writer is null");
  SerializeSink sink{writer, nullptr};
  xmlOutputBufferPtr output = xmlOutputBufferCreateIO(&SerializeSink::Write, nullptr, &sink, nullptr);
  if (output == nullptr) throw std::bad_alloc();
  int result;
  {
    ScopedXmlErrorCapture quiet;
    xmlNodeDumpOutput(output, _node->doc, _node, 0, 0, nullptr);
    result = xmlOutputBufferClose(output);
  }
  if (sink.failure) std::rethrow_exception(sink.failure);
  if (result < 0) throw IOException("serialising the element failed");
}

}  // namespace Xml
}  // namespace Tamber
