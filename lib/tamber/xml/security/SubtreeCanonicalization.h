#ifndef TAMBER_XML_SECURITY_SUBTREECANONICALIZATION_H
#define TAMBER_XML_SECURITY_SUBTREECANONICALIZATION_H

// Canonical form of one subtree of a tree, made in place by libxml2 (no copy of the document).

#include <string>

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
// namespace nodes, less the subtree of `excluded` (null for none). Raises XmlSecurityException.
std::string CanonicalizeSubtree(xmlNodePtr root, xmlNodePtr excluded, const Canonicalization& form);

// The same for a tree the layer built itself (to sign it): the exclusive form without inclusive
// prefixes is written in one walk over the subtree, anything else by CanonicalizeSubtree.
std::string CanonicalizeBuiltSubtree(xmlNodePtr root, xmlNodePtr excluded, const Canonicalization& form);

// The PrefixList of the InclusiveNamespaces child of a ds:Transform or ds:CanonicalizationMethod
// element; empty when it has none.
std::string InclusivePrefixesOf(xmlNodePtr method);

}  // namespace Security
}  // namespace Xml
}  // namespace Tamber

#endif
