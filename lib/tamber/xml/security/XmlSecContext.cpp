#include "tamber/xml/security/XmlSecContext.h"

#include <xmlsec/openssl/x509.h>

#include "tamber/xml/security/Algorithms.h"
#include "tamber/xml/security/Signature.h"

namespace Tamber {
namespace Xml {
namespace Security {

namespace {

constexpr xmlSecTransformUriType kSameDocumentOnly = xmlSecTransformUriTypeEmpty | xmlSecTransformUriTypeSameDocument;

void Check(int result) {
  if (result < 0) throw XmlSecurityException("xmlsec signature context cannot be set up");
}

void RestrictKeyInfo(xmlSecKeyInfoCtx& context) {
  context.retrievalMethodCtx.enabledUris = kSameDocumentOnly;
  context.maxRetrievalMethodLevel = 0;
  Check(xmlSecPtrListAdd(&context.enabledKeyData, const_cast<void*>(static_cast<const void*>(xmlSecOpenSSLKeyDataX509Id))));
}

}  // namespace

DSigContextPtr CreateRestrictedContext(EVP_PKEY* key) {
  DSigContextPtr context(xmlSecDSigCtxCreate(nullptr));
  if (!context) throw XmlSecurityException("xmlsec signature context cannot be created");
  context->enabledReferenceUris = kSameDocumentOnly;
  RestrictKeyInfo(context->keyInfoReadCtx);
  RestrictKeyInfo(context->keyInfoWriteCtx);
  for (xmlSecTransformId transform : SignedInfoTransforms()) {
    Check(xmlSecDSigCtxEnableSignatureTransform(context.get(), transform));
  }
  for (xmlSecTransformId transform : ReferenceTransforms()) {
    Check(xmlSecDSigCtxEnableReferenceTransform(context.get(), transform));
  }
  context->signKey = CreateXmlSecKey(key).release();
  return context;
}

}  // namespace Security
}  // namespace Xml
}  // namespace Tamber
