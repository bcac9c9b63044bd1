#include "tamber/xml/security/SignatureSyntax.h"

#include <libxml/tree.h>
#include <libxml/valid.h>
#include <xmlsec/strings.h>

#include "tamber/StringUtil.h"
#include "tamber/xml/security/Signature.h"
#include "tamber/xml/security/SubtreeCanonicalization.h"

namespace Tamber {
namespace Xml {
namespace Security {

namespace {

constexpr size_t kMaxKeyInfoCertificates = 8;

std::string Text(const xmlChar* text) { return text != nullptr ? reinterpret_cast<const char*>(text) : ""; }

// The element's name as written ("ds:Reference").
std::string Describe(xmlNodePtr node) {
  if (node->ns != nullptr && node->ns->prefix != nullptr) return Text(node->ns->prefix) + ":" + Text(node->name);
  return Text(node->name);
}

std::string Ds(const xmlChar* localName) { return "ds:" + Text(localName); }

[[noreturn]] void Refuse(const std::string& message) { throw SignatureSyntaxException(message); }

bool Is(xmlNodePtr node, const xmlChar* namespaceUri, const xmlChar* localName) {
  return node->ns != nullptr && xmlStrEqual(node->ns->href, namespaceUri) && xmlStrEqual(node->name, localName);
}

bool IsDs(xmlNodePtr node, const xmlChar* localName) { return Is(node, xmlSecDSigNs, localName); }

// Walks the child elements of a signature element, refusing text other than whitespace.
class ChildElements {
 public:
  explicit ChildElements(xmlNodePtr parent) : _parent(parent), _next(parent->children) {}

  // The next child element, or null at the end.
  xmlNodePtr Next() {
    for (; _next != nullptr; _next = _next->next) {
      if (_next->type == XML_ELEMENT_NODE) {
        xmlNodePtr element = _next;
        _next = _next->next;
        return element;
      }
      if ((_next->type == XML_TEXT_NODE || _next->type == XML_CDATA_SECTION_NODE) && !xmlIsBlankNode(_next)) {
        Refuse("Unexpected text in " + Describe(_parent));
      }
    }
    return nullptr;
  }

  // The next child element, which must be ds:`localName`.
  xmlNodePtr Expect(const xmlChar* localName) {
    xmlNodePtr element = Next();
    if (element == nullptr) Refuse("Expected " + Ds(localName) + " in " + Describe(_parent) + ", found nothing");
    if (!IsDs(element, localName)) {
      Refuse("Expected " + Ds(localName) + " in " + Describe(_parent) + ", found " + Describe(element));
    }
    return element;
  }

  xmlNodePtr GetParent() const { return _parent; }

