#ifndef TAMBER_XML_SECURITY_SIGNATURE_H
#define TAMBER_XML_SECURITY_SIGNATURE_H

#include <list>
#include <string>
#include <vector>

#include "tamber/Exception.h"
#include "tamber/Ref.h"
#include "tamber/crypto/Certificate.h"
#include "tamber/crypto/PrivateKey.h"
#include "tamber/xml/Dom.h"

namespace Tamber {
namespace Xml {
namespace Security {

// A failure of XML security processing (verification could not be carried out, signing failed).
TAMBER_DECLARE_EXCEPTION(TAMBER_API, XmlSecurityException, Exception);
// A ds:Signature that is malformed or uses what is not accepted (algorithm, transform,
// reference URI, ds:Object, ...); the message names what was found.
TAMBER_DECLARE_EXCEPTION(TAMBER_API, SignatureSyntaxException, XmlSecurityException);

// Decides which keys may verify a signature.
class TAMBER_API KeyInfoResolver : public Object {};

// Accepts the key of a certificate (from ds:KeyInfo/ds:X509Data) that equals one of
// `certificates` (whatever its dates: the caller listed it) or chains to one of them (partial
// chains allowed, dates checked). Without ds:KeyInfo, each listed certificate's key is tried.
// An empty list accepts nothing. The system's trust store is never consulted.
TAMBER_API void CreateTrustChainKeyResolver(const std::list<Ref<const Crypto::Certificate>>& certificates,
                                            Ref<KeyInfoResolver>& resolver);

// One ds:Reference of a signature.
class TAMBER_API Reference : public Object {
 public:
  // The URI as written ("" or "#id").
  virtual const std::string& GetURI() const = 0;
  // Adds a transform (by algorithm URI) to a reference of a signature being built.
  virtual void AddTransform(const std::string& algorithmUri) = 0;
};

// An XML signature: read from a document to be verified, or built blank and then signed.
class TAMBER_API Signature : public Object {
 public:
  // The signature's references in document order.
  virtual const std::vector<Ref<Reference>>& GetReferences() const = 0;

  // Verifies the signature and every reference. True when valid; false when the cryptography
  // fails (digest or signature mismatch, key not accepted by the resolver). On success
  // `verifiedElements` receives the elements the references resolved to. Raises
  // XmlSecurityException when verification cannot be carried out.
  virtual bool Verify(const KeyInfoResolver* resolver, std::vector<ElementNode*>& verifiedElements) const = 0;

  // Building: a reference to "#" + id within the context element, with a digest algorithm.
  virtual Reference* AddReference(const std::string& uri, const std::string& digestUri) = 0;
  // Building: `content` becomes the only child of ds:KeyInfo.
  virtual void SetKeyInfo(ElementNode* content) = 0;
  // Building: computes the digests and the signature value with `key`.
  virtual void Sign(const Crypto::PrivateKey* key) = 0;
  // The ds:Signature element (for a blank signature, not yet placed in the tree).
  virtual ElementNode* GetElement() const = 0;
};

// Reads `signatureElement`, the ds:Signature of `signedElement`, for verification. Only
// same-document references ("" or "#id") are accepted, and they resolve within `signedElement`
// alone; the accepted algorithms are RSA and ECDSA with SHA-256/384/512, digests SHA-256/384/512,
// transforms enveloped-signature and (exclusive) C14N 1.0. Raises SignatureSyntaxException.
TAMBER_API void CreateSignatureFromDom(ElementNode* signedElement, ElementNode* signatureElement,
                                       Ref<Signature>& signature);

// A new unsigned signature whose references resolve within `context` (wsu:Id values included),
// with the given canonicalisation and signature method, its elements written with `prefix`.
TAMBER_API void CreateBlankSignature(ElementNode* context, const std::string& canonicalizationUri,
                                     const std::string& signatureMethodUri, const std::string& prefix,
                                     Ref<Signature>& signature);

}  // namespace Security
}  // namespace Xml
}  // namespace Tamber

#endif
