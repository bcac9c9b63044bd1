#ifndef TESTS_TAMBER_XML_SECURITY_SIGNATURETESTSUPPORT_H
#define TESTS_TAMBER_XML_SECURITY_SIGNATURETESTSUPPORT_H

// Reading the signed vectors of tests/data/xmlsec and verifying them, for the signature suites.

#include <list>
#include <string>
#include <vector>

#include "tamber/crypto/TestKeys.h"
#include "tamber/xml/XmlTestSupport.h"
#include "tamber/xml/security/Signature.h"

namespace SignatureTest {

const char kDsNamespace[] = "http://www.w3.org/2000/09/xmldsig#";
const char kAssertionNamespace[] = "urn:oasis:names:tc:SAML:2.0:assertion";

inline std::list<Tamber::Ref<const Tamber::Crypto::Certificate>> Trusting(const std::vector<std::string>& names) {
  std::list<Tamber::Ref<const Tamber::Crypto::Certificate>> certificates;
  for (const std::string& name : names) certificates.push_back(TestKeys::Certificate(name));
  return certificates;
}

inline Tamber::Ref<Tamber::Xml::Security::KeyInfoResolver> Resolver(const std::vector<std::string>& trusted) {
  Tamber::Ref<Tamber::Xml::Security::KeyInfoResolver> resolver;
  Tamber::Xml::Security::CreateTrustChainKeyResolver(Trusting(trusted), resolver);
  return resolver;
}

// The first saml2:Assertion of the tree (document order), the signed element of the vectors.
inline Tamber::Xml::ElementNode* FindAssertion(Tamber::Xml::Node* node) {
  for (; node != nullptr; node = node->GetNextSibling()) {
    if (node->GetKind() != Tamber::Xml::Node::ELEMENT) continue;
    auto* element = static_cast<Tamber::Xml::ElementNode*>(node);
    if (element->GetNamespaceURI() == kAssertionNamespace && element->GetLocalName() == "Assertion") return element;
    if (Tamber::Xml::ElementNode* found = FindAssertion(element->GetFirstChild())) return found;
  }
  return nullptr;
}

inline Tamber::Xml::ElementNode* FindSignature(Tamber::Xml::ElementNode* signedElement) {
  return signedElement->FindChildElement(Tamber::Xml::QName(kDsNamespace, "Signature"));
}

// A vector parsed, with its assertion and that assertion's ds:Signature.
struct SignedVector {
  explicit SignedVector(const std::string& text)
      : document(XmlTest::Parse(text)),
        assertion(FindAssertion(document->GetFirstChild())),
        signature(assertion != nullptr ? FindSignature(assertion) : nullptr) {}

  Tamber::Ref<Tamber::Xml::Document> document;
  Tamber::Xml::ElementNode* assertion;
  Tamber::Xml::ElementNode* signature;
};

// Reads and verifies the signature of `vector`'s assertion against `trusted`.
inline bool Verify(const SignedVector& vector, const std::vector<std::string>& trusted,
                   std::vector<Tamber::Xml::ElementNode*>& verified) {
  Tamber::Ref<Tamber::Xml::Security::Signature> signature;
  Tamber::Xml::Security::CreateSignatureFromDom(vector.assertion, vector.signature, signature);
  return signature->Verify(Resolver(trusted).get(), verified);
}

}  // namespace SignatureTest

#endif
