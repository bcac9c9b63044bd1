// Signatures the layer makes itself (digests, canonical forms, signature values) checked by the
// layer's verifier and by libxmlsec directly, an implementation of its own: a disagreement in any
// byte fails.

#include <gtest/gtest.h>

#include <string>
#include <vector>

#include <libxml/tree.h>
#include <libxml/valid.h>

#include "RequestSignature.h"
#include "tamber/xml/LibXml.h"
#include "tamber/xml/security/Signature.h"
#include "tamber/xml/security/SignatureTestSupport.h"

namespace Tamber {
namespace Xml {
namespace Security {
namespace {

const char kExclusive[] = "http://www.w3.org/2001/10/xml-exc-c14n#";
const char kExclusiveWithComments[] = "http://www.w3.org/2001/10/xml-exc-c14n#WithComments";
const char kInclusive[] = "http://www.w3.org/TR/2001/REC-xml-c14n-20010315";
const char kEnveloped[] = "http://www.w3.org/2000/09/xmldsig#enveloped-signature";
const char kRsaSha256[] = "http://www.w3.org/2001/04/xmldsig-more#rsa-sha256";
const char kRsaSha512[] = "http://www.w3.org/2001/04/xmldsig-more#rsa-sha512";
const char kEcdsaSha256[] = "http://www.w3.org/2001/04/xmldsig-more#ecdsa-sha256";
const char kEcdsaSha384[] = "http://www.w3.org/2001/04/xmldsig-more#ecdsa-sha384";
const char kSha256[] = "http://www.w3.org/2001/04/xmlenc#sha256";
const char kSha384[] = "http://www.w3.org/2001/04/xmldsig-more#sha384";
const char kSha512[] = "http://www.w3.org/2001/04/xmlenc#sha512";

// Namespaces declared above the assertion, a comment, character data that canonicalisation
// escapes and non-ASCII text: what makes canonical forms differ.
const char kDocument[] =
    "<env:Envelope xmlns:env=\"urn:envelope\" xmlns:unused=\"urn:unused\">"
    "<saml2:Assertion xmlns:saml2=\"urn:oasis:names:tc:SAML:2.0:assertion\" ID=\"_s1\" Version=\"2.0\">"
    "<saml2:Issuer>https://sts.example/sts</saml2:Issuer><!-- issued for a test -->"
    "<saml2:Subject><saml2:NameID Format=\"a&amp;b\">J\xC3\xBCrgen &lt;j@example.com&gt;\r</saml2:NameID>"
    "</saml2:Subject></saml2:Assertion></env:Envelope>";

// xmlsec's verdict on the vector's signature with the key of the certificate `key`.
bool XmlSecVerifies(const SignatureTest::SignedVector& vector, const std::string& key) {
  xmlNodePtr assertion = ToXmlNode(vector.assertion);
  xmlAttrPtr id = xmlHasProp(assertion, BAD_CAST "ID");
  if (id == nullptr || xmlAddID(nullptr, assertion->doc, BAD_CAST "_s1", id) == nullptr) return false;
  DevSts::SignatureCheck check =
      DevSts::VerifySignatureElement(ToXmlNode(vector.signature), TestKeys::Certificate(key)->GetDer());
  EXPECT_EQ("", check.error);
  return check.valid;
}

struct Method {
  const char* name;
  const char* signedInfoCanonicalization;
  const char* signatureMethod;
  const char* digest;
  const char* lastTransform;  // after the enveloped transform; null for none (inclusive by default)
  const char* key;
};

class SigningMethodTest : public testing::TestWithParam<Method> {};

TEST_P(SigningMethodTest, SignsWhatXmlSecAndTheLayerVerify) {
  const Method& method = GetParam();
  SCOPED_TRACE(method.name);
  Ref<Document> document = XmlTest::Parse(kDocument);
  ElementNode* assertion = SignatureTest::FindAssertion(document->GetFirstChild());
  ASSERT_NE(nullptr, assertion);
  Ref<Signature> signature;
  CreateBlankSignature(assertion, method.signedInfoCanonicalization, method.signatureMethod, "ds", signature);
  Reference* reference = signature->AddReference("#_s1", method.digest);
  reference->AddTransform(kEnveloped);
  if (method.lastTransform != nullptr) reference->AddTransform(method.lastTransform);
  signature->Sign(TestKeys::PrivateKey(method.key).get());
  assertion->AppendChild(signature->GetElement());

  std::vector<ElementNode*> verified;
  SignatureTest::SignedVector reparsed(XmlTest::Serialize(document->GetRootElement()));
  EXPECT_TRUE(SignatureTest::Verify(reparsed, {method.key}, verified));
  EXPECT_TRUE(XmlSecVerifies(reparsed, method.key));
}

INSTANTIATE_TEST_SUITE_P(
    Table, SigningMethodTest,
    testing::Values(Method{"exclusive", kExclusive, kRsaSha256, kSha256, kExclusive, "sts"},
                    Method{"inclusive signed info", kInclusive, kRsaSha256, kSha256, kExclusive, "sts"},
                    Method{"inclusive reference", kExclusive, kRsaSha256, kSha256, kInclusive, "sts"},
                    Method{"default canonicalization", kExclusive, kRsaSha256, kSha256, nullptr, "sts"},
                    Method{"comments kept by method but not by reference", kExclusiveWithComments, kRsaSha256,
                           kSha256, kExclusiveWithComments, "sts"},
                    Method{"SHA-512 in wrapped lines", kExclusive, kRsaSha512, kSha512, kExclusive, "sts"},
                    Method{"ECDSA", kExclusive, kEcdsaSha256, kSha384, kExclusive, "sts-ec"},
                    Method{"ECDSA over a longer hash", kExclusive, kEcdsaSha384, kSha256, kExclusive, "sts-ec"}),
    [](const testing::TestParamInfo<Method>& info) { return "Row" + std::to_string(info.index); });

TEST(SigningMethodTest, RefusesATransformAfterTheCanonicalization) {
  Ref<Document> document = XmlTest::Parse(kDocument);
  ElementNode* assertion = SignatureTest::FindAssertion(document->GetFirstChild());
  Ref<Signature> signature;
  CreateBlankSignature(assertion, kExclusive, kRsaSha256, "ds", signature);
  Reference* reference = signature->AddReference("#_s1", kSha256);
  reference->AddTransform(kExclusive);
  try {
    reference->AddTransform(kEnveloped);
    FAIL() << "accepted";
  } catch (const InvalidArgumentException& e) {
    EXPECT_STREQ(
        "Invalid argument : Transform \"http://www.w3.org/2000/09/xmldsig#enveloped-signature\" cannot follow a "
        "canonicalization; expected it to be the last transform",
        e.what());
  }
}

TEST(SigningMethodTest, SigningAgainReplacesTheValues) {
  Ref<Document> document = XmlTest::Parse(kDocument);
  ElementNode* assertion = SignatureTest::FindAssertion(document->GetFirstChild());
  Ref<Signature> signature;
  CreateBlankSignature(assertion, kExclusive, kRsaSha256, "ds", signature);
  signature->AddReference("#_s1", kSha256)->AddTransform(kEnveloped);
  signature->Sign(TestKeys::PrivateKey("untrusted").get());
  signature->Sign(TestKeys::PrivateKey("sts").get());
  assertion->AppendChild(signature->GetElement());

  std::vector<ElementNode*> verified;
  SignatureTest::SignedVector reparsed(XmlTest::Serialize(document->GetRootElement()));
  EXPECT_TRUE(SignatureTest::Verify(reparsed, {"sts"}, verified));
}

}  // namespace
}  // namespace Security
}  // namespace Xml
}  // namespace Tamber
