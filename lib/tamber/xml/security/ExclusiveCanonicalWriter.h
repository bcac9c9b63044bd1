#ifndef TAMBER_XML_SECURITY_EXCLUSIVECANONICALWRITER_H
#define TAMBER_XML_SECURITY_EXCLUSIVECANONICALWRITER_H

// Exclusive XML Canonicalization 1.0 (without inclusive prefixes) of a subtree in one walk over
// it. libxml2 walks the whole document for every subtree it canonicalises, keeping namespace
// stacks and attribute lists for nodes outside it; for the small parts of a request that are
// signed this costs more than everything else the signer does besides the RSA operation.
// Used for trees the layer built itself; what it reads from the network goes through libxml2.

#include <string>

#include <libxml/tree.h>

namespace Tamber {
namespace Xml {
namespace Security {

// Appends to `out` the exclusive canonical form of the node set made of `root`, its descendants,
// their attributes and namespace nodes, less the subtree of `excluded` (null for none), with
// comments when `keepComments`. Returns false, leaving `out` unspecified, when the subtree holds
// a node kind it does not handle (entity references, for instance): the caller then uses libxml2.
bool WriteExclusiveCanonicalForm(xmlNodePtr root, xmlNodePtr excluded, bool keepComments, std::string& out);

}  // namespace Security
}  // namespace Xml
}  // namespace Tamber

#endif
