#ifndef TAMBER_XML_SECURITY_REFERENCEDIGEST_H
#define TAMBER_XML_SECURITY_REFERENCEDIGEST_H

// The digest of a same-document ds:Reference, the same for signing and for verifying.

#include <string>
#include <vector>

#include <libxml/tree.h>
#include <openssl/evp.h>
#include <xmlsec/transforms.h>

namespace Tamber {
namespace Xml {
namespace Security {

// The digest of `referenced` under `transforms` (in order, a canonicalisation only last): the
// element less `signature` when the enveloped-signature transform is among them, canonicalised by
// the last transform with `inclusivePrefixes` (inclusive Canonical XML 1.0 when there is none),
// without comments (a same-document reference selects none), hashed with `digest`. `uri` names the
// reference in errors. Raises XmlSecurityException.
std::vector<unsigned char> ComputeReferenceDigest(xmlNodePtr referenced, xmlNodePtr signature,
                                                  const std::vector<xmlSecTransformId>& transforms,
                                                  const std::string& inclusivePrefixes, const EVP_MD* digest,
                                                  const std::string& uri);

}  // namespace Security
}  // namespace Xml
}  // namespace Tamber

#endif
