#include <new>
#include <string>
#include <vector>

#include <openssl/evp.h>
#include <xmlsec/strings.h>
#include <xmlsec/templates.h>
#include <xmlsec/xmltree.h>

#include "tamber/Panic.h"
#include "tamber/StringUtil.h"
#include "tamber/crypto/OpenSsl.h"
#include "tamber/xml/LibXml.h"
#include "tamber/xml/NodeImpl.h"
#include "tamber/xml/security/Algorithms.h"
#include "tamber/xml/security/Ids.h"
#include "tamber/xml/security/ReferenceDigest.h"
#include "tamber/xml/security/Signature.h"
#include "tamber/xml/security/SignatureSyntax.h"
#include "tamber/xml/security/SignatureValue.h"
#include "tamber/xml/security/SubtreeCanonicalization.h"
#include "tamber/xml/security/XmlSec.h"

namespace Tamber {
namespace Xml {
namespace Security {

namespace {

// The child of a template element that xmlsec created (so it exists).
xmlNodePtr TemplateChild(xmlNodePtr parent, const xmlChar* name) {
  xmlNodePtr child = xmlSecFindChild(parent, name, xmlSecDSigNs);
  TAMBER_VERIFY(child != nullptr);
  return child;
}

// Base64 in lines of 64 characters, as XML signatures are commonly written, as the only content
// of `element`.
void SetBase64Content(xmlNodePtr element, const std::vector<unsigned char>& bytes) {
  std::string text = StringUtil::Base64Encode(bytes);
  for (size_t at = 64; at < text.size(); at += 65) text.insert(at, 1, '\n');
  while (element->children != nullptr) FreeXmlSubtree(element->children);
  xmlNodePtr content = xmlNewDocTextLen(element->doc, BAD_CAST text.data(), static_cast<int>(text.size()));
  if (content == nullptr) throw std::bad_alloc();
  LinkAsLastChild(element, content);
}

class BuiltReference final : public Reference {
 public:
  BuiltReference(xmlNodePtr node, const std::string& uri, const EVP_MD* digest)
      : _node(node), _uri(uri), _digest(digest) {}

  const std::string& GetURI() const override { return _uri; }

  void AddTransform(const std::string& algorithmUri) override {
    xmlSecTransformId transform = FindReferenceTransform(algorithmUri);
    if (transform == xmlSecTransformIdUnknown) {
      throw InvalidArgumentException("Unsupported transform \"" + algorithmUri + "\"");
    }
    // Canonicalisation turns the node set into octets: nothing can be taken out of it afterwards.
    if (!_transforms.empty() && _transforms.back() != xmlSecTransformEnvelopedId) {
      throw InvalidArgumentException("Transform \"" + algorithmUri +
                                     "\" cannot follow a canonicalization; expected it to be the last transform");
    }
    xmlNodePtr node = xmlSecTmplReferenceAddTransform(_node, transform);
    if (node == nullptr) throw XmlSecurityException("Transform \"" + algorithmUri + "\" cannot be added");
    _transforms.push_back(transform);
    if (transform != xmlSecTransformEnvelopedId) _canonicalizationNode = node;
  }

  // Writes the digest of `referenced` into ds:DigestValue.
  void WriteDigest(xmlNodePtr referenced, xmlNodePtr signature) const {
    const std::string prefixes = _canonicalizationNode != nullptr ? InclusivePrefixesOf(_canonicalizationNode) : "";
    SetBase64Content(TemplateChild(_node, xmlSecNodeDigestValue),
                     ComputeReferenceDigest(referenced, signature, _transforms, prefixes, _digest, _uri));
  }

 private:
  xmlNodePtr const _node;  // the ds:Reference, owned by the signature's element
  const std::string _uri;
  const EVP_MD* const _digest;
  std::vector<xmlSecTransformId> _transforms;  // in order, a canonicalisation only last
  xmlNodePtr _canonicalizationNode = nullptr;  // its ds:Transform, which may name inclusive prefixes
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
// the caller appends GetElement() where it belongs. Signed without xmlsec's signature context:
// its node sets, transform chains and key checks cost more than the RSA signature itself adds on
// top of canonicalising and hashing.
class BlankSignature final : public Signature {
 public:
  BlankSignature(ElementNode* context, xmlNodePtr element, xmlSecTransformId canonicalization,
                 SignatureMethod method)
      : _context(context), _element(element), _canonicalization(canonicalization), _method(method) {}

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
    Ref<BuiltReference> reference(new BuiltReference(node, uri, DigestAlgorithm(digest)));
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
    ResolvePendingNamespaces(_context.get());
    xmlNodePtr context = ToXmlNode(_context.get());
    std::vector<xmlNodePtr> referenced;
    for (const Ref<Reference>& reference : _references) {
      referenced.push_back(FindReferencedAttribute(context, reference->GetURI())->parent);
    }
    TemporaryPlacement placement(_element, context);
    ResolvePendingNamespaces(_element);
    for (size_t i = 0; i < _references.size(); ++i) Built(_references[i])->WriteDigest(referenced[i], _element);
    // Canonicalised in its temporary place; the exclusive form, which requests use, comes out the
    // same wherever the caller puts the signature afterwards.
    xmlNodePtr signedInfo = TemplateChild(_element, xmlSecNodeSignedInfo);
    const Canonicalization form{_canonicalization, true,
                                InclusivePrefixesOf(TemplateChild(signedInfo, xmlSecNodeCanonicalizationMethod))};
    SetBase64Content(TemplateChild(_element, xmlSecNodeSignatureValue),
                     ComputeSignatureValue(pkey, _method.digest, CanonicalizeSubtree(signedInfo, nullptr, form)));
  }

  ElementNode* GetElement() const override { return WrapXmlElement(_element); }

 private:
  static BuiltReference* Built(const Ref<Reference>& reference) { return static_cast<BuiltReference*>(reference.get()); }

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
  const xmlSecTransformId _canonicalization;
  const SignatureMethod _method;
  std::vector<Ref<Reference>> _references;  // each a BuiltReference
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
  signature = new BlankSignature(context, element, canonicalization, method);
}

}  // namespace Security
}  // namespace Xml
}  // namespace Tamber
