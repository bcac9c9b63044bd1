#ifndef TAMBER_XML_SECURITY_EXCLUSIVECANONICALWRITER_H
#define TAMBER_XML_SECURITY_EXCLUSIVECANONICALWRITER_H

// Exclusive XML Canonicalization 1.0 of a subtree in one walk over it. libxml2 walks the whole
// document for every subtree it canonicalises, keeping namespace stacks, attribute lists and
// parsed namespace URIs for every node, inside the subtree or not: for a token that was a quarter
// of its validation, for a request more than everything the signer does besides the RSA operation.
// Its output is held to libxml2's byte for byte; whatever it does not handle goes to libxml2.

#include <string>
#include <vector>

#include <libxml/tree.h>

namespace Tamber {
namespace Xml {
namespace Security {

// Appends to `out` the exclusive canonical form of the node set made of `root`, its descendants,
// their attributes and namespace nodes, less the subtree of `excluded` (null for none), with
// comments when `keepComments`, treating the namespaces of `inclusivePrefixes` inclusively.
// Returns false, leaving `out` unspecified, when the subtree holds something it leaves to libxml2:
// a node kind other than elements, text, comments and processing instructions (entity
// references, for instance), a namespace URI that is relative or needs escaping, or "#default"
// among the inclusive prefixes.
bool WriteExclusiveCanonicalForm(xmlNodePtr root, xmlNodePtr excluded, bool keepComments,
                                 const std::vector<std::string>& inclusivePrefixes, std::string& out);

}  // namespace Security
}  // namespace Xml
}  // namespace Tamber

#endif
