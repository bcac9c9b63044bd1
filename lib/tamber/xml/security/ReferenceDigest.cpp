#include "tamber/xml/security/ReferenceDigest.h"

#include "tamber/crypto/OpenSsl.h"
#include "tamber/xml/security/Signature.h"
#include "tamber/xml/security/SubtreeCanonicalization.h"

namespace Tamber {
namespace Xml {
namespace Security {

std::vector<unsigned char> ComputeReferenceDigest(xmlNodePtr referenced, xmlNodePtr signature,
                                                  const std::vector<xmlSecTransformId>& transforms,
                                                  const std::string& inclusivePrefixes, const EVP_MD* digest,
                                                  const std::string& uri) {
  Canonicalization form{xmlSecTransformInclC14NId, false, ""};
  xmlNodePtr excluded = nullptr;
  for (xmlSecTransformId transform : transforms) {
    if (transform == xmlSecTransformEnvelopedId) {
      excluded = signature;
    } else {
      form.algorithm = transform;
      form.inclusivePrefixes = inclusivePrefixes;
    }
  }
  const std::string octets = CanonicalizeSubtree(referenced, excluded, form);
  std::vector<unsigned char> value(EVP_MAX_MD_SIZE);
  unsigned int length = 0;
  if (EVP_Digest(octets.data(), octets.size(), value.data(), &length, digest, nullptr) != 1) {
    throw XmlSecurityException("Digest of \"" + uri + "\" failed: " + Crypto::TakeOpenSslError());
  }
  value.resize(length);
  return value;
}

}  // namespace Security
}  // namespace Xml
}  // namespace Tamber
