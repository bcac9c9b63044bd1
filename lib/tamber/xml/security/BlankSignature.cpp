#include <memory>

#include <openssl/evp.h>
#include <xmlsec/templates.h>

#include "tamber/crypto/OpenSsl.h"
#include "tamber/xml/LibXml.h"
#include "tamber/xml/NodeImpl.h"
#include "tamber/xml/security/Algorithms.h"
#include "tamber/xml/security/Ids.h"
#include "tamber/xml/security/Signature.h"
#include "tamber/xml/security/SignatureSyntax.h"
#include "tamber/xml/security/XmlSecContext.h"

namespace Tamber {
namespace Xml {
namespace Security {

namespace {

class BuiltReference final : public Reference {
 public:
  BuiltReference(xmlNodePtr node, const std::string& uri) : _node(node), _uri(uri) {}

  const std::string& GetURI() const override { return _uri; }

  void AddTransform(const std::string& algorithmUri) override {
    xmlSecTransformId transform = FindReferenceTransform(algorithmUri);
    if (transform == xmlSecTransformIdUnknown) {
      throw InvalidArgumentException("Unsupported transform \"" + algorithmUri + "\"");
    }
    if (xmlSecTmplReferenceAddTransform(_node, transform) == nullptr) {
      throw XmlSecurityException("Transform \"" + algorithmUri + "\" cannot be added");
    }
  }

 private:
  xmlNodePtr const _node;  // the ds:Reference, owned by the signature's element
  const std::string _uri;
};

// Links the signature's element, while it is in no tree, as the last child of the context for the
// time of signing (xmlsec canonicalises ds:SignedInfo through the document), and takes it out
// again afterwards. Its place does not change the digests: they cover the referenced elements.
class TemporaryPlacement {
 public:
  TemporaryPlacement(xmlNodePtr signature, xmlNodePtr context) : _signature(signature) {
    if (!TreeOf(signature)->TakeLooseNode(signature)) return;  // the caller has placed it already
    LinkAsLastChild(context, signature);
    _placed = true;
  }
  ~TemporaryPlacement() {
    if (!_placed) return;
    xmlUnlinkNode(_signature);
    TreeOf(_signature)->AddLooseNode(_signature);
  }
  TemporaryPlacement(const TemporaryPlacement&) = delete;
  TemporaryPlacement& operator=(const TemporaryPlacement&) = delete;

 private:
  xmlNodePtr const _signature;
  bool _placed = false;
};

// A signature being built: an xmlsec template in the context's document, outside its tree until
// the caller appends GetElement() where it belongs.
class BlankSignature final : public Signature {
 public:
  BlankSignature(ElementNode* context, xmlNodePtr element, SignatureMethod method)
      : _context(context), _element(element), _method(method) {}

  const std::vector<Ref<Reference>>& GetReferences() const override { return _references; }

  bool Verify(const KeyInfoResolver*, std::vector<ElementNode*>&) const override {
    throw InvalidStateException("A signature being built cannot be verified; read it from the signed document");
  }

  Reference* AddReference(const std::string& uri, const std::string& digestUri) override {
    if (uri.empty() || !IsSameDocumentUri(uri)) {
      throw InvalidArgumentException("Reference URI \"" + uri + "\" is not \"#\" followed by an id");
    }
    xmlSecTransformId digest = FindDigestMethod(digestUri);
    if (digest == xmlSecTransformIdUnknown) throw InvalidArgumentException("Unsupported digest method \"" + digestUri + "\"");
    xmlNodePtr node = xmlSecTmplSignatureAddReference(_element, digest, nullptr, BAD_CAST uri.c_str(), nullptr);
    if (node == nullptr) throw XmlSecurityException("Reference \"" + uri + "\" cannot be added");
    Ref<Reference> reference(new BuiltReference(node, uri));
    _references.push_back(reference);
    return reference.get();
  }

