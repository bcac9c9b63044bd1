#include <memory>
#include <string>
#include <vector>

#include <openssl/evp.h>

#include "tamber/crypto/OpenSsl.h"
#include "tamber/xml/LibXml.h"
#include "tamber/xml/security/Ids.h"
#include "tamber/xml/security/IsolatedCopy.h"
#include "tamber/xml/security/Signature.h"
#include "tamber/xml/security/SignatureSyntax.h"
#include "tamber/xml/security/TrustChainKeyResolver.h"
#include "tamber/xml/security/XmlSecContext.h"

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

// Canonical XML 1.0 inherits the xml:* attributes of ancestors; the exclusive form does not. A
// reference without canonicalisation transform is canonicalised inclusively by default.
bool AnyReferenceInheritsXmlAttributes(const SignatureDescription& description) {
  for (const ReferenceDescription& reference : description.references) {
    bool inclusive = true;
    for (xmlSecTransformId transform : reference.transforms) {
      if (transform != xmlSecTransformEnvelopedId) inclusive = !IsExclusiveCanonicalization(transform);
    }
    if (inclusive) return true;
  }
  return false;
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

  bool Verify(const KeyInfoResolver* resolver, std::vector<ElementNode*>& verifiedElements) const override {
    if (resolver == nullptr) throw InvalidArgumentException("Verify needs a key resolver");
    const auto* trust = DynamicCast<const TrustChainKeyResolverImpl>(resolver);
    EnsureXmlSecInitialized();
    xmlNodePtr signedNode = ToXmlNode(_signedElement.get());
    std::string id = CheckReferencesNameTheSignedElement(signedNode);

    std::vector<Ref<const Crypto::Certificate>> keys = trust->SelectCertificates(_description.keyInfoCertificates);
    if (keys.empty()) return false;

    IsolatedCopy copy(signedNode, ToXmlNode(_signatureElement.get()), AnyReferenceInheritsXmlAttributes(_description));
    std::unique_ptr<ScopedIdRegistration> registration;
    if (!id.empty()) registration.reset(new ScopedIdRegistration(FindIdAttribute(copy.GetRoot())));
    for (const Ref<const Crypto::Certificate>& certificate : keys) {
      EVP_PKEY* key = Crypto::GetPublicKey(*certificate);
      if (key == nullptr || EVP_PKEY_get_base_id(key) != _description.signatureMethod.keyType) continue;
      if (VerifyWithKey(copy.GetInner(), key)) {
        CheckResolvedToRoot(copy, id);
        verifiedElements.assign(1, _signedElement.get());
        return true;
      }
    }
    return false;
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
  // elsewhere). Returns the ID ("" when the references use "" only).
  std::string CheckReferencesNameTheSignedElement(xmlNodePtr signedNode) const {
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
    if (!byId) return "";
    xmlNodePtr top = signedNode;
    while (top->parent != nullptr && top->parent->type == XML_ELEMENT_NODE) top = top->parent;
    if (FindIdAttributes(top, id).size() != 1) {
      throw XmlSecurityException("ID \"" + id + "\" of the signed element is not unique in the document");
    }
    return id;
  }

  static bool VerifyWithKey(xmlNodePtr signature, EVP_PKEY* key) {
    ScopedXmlSecErrorCapture errors;
    DSigContextPtr context = CreateRestrictedContext(key);
    // xmlsec answers 0 for an invalid signature as well: the verdict is the status.
    if (xmlSecDSigCtxVerify(context.get(), signature) < 0) {
      throw XmlSecurityException("Signature cannot be verified: " + errors.GetFirstError());
    }
    return context->status == xmlSecDSigStatusSucceeded;
  }

  static void CheckResolvedToRoot(const IsolatedCopy& copy, const std::string& id) {
    if (id.empty()) return;
    xmlAttrPtr resolved = xmlGetID(copy.GetRoot()->doc, BAD_CAST id.c_str());
    if (resolved == nullptr || resolved->parent != copy.GetRoot()) {
      throw XmlSecurityException("Reference URI \"#" + id + "\" did not resolve to the signed element");
    }
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
