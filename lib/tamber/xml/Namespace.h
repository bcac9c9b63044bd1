#ifndef TAMBER_XML_NAMESPACE_H
#define TAMBER_XML_NAMESPACE_H

// Names of elements and attributes in a tree that may hold names still waiting for their
// namespace declaration: such a name is kept whole ("p:local") with no namespace, the way libxml2
// keeps an undefined prefix (see LibXml.h).

#include <string>

#include <libxml/tree.h>

namespace Tamber {
namespace Xml {

// The prefix of an element or attribute node (empty for none) and its local name.
std::string PrefixOf(xmlNodePtr node);
std::string LocalNameOf(xmlNodePtr node);
// The namespace URI of an element or attribute node; empty when it has none or is unbound.
std::string NamespaceOf(xmlNodePtr node);
// True when the node is named with a prefix that no declaration binds yet.
bool IsUnbound(xmlNodePtr node);
// The qualified name as written: "p:local" or "local".
std::string QualifiedNameOf(xmlNodePtr node);

// Binds, in `root` and its subtree, every name whose prefix is `prefix` (null: the unprefixed
// element names, which take the default namespace) to the declaration now nearest in scope.
// Used after a declaration was made or changed on `root`.
void RebindPrefix(xmlNodePtr root, const xmlChar* prefix);
// Binds the names in `root`'s subtree that have no namespace yet to the declarations in scope.
void BindUnboundNames(xmlNodePtr root);

}  // namespace Xml
}  // namespace Tamber

#endif