  void SetKeyInfo(ElementNode* content) override {
    if (content == nullptr) throw InvalidArgumentException("The key information is null");
    xmlNodePtr keyInfo = xmlSecTmplSignatureEnsureKeyInfo(_element, nullptr);
    if (keyInfo == nullptr) throw XmlSecurityException("ds:KeyInfo cannot be added");
    while (keyInfo->children != nullptr) FreeXmlSubtree(keyInfo->children);
    WrapXmlElement(keyInfo)->AppendChild(content);
  }

  void Sign(const Crypto::PrivateKey* key) override {
    if (key == nullptr) throw InvalidArgumentException("The signing key is null");
    if (_references.empty()) throw InvalidStateException("A signature needs a reference before it is signed");
    EVP_PKEY* pkey = Crypto::GetEvpPkey(*key);
    if (EVP_PKEY_get_base_id(pkey) != _method.keyType) {
      throw InvalidArgumentException("Signature method \"" + std::string(reinterpret_cast<const char*>(_method.transform->href)) +
                                     "\" cannot sign with an " + key->GetAlgorithm() + " key");
    }
    EnsureXmlSecInitialized();
    ResolvePendingNamespaces(_context.get());
    xmlNodePtr context = ToXmlNode(_context.get());
    std::vector<std::unique_ptr<ScopedIdRegistration>> registrations;
    for (const Ref<Reference>& reference : _references) {
      registrations.emplace_back(new ScopedIdRegistration(FindReferencedAttribute(context, reference->GetURI())));
    }
    TemporaryPlacement placement(_element, context);
    ScopedXmlSecErrorCapture errors;
    DSigContextPtr signing = CreateRestrictedContext(pkey);
    if (xmlSecDSigCtxSign(signing.get(), _element) < 0 || signing->status != xmlSecDSigStatusSucceeded) {
      throw XmlSecurityException("Signing failed: " + errors.GetFirstError());
    }
  }

  ElementNode* GetElement() const override { return WrapXmlElement(_element); }

 private:
  // The one ID attribute within the context that "#id" names.
  static xmlAttrPtr FindReferencedAttribute(xmlNodePtr context, const std::string& uri) {
    std::string id = uri.substr(1);
    std::vector<xmlAttrPtr> found = FindIdAttributes(context, id);
    if (found.empty()) throw XmlSecurityException("Reference URI \"" + uri + "\" names no element of the context");
    if (found.size() > 1) throw XmlSecurityException("ID \"" + id + "\" is not unique in the context");
    return found.front();
  }

  const Ref<ElementNode> _context;
  xmlNodePtr const _element;
  const SignatureMethod _method;
  std::vector<Ref<Reference>> _references;
};

}  // namespace

void CreateBlankSignature(ElementNode* context, const std::string& canonicalizationUri,
                          const std::string& signatureMethodUri, const std::string& prefix, Ref<Signature>& signature) {
  if (context == nullptr) throw InvalidArgumentException("The signature context is null");
  xmlSecTransformId canonicalization = FindCanonicalizationMethod(canonicalizationUri);
  if (canonicalization == xmlSecTransformIdUnknown) {
    throw InvalidArgumentException("Unsupported canonicalization algorithm \"" + canonicalizationUri + "\"");
  }
  SignatureMethod method = FindSignatureMethod(signatureMethodUri);
  if (method.transform == xmlSecTransformIdUnknown) {
    throw InvalidArgumentException("Unsupported signature method \"" + signatureMethodUri + "\"");
  }
  EnsureXmlSecInitialized();
  xmlNodePtr contextNode = ToXmlNode(context);
  xmlNodePtr element = xmlSecTmplSignatureCreateNsPref(contextNode->doc, canonicalization, method.transform, nullptr,
                                                       prefix.empty() ? nullptr : BAD_CAST prefix.c_str());
  if (element == nullptr) throw XmlSecurityException("The signature template cannot be created");
  // Owned by the document until the caller appends it: freed with it if never placed.
  TreeOf(contextNode)->AddLooseNode(element);
  signature = new BlankSignature(context, element, method);
}

}  // namespace Security
}  // namespace Xml
}  // namespace Tamber
