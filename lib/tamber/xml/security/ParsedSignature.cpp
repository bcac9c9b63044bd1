#include <memory>
#include <string>
#include <vector>

#include <openssl/crypto.h>
#include <openssl/evp.h>

#include "tamber/crypto/OpenSsl.h"
#include "tamber/xml/LibXml.h"
#include "tamber/xml/security/Ids.h"
#include "tamber/xml/security/ReferenceDigest.h"
#include "tamber/xml/security/Signature.h"
#include "tamber/xml/security/SignatureSyntax.h"
#include "tamber/xml/security/SignatureValue.h"
#include "tamber/xml/security/SubtreeCanonicalization.h"
#include "tamber/xml/security/TrustChainKeyResolver.h"

namespace Tamber {
namespace Xml {
namespace Security {

namespace {

class ParsedReference final : public Reference {
 public:
  explicit ParsedReference(const std::string& uri) : _uri(uri) {}
  const std::string& GetURI() const override { return _uri; }
  void AddTransform(const std::string&) override {
    throw InvalidStateException("A signature read from a document cannot be changed");
  }

 private:
  const std::string _uri;
};

bool DigestMatches(xmlNodePtr signedNode, xmlNodePtr signatureNode, const ReferenceDescription& reference) {
  const std::vector<unsigned char> digest =
      ComputeReferenceDigest(signedNode, signatureNode, reference.transforms, reference.inclusivePrefixes,
                             DigestAlgorithm(reference.digestMethod), reference.uri);
  return digest.size() == reference.digestValue.size() &&
         CRYPTO_memcmp(digest.data(), reference.digestValue.data(), digest.size()) == 0;
}

// A signature read from a document, to be verified on its signed element alone.
class ParsedSignature final : public Signature {
 public:
  ParsedSignature(ElementNode* signedElement, ElementNode* signatureElement, SignatureDescription description)
      : _signedElement(signedElement), _signatureElement(signatureElement), _description(std::move(description)) {
    for (const ReferenceDescription& reference : _description.references) {
      _references.push_back(new ParsedReference(reference.uri));
    }
  }

  const std::vector<Ref<Reference>>& GetReferences() const override { return _references; }

  // The signed element is verified in place: "" means the signed element, "#id" must name it,
  // nothing is copied, registered or fetched, and the caller's document is only read.
  bool Verify(const KeyInfoResolver* resolver, std::vector<ElementNode*>& verifiedElements) const override {
    if (resolver == nullptr) throw InvalidArgumentException("Verify needs a key resolver");
    const auto* trust = DynamicCast<const TrustChainKeyResolverImpl>(resolver);
    xmlNodePtr signedNode = ToXmlNode(_signedElement.get());
    CheckReferencesNameTheSignedElement(signedNode);

    std::vector<Ref<const Crypto::Certificate>> keys = trust->SelectCertificates(_description.keyInfoCertificates);
    if (keys.empty() || !SignedInfoVerifies(keys)) return false;
    for (const ReferenceDescription& reference : _description.references) {
      if (!DigestMatches(signedNode, ToXmlNode(_signatureElement.get()), reference)) return false;
    }
    verifiedElements.assign(1, _signedElement.get());
    return true;
  }

  Reference* AddReference(const std::string&, const std::string&) override { ThrowReadOnly(); }
  void SetKeyInfo(ElementNode*) override { ThrowReadOnly(); }
  void Sign(const Crypto::PrivateKey*) override { ThrowReadOnly(); }
  ElementNode* GetElement() const override { return _signatureElement.get(); }

 private:
  [[noreturn]] static void ThrowReadOnly() {
    throw InvalidStateException("A signature read from a document cannot be changed or signed");
  }

  // Every reference must name the signed element itself ("" or "#" + its ID), and that ID must
  // name nothing else in the whole document (wrapping attacks put a second element with it
  // elsewhere).
  void CheckReferencesNameTheSignedElement(xmlNodePtr signedNode) const {
    xmlAttrPtr idAttribute = FindIdAttribute(signedNode);
    std::string id = idAttribute != nullptr ? GetAttributeValue(idAttribute) : "";
    bool byId = false;
    for (const ReferenceDescription& reference : _description.references) {
      if (reference.uri.empty()) continue;
      if (idAttribute == nullptr || reference.uri != "#" + id) {
        throw XmlSecurityException("Reference URI \"" + reference.uri + "\" does not name the signed element");
      }
      byId = true;
    }
    if (!byId) return;
    xmlNodePtr top = signedNode;
    while (top->parent != nullptr && top->parent->type == XML_ELEMENT_NODE) top = top->parent;
    if (FindIdAttributes(top, id).size() != 1) {
      throw XmlSecurityException("ID \"" + id + "\" of the signed element is not unique in the document");
    }
  }

  // True when one of `keys` signed the canonical ds:SignedInfo.
  bool SignedInfoVerifies(const std::vector<Ref<const Crypto::Certificate>>& keys) const {
    const SignatureMethod& method = _description.signatureMethod;
    std::string signedInfo = CanonicalizeSubtree(
        _description.signedInfo, nullptr,
        Canonicalization{_description.canonicalizationMethod, true, _description.inclusivePrefixes});
    for (const Ref<const Crypto::Certificate>& certificate : keys) {
      EVP_PKEY* key = Crypto::GetPublicKey(*certificate);
      if (key != nullptr && EVP_PKEY_get_base_id(key) == method.keyType &&
          VerifySignatureValue(key, method.digest, signedInfo, _description.signatureValue)) {
        return true;
      }
    }
    return false;
  }

  const Ref<ElementNode> _signedElement;
  const Ref<ElementNode> _signatureElement;
  const SignatureDescription _description;
  std::vector<Ref<Reference>> _references;
};

}  // namespace

void CreateSignatureFromDom(ElementNode* signedElement, ElementNode* signatureElement, Ref<Signature>& signature) {
  if (signedElement == nullptr || signatureElement == nullptr) {
    throw InvalidArgumentException("CreateSignatureFromDom needs the signed element and its ds:Signature");
  }
  // A built tree may hold names whose declarations were added later.
  ResolvePendingNamespaces(signedElement);
  xmlNodePtr signedNode = ToXmlNode(signedElement);
  xmlNodePtr signatureNode = ToXmlNode(signatureElement);
  SignatureDescription description = ReadSignature(signatureNode);
  bool inside = false;
  for (xmlNodePtr node = signatureNode->parent; node != nullptr && !inside; node = node->parent) inside = node == signedNode;
  if (!inside) throw SignatureSyntaxException("ds:Signature is not inside the signed element");
  signature = new ParsedSignature(signedElement, signatureElement, std::move(description));
}

}  // namespace Security
}  // namespace Xml
}  // namespace Tamber
