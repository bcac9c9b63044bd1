#ifndef TAMBER_XML_SECURITY_SUBTREECANONICALIZATION_H
#define TAMBER_XML_SECURITY_SUBTREECANONICALIZATION_H

// Canonical form of one subtree of a tree, made in place (no copy of the document).

#include <string>
#include <vector>

#include <libxml/tree.h>
#include <xmlsec/transforms.h>

namespace Tamber {
namespace Xml {
namespace Security {

// How a subtree is canonicalised.
struct Canonicalization {
  xmlSecTransformId algorithm;  // one of the accepted canonicalisations
  bool keepComments;            // comments count only when this and the algorithm keep them
  std::string inclusivePrefixes;  // exclusive forms: prefixes treated inclusively, space separated
};

// The canonical form of the node set made of `root`, its descendants, their attributes and
// namespace nodes, less the subtree of `excluded` (null for none). The exclusive form is written
// in one walk over the subtree (ExclusiveCanonicalWriter.h) unless it holds something only libxml2
// handles; the inclusive form always comes from libxml2. Raises XmlSecurityException.
std::string CanonicalizeSubtree(xmlNodePtr root, xmlNodePtr excluded, const Canonicalization& form);

// The same, always by libxml2's C14N over the whole document with a node-set callback: the
// reference the writer is held to.
std::string CanonicalizeSubtreeWithLibXml2(xmlNodePtr root, xmlNodePtr excluded, const Canonicalization& form);

// The prefixes of an InclusiveNamespaces PrefixList, in order, without empty entries.
std::vector<std::string> SplitPrefixList(const std::string& list);

// The PrefixList of the InclusiveNamespaces child of a ds:Transform or ds:CanonicalizationMethod
// element; empty when it has none.
std::string InclusivePrefixesOf(xmlNodePtr method);

}  // namespace Security
}  // namespace Xml
}  // namespace Tamber

#endif
