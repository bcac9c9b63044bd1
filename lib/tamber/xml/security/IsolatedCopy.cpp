#include "tamber/xml/security/IsolatedCopy.h"

#include <vector>

#include "tamber/xml/security/Ids.h"
#include "tamber/xml/security/Signature.h"

namespace Tamber {
namespace Xml {
namespace Security {

namespace {

bool DeclaresPrefix(xmlNodePtr element, const xmlChar* prefix) {
  for (xmlNsPtr ns = element->nsDef; ns != nullptr; ns = ns->next) {
    if (xmlStrEqual(ns->prefix, prefix)) return true;
  }
  return false;
}

void DeclareNamespacesInScope(xmlNodePtr original, xmlNodePtr copy) {
  xmlNsPtr* inScope = xmlGetNsList(original->doc, original);
  if (inScope == nullptr) return;
  for (xmlNsPtr* ns = inScope; *ns != nullptr; ++ns) {
    if (!DeclaresPrefix(copy, (*ns)->prefix)) xmlNewNs(copy, (*ns)->href, (*ns)->prefix);
  }
  xmlFree(inScope);
}

void InheritXmlAttributes(xmlNodePtr original, xmlNodePtr copy) {
  for (xmlNodePtr ancestor = original->parent; ancestor != nullptr && ancestor->type == XML_ELEMENT_NODE;
       ancestor = ancestor->parent) {
    for (xmlAttrPtr attribute = ancestor->properties; attribute != nullptr; attribute = attribute->next) {
      if (attribute->ns == nullptr || !xmlStrEqual(attribute->ns->href, XML_XML_NAMESPACE)) continue;
      if (xmlHasNsProp(copy, attribute->name, XML_XML_NAMESPACE) != nullptr) continue;  // the nearest wins
      xmlNsPtr xmlNamespace = xmlSearchNsByHref(copy->doc, copy, XML_XML_NAMESPACE);
      xmlSetNsProp(copy, xmlNamespace, attribute->name, BAD_CAST GetAttributeValue(attribute).c_str());
    }
  }
}

// The positions of `inner` below `element`, child index by child index from the top.
std::vector<size_t> PathTo(xmlNodePtr element, xmlNodePtr inner) {
  std::vector<size_t> path;
  for (xmlNodePtr node = inner; node != element; node = node->parent) {
    if (node == nullptr) throw XmlSecurityException("ds:Signature is not inside the signed element");
    size_t index = 0;
    for (xmlNodePtr sibling = node->prev; sibling != nullptr; sibling = sibling->prev) ++index;
    path.insert(path.begin(), index);
  }
  return path;
}

xmlNodePtr Follow(xmlNodePtr node, const std::vector<size_t>& path) {
  for (size_t index : path) {
    node = node->children;
    for (size_t i = 0; i < index; ++i) node = node->next;
  }
  return node;
}

}  // namespace

IsolatedCopy::IsolatedCopy(xmlNodePtr element, xmlNodePtr inner, bool inheritXmlAttributes)
    : _doc(xmlNewDoc(BAD_CAST "1.0")) {
  std::vector<size_t> path = PathTo(element, inner);
  if (!_doc) throw XmlSecurityException("The signed element cannot be copied: out of memory");
  xmlNodePtr root = xmlDocCopyNode(element, _doc.get(), 1);
  if (root == nullptr) throw XmlSecurityException("The signed element cannot be copied: out of memory");
  xmlDocSetRootElement(_doc.get(), root);
  DeclareNamespacesInScope(element, root);
  if (inheritXmlAttributes) InheritXmlAttributes(element, root);
  _inner = Follow(root, path);
}

}  // namespace Security
}  // namespace Xml
}  // namespace Tamber
