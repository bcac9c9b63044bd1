#include "tamber/xml/security/Ids.h"

#include "tamber/xml/TreeWalk.h"
#include "tamber/xml/security/Signature.h"

namespace Tamber {
namespace Xml {
namespace Security {

bool IsIdAttribute(xmlAttrPtr attribute) {
  return xmlStrEqual(attribute->name, BAD_CAST "ID") || xmlStrEqual(attribute->name, BAD_CAST "Id") ||
         xmlStrEqual(attribute->name, BAD_CAST "id");
}

xmlAttrPtr FindIdAttribute(xmlNodePtr element) {
  for (xmlAttrPtr attribute = element->properties; attribute != nullptr; attribute = attribute->next) {
    if (IsIdAttribute(attribute)) return attribute;
  }
  return nullptr;
}

std::string GetAttributeValue(xmlAttrPtr attribute) {
  // The parser leaves one text child; anything else is joined by libxml2.
  xmlNodePtr child = attribute->children;
  if (child != nullptr && child->next == nullptr && child->type == XML_TEXT_NODE) {
    return child->content != nullptr ? reinterpret_cast<const char*>(child->content) : "";
  }
  xmlChar* value = xmlNodeListGetString(attribute->doc, child, 1);
  std::string text = value != nullptr ? reinterpret_cast<const char*>(value) : "";
  xmlFree(value);
  return text;
}

std::vector<xmlAttrPtr> FindIdAttributes(xmlNodePtr root, const std::string& id) {
  std::vector<xmlAttrPtr> found;
  ForEachInSubtree(root, [&found, &id](xmlNodePtr node) {
    if (node->type != XML_ELEMENT_NODE) return;
    for (xmlAttrPtr attribute = node->properties; attribute != nullptr; attribute = attribute->next) {
      if (IsIdAttribute(attribute) && GetAttributeValue(attribute) == id) found.push_back(attribute);
    }
  });
  return found;
}

}  // namespace Security
}  // namespace Xml
}  // namespace Tamber
