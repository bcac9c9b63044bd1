#ifndef TAMBER_XML_SECURITY_ALGORITHMS_H
#define TAMBER_XML_SECURITY_ALGORITHMS_H

// The algorithms the layer accepts in XML signatures, by their xmlsec transform classes (whose
// hrefs are the algorithm URIs). Everything not listed is refused.

#include <string>
#include <vector>

#include <openssl/evp.h>
#include <xmlsec/transforms.h>

namespace Tamber {
namespace Xml {
namespace Security {

struct SignatureMethod {
  xmlSecTransformId transform;
  int keyType;  // EVP_PKEY_RSA or EVP_PKEY_EC
  const EVP_MD* digest;  // the hash that is signed
};

// Canonical XML 1.0 and Exclusive XML Canonicalization 1.0, with and without comments. The
// inclusive identifier is also accepted followed by "#". Null when not accepted.
xmlSecTransformId FindCanonicalizationMethod(const std::string& uri);
// RSA and ECDSA with SHA-256/384/512; null transform when not accepted.
SignatureMethod FindSignatureMethod(const std::string& uri);
// SHA-256/384/512; null when not accepted.
xmlSecTransformId FindDigestMethod(const std::string& uri);
// The OpenSSL hash of a digest method that FindDigestMethod returned.
const EVP_MD* DigestAlgorithm(xmlSecTransformId digestMethod);
// Enveloped signature and the canonicalisations; null when not accepted.
xmlSecTransformId FindReferenceTransform(const std::string& uri);

// The canonicalisation transforms.
bool IsExclusiveCanonicalization(xmlSecTransformId transform);
bool CanonicalizationKeepsComments(xmlSecTransformId transform);

}  // namespace Security
}  // namespace Xml
}  // namespace Tamber

#endif
