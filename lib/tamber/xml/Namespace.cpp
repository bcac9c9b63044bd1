#include "tamber/xml/Namespace.h"

#include <cstring>

#include "tamber/xml/TreeWalk.h"

namespace Tamber {
namespace Xml {

namespace {

const char* AsChars(const xmlChar* text) { return reinterpret_cast<const char*>(text); }

// The colon of an unbound "p:local" name, or null.
const xmlChar* PendingColon(xmlNodePtr node) {
  if (node->ns != nullptr || node->name == nullptr) return nullptr;
  return xmlStrchr(node->name, ':');
}

bool SamePrefix(const xmlChar* a, const xmlChar* b) { return a == b || (a && b && xmlStrEqual(a, b)); }

// The declaration that binds `prefix` at `element`; for the default namespace, an undeclaring
// xmlns="" counts as no namespace.
xmlNsPtr FindDeclaration(xmlNodePtr element, const xmlChar* prefix) {
  xmlNsPtr ns = xmlSearchNs(element->doc, element, prefix);
  if (ns != nullptr && ns->prefix == nullptr && (ns->href == nullptr || ns->href[0] == 0)) return nullptr;
  return ns;
}

// Binds an unbound "p:local" node to `ns`: the name becomes "local".
void BindPending(xmlNodePtr node, const xmlChar* colon, xmlNsPtr ns) {
  node->ns = ns;
  xmlNodeSetName(node, colon + 1);
}

// Binds a node whose prefix is `prefix` anew (see RebindPrefix).
void Rebind(xmlNodePtr node, const xmlChar* prefix, xmlNodePtr scope) {
  const xmlChar* colon = PendingColon(node);
  if (colon != nullptr) {
    const std::string pending(AsChars(node->name), colon - node->name);
    if (prefix == nullptr || pending != AsChars(prefix)) return;
    xmlNsPtr ns = FindDeclaration(scope, prefix);
    if (ns != nullptr) BindPending(node, colon, ns);
    return;
  }
  const xmlChar* current = node->ns != nullptr ? node->ns->prefix : nullptr;
  if (!SamePrefix(current, prefix)) return;
  // Unprefixed attributes never take the default namespace.
  if (prefix == nullptr && node->type == XML_ATTRIBUTE_NODE) return;
  node->ns = FindDeclaration(scope, prefix);
}

}  // namespace

std::string PrefixOf(xmlNodePtr node) {
  if (node->ns != nullptr) return node->ns->prefix ? AsChars(node->ns->prefix) : "";
  const xmlChar* colon = PendingColon(node);
  return colon ? std::string(AsChars(node->name), colon - node->name) : std::string();
}

std::string LocalNameOf(xmlNodePtr node) {
  const xmlChar* colon = PendingColon(node);
  return AsChars(colon ? colon + 1 : node->name);
}

std::string NamespaceOf(xmlNodePtr node) {
  return node->ns != nullptr && node->ns->href != nullptr ? AsChars(node->ns->href) : "";
}

bool IsUnbound(xmlNodePtr node) { return PendingColon(node) != nullptr; }

std::string QualifiedNameOf(xmlNodePtr node) {
  if (node->ns != nullptr && node->ns->prefix != nullptr) {
    return std::string(AsChars(node->ns->prefix)) + ":" + AsChars(node->name);
  }
  return AsChars(node->name);
}

void RebindPrefix(xmlNodePtr root, const xmlChar* prefix) {
  ForEachInSubtree(root, [prefix](xmlNodePtr node) {
    if (node->type != XML_ELEMENT_NODE) return;
    Rebind(node, prefix, node);
    for (xmlAttrPtr attribute = node->properties; attribute != nullptr; attribute = attribute->next) {
      Rebind(reinterpret_cast<xmlNodePtr>(attribute), prefix, node);
    }
  });
}

void BindUnboundNames(xmlNodePtr root) {
  ForEachInSubtree(root, [](xmlNodePtr node) {
    if (node->type != XML_ELEMENT_NODE) return;
    if (node->ns == nullptr) {
      const xmlChar* colon = PendingColon(node);
      if (colon == nullptr) {
        // Written only when something changes: parsed trees are read by several threads at once.
        if (xmlNsPtr ns = FindDeclaration(node, nullptr)) node->ns = ns;
      } else {
        const std::string prefix(AsChars(node->name), colon - node->name);
        xmlNsPtr ns = FindDeclaration(node, reinterpret_cast<const xmlChar*>(prefix.c_str()));
        if (ns != nullptr) BindPending(node, colon, ns);
      }
    }
    for (xmlAttrPtr attribute = node->properties; attribute != nullptr; attribute = attribute->next) {
      auto* attributeNode = reinterpret_cast<xmlNodePtr>(attribute);
      const xmlChar* colon = PendingColon(attributeNode);
      if (colon == nullptr) continue;
      const std::string prefix(AsChars(attribute->name), colon - attribute->name);
      xmlNsPtr ns = FindDeclaration(node, reinterpret_cast<const xmlChar*>(prefix.c_str()));
      if (ns != nullptr) BindPending(attributeNode, colon, ns);
    }
  });
}

}  // namespace Xml
}  // namespace Tamber
