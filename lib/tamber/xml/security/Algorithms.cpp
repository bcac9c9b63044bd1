#include "tamber/xml/security/Algorithms.h"

#include <openssl/evp.h>
#include <xmlsec/openssl/crypto.h>

namespace Tamber {
namespace Xml {
namespace Security {

namespace {

std::vector<xmlSecTransformId> Canonicalizations() {
  return {xmlSecTransformInclC14NId, xmlSecTransformInclC14NWithCommentsId, xmlSecTransformExclC14NId,
          xmlSecTransformExclC14NWithCommentsId};
}

std::vector<SignatureMethod> SignatureMethods() {
  return {{xmlSecOpenSSLTransformRsaSha256Id, EVP_PKEY_RSA, EVP_sha256()},
          {xmlSecOpenSSLTransformRsaSha384Id, EVP_PKEY_RSA, EVP_sha384()},
          {xmlSecOpenSSLTransformRsaSha512Id, EVP_PKEY_RSA, EVP_sha512()},
          {xmlSecOpenSSLTransformEcdsaSha256Id, EVP_PKEY_EC, EVP_sha256()},
          {xmlSecOpenSSLTransformEcdsaSha384Id, EVP_PKEY_EC, EVP_sha384()},
          {xmlSecOpenSSLTransformEcdsaSha512Id, EVP_PKEY_EC, EVP_sha512()}};
}

struct Digest {
  xmlSecTransformId transform;
  const EVP_MD* hash;
};

std::vector<Digest> DigestTable() {
  return {{xmlSecOpenSSLTransformSha256Id, EVP_sha256()},
          {xmlSecOpenSSLTransformSha384Id, EVP_sha384()},
          {xmlSecOpenSSLTransformSha512Id, EVP_sha512()}};
}

std::vector<xmlSecTransformId> Digests() {
  std::vector<xmlSecTransformId> transforms;
  for (const Digest& digest : DigestTable()) transforms.push_back(digest.transform);
  return transforms;
}

bool HasHref(xmlSecTransformId transform, const std::string& uri) {
  return uri == reinterpret_cast<const char*>(transform->href);
}

xmlSecTransformId FindIn(const std::vector<xmlSecTransformId>& transforms, const std::string& uri) {
  for (xmlSecTransformId transform : transforms) {
    if (HasHref(transform, uri)) return transform;
  }
  return xmlSecTransformIdUnknown;
}

}  // namespace

xmlSecTransformId FindCanonicalizationMethod(const std::string& uri) {
  // The inclusive form's identifier is handed around both with and without a final "#".
  if (!uri.empty() && uri.back() == '#' && HasHref(xmlSecTransformInclC14NId, uri.substr(0, uri.size() - 1))) {
    return xmlSecTransformInclC14NId;
  }
  return FindIn(Canonicalizations(), uri);
}

SignatureMethod FindSignatureMethod(const std::string& uri) {
  for (const SignatureMethod& method : SignatureMethods()) {
    if (HasHref(method.transform, uri)) return method;
  }
  return {xmlSecTransformIdUnknown, EVP_PKEY_NONE, nullptr};
}

xmlSecTransformId FindDigestMethod(const std::string& uri) { return FindIn(Digests(), uri); }

const EVP_MD* DigestAlgorithm(xmlSecTransformId digestMethod) {
  for (const Digest& digest : DigestTable()) {
    if (digest.transform == digestMethod) return digest.hash;
  }
  return nullptr;
}

xmlSecTransformId FindReferenceTransform(const std::string& uri) {
  if (HasHref(xmlSecTransformEnvelopedId, uri)) return xmlSecTransformEnvelopedId;
  return FindIn(Canonicalizations(), uri);
}

bool IsExclusiveCanonicalization(xmlSecTransformId transform) {
  return transform == xmlSecTransformExclC14NId || transform == xmlSecTransformExclC14NWithCommentsId;
}

bool CanonicalizationKeepsComments(xmlSecTransformId transform) {
  return transform == xmlSecTransformInclC14NWithCommentsId || transform == xmlSecTransformExclC14NWithCommentsId;
}

}  // namespace Security
}  // namespace Xml
}  // namespace Tamber