 private:
  xmlNodePtr _parent;
  xmlNodePtr _next;
};

[[noreturn]] void RefuseUnexpected(xmlNodePtr element, xmlNodePtr parent) {
  Refuse("Unexpected element " + Describe(element) + " in " + Describe(parent));
}

void ExpectEnd(ChildElements& children) {
  if (xmlNodePtr extra = children.Next()) RefuseUnexpected(extra, children.GetParent());
}

std::string ReadAlgorithm(xmlNodePtr element) {
  xmlChar* value = xmlGetNoNsProp(element, xmlSecAttrAlgorithm);
  if (value == nullptr) Refuse(Describe(element) + " has no Algorithm");
  std::string algorithm = Text(value);
  xmlFree(value);
  return algorithm;
}

// A canonicalisation element may carry the exclusive form's InclusiveNamespaces, nothing else.
// Returns its prefix list.
std::string ReadCanonicalizationParameters(xmlNodePtr element, xmlSecTransformId transform) {
  ChildElements children(element);
  xmlNodePtr inclusive = children.Next();
  if (inclusive == nullptr) return "";
  if (!IsExclusiveCanonicalization(transform) || !Is(inclusive, xmlSecNsExcC14N, xmlSecNodeInclusiveNamespaces)) {
    RefuseUnexpected(inclusive, element);
  }
  ExpectEnd(children);
  return InclusivePrefixesOf(element);
}

void ReadCanonicalizationMethod(xmlNodePtr element, SignatureDescription& description) {
  std::string algorithm = ReadAlgorithm(element);
  xmlSecTransformId transform = FindCanonicalizationMethod(algorithm);
  if (transform == xmlSecTransformIdUnknown || algorithm != Text(transform->href)) {
    Refuse("Canonicalization method \"" + algorithm + "\" is not accepted");
  }
  description.canonicalizationMethod = transform;
  description.inclusivePrefixes = ReadCanonicalizationParameters(element, transform);
}

SignatureMethod ReadSignatureMethod(xmlNodePtr element) {
  std::string algorithm = ReadAlgorithm(element);
  SignatureMethod method = FindSignatureMethod(algorithm);
  if (method.transform == xmlSecTransformIdUnknown) Refuse("Signature method \"" + algorithm + "\" is not accepted");
  ChildElements children(element);
  ExpectEnd(children);
  return method;
}

void ReadTransform(xmlNodePtr element, ReferenceDescription& reference) {
  std::string algorithm = ReadAlgorithm(element);
  xmlSecTransformId transform = FindReferenceTransform(algorithm);
  if (transform == xmlSecTransformIdUnknown || algorithm != Text(transform->href)) {
    Refuse("Transform \"" + algorithm + "\" is not accepted");
  }
  if (!reference.transforms.empty() && reference.transforms.back() != xmlSecTransformEnvelopedId) {
    Refuse("Transform \"" + algorithm + "\" after a canonicalization is not accepted");
  }
  reference.transforms.push_back(transform);
  reference.inclusivePrefixes = ReadCanonicalizationParameters(element, transform);
}

// The bytes of a ds:DigestValue or ds:SignatureValue.
std::vector<unsigned char> ReadBase64(xmlNodePtr element) {
  xmlChar* text = xmlNodeGetContent(element);
  std::string base64 = Text(text);
  xmlFree(text);
  try {
    return StringUtil::Base64Decode(base64);
  } catch (const Base64FormatException& e) {
    Refuse(Ds(element->name) + " is not base64: " + std::string(e.what()));
  }
}

ReferenceDescription ReadReference(xmlNodePtr element) {
  ReferenceDescription reference;
  xmlChar* uri = xmlGetNoNsProp(element, xmlSecAttrURI);
  if (uri == nullptr) Refuse("ds:Reference without URI is not accepted");
  reference.uri = Text(uri);
  xmlFree(uri);
  if (!IsSameDocumentUri(reference.uri)) {
    Refuse("Reference URI \"" + reference.uri + "\" is not accepted; expected \"\" or \"#id\"");
  }
  xmlChar* type = xmlGetNoNsProp(element, xmlSecAttrType);
  bool manifest = type != nullptr && Text(type) == Text(xmlSecDSigNs) + Text(xmlSecNodeManifest);
  xmlFree(type);
  if (manifest) Refuse("ds:Manifest is not accepted");

  ChildElements children(element);
  xmlNodePtr next = children.Next();
  if (next != nullptr && IsDs(next, xmlSecNodeTransforms)) {
    ChildElements transforms(next);
    while (xmlNodePtr transform = transforms.Next()) {
      if (!IsDs(transform, xmlSecNodeTransform)) RefuseUnexpected(transform, next);
      if (reference.transforms.size() == kMaxTransforms) {
        Refuse("Too many transforms in a reference (at most " + std::to_string(kMaxTransforms) + " are accepted)");
      }
      ReadTransform(transform, reference);
    }
    next = children.Next();
  }
  if (next == nullptr || !IsDs(next, xmlSecNodeDigestMethod)) {
    Refuse("Expected ds:DigestMethod in ds:Reference, found " + (next != nullptr ? Describe(next) : "nothing"));
  }
  std::string digest = ReadAlgorithm(next);
  reference.digestMethod = FindDigestMethod(digest);
  if (reference.digestMethod == xmlSecTransformIdUnknown) Refuse("Digest method \"" + digest + "\" is not accepted");
  ChildElements digestChildren(next);
  ExpectEnd(digestChildren);
  reference.digestValue = ReadBase64(children.Expect(xmlSecNodeDigestValue));
  ExpectEnd(children);
  return reference;
}

void ReadSignedInfo(xmlNodePtr element, SignatureDescription& description) {
  ChildElements children(element);
  description.signedInfo = element;
  ReadCanonicalizationMethod(children.Expect(xmlSecNodeCanonicalizationMethod), description);
  description.signatureMethod = ReadSignatureMethod(children.Expect(xmlSecNodeSignatureMethod));
  while (xmlNodePtr child = children.Next()) {
    if (!IsDs(child, xmlSecNodeReference)) RefuseUnexpected(child, element);
    if (description.references.size() == kMaxReferences) {
      Refuse("Too many references (at most " + std::to_string(kMaxReferences) + " are accepted)");
    }
    description.references.push_back(ReadReference(child));
  }
  if (description.references.empty()) Refuse("Expected ds:Reference in ds:SignedInfo, found nothing");
}

Ref<const Crypto::Certificate> ReadCertificate(xmlNodePtr element) {
  std::vector<unsigned char> der = ReadBase64(element);
  Ref<const Crypto::Certificate> certificate;
  try {
    Crypto::CreateCertificate(der.data(), der.size(), certificate);
  } catch (const Crypto::CryptoException& e) {
    Refuse("ds:X509Certificate holds no certificate: " + std::string(e.what()));
  }
  return certificate;
}

// Only the certificates of ds:X509Data matter; other hints (key names, key values that anybody
// could have put there) are never used to find a key.
void ReadKeyInfo(xmlNodePtr element, SignatureDescription& description) {
  ChildElements children(element);
  while (xmlNodePtr child = children.Next()) {
    if (IsDs(child, xmlSecNodeRetrievalMethod)) Refuse("ds:RetrievalMethod is not accepted");
    if (!IsDs(child, xmlSecNodeX509Data)) continue;
    ChildElements data(child);
    while (xmlNodePtr item = data.Next()) {
      if (!IsDs(item, xmlSecNodeX509Certificate)) continue;
      if (description.keyInfoCertificates.size() == kMaxKeyInfoCertificates) {
        Refuse("Too many certificates in ds:KeyInfo (at most " + std::to_string(kMaxKeyInfoCertificates) +
               " are accepted)");
      }
      description.keyInfoCertificates.push_back(ReadCertificate(item));
    }
  }
}

}  // namespace

bool IsSameDocumentUri(const std::string& uri) {
  return uri.empty() || (uri[0] == '#' && xmlValidateNCName(BAD_CAST uri.c_str() + 1, 0) == 0);
}

SignatureDescription ReadSignature(xmlNodePtr signature) {
  if (signature == nullptr || signature->type != XML_ELEMENT_NODE || !IsDs(signature, xmlSecNodeSignature)) {
    Refuse("Expected ds:Signature, found " + (signature != nullptr ? Describe(signature) : std::string("nothing")));
  }
  SignatureDescription description;
  ChildElements children(signature);
  ReadSignedInfo(children.Expect(xmlSecNodeSignedInfo), description);
  description.signatureValue = ReadBase64(children.Expect(xmlSecNodeSignatureValue));
  xmlNodePtr next = children.Next();
  if (next != nullptr && IsDs(next, xmlSecNodeKeyInfo)) {
    ReadKeyInfo(next, description);
    next = children.Next();
  }
  if (next != nullptr && IsDs(next, xmlSecNodeObject)) Refuse("ds:Object is not accepted");
  if (next != nullptr) RefuseUnexpected(next, signature);
  return description;
}

}  // namespace Security
}  // namespace Xml
}  // namespace Tamber
