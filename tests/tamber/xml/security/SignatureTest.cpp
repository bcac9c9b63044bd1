#include "tamber/xml/security/Signature.h"

#include <gtest/gtest.h>

#include <cstdio>
#include <fstream>
#include <string>
#include <thread>
#include <vector>

#include "support/LoopbackListener.h"
#include "tamber/StringUtil.h"
#include "tamber/xml/LibXml.h"
#include "tamber/xml/security/SignatureTestSupport.h"

namespace Tamber {
namespace Xml {
namespace Security {
namespace {

using SignatureTest::SignedVector;

const char kExclusive[] = "http://www.w3.org/2001/10/xml-exc-c14n#";
const char kEnveloped[] = "http://www.w3.org/2000/09/xmldsig#enveloped-signature";
const char kRsaSha256[] = "http://www.w3.org/2001/04/xmldsig-more#rsa-sha256";
const char kEcdsaSha256[] = "http://www.w3.org/2001/04/xmldsig-more#ecdsa-sha256";
const char kSha256[] = "http://www.w3.org/2001/04/xmlenc#sha256";
const char kSoapNamespace[] = "http://schemas.xmlsoap.org/soap/envelope/";
const char kWsseNamespace[] = "http://docs.oasis-open.org/wss/2004/01/oasis-200401-wss-wssecurity-secext-1.0.xsd";
const char kWsuNamespace[] = "http://docs.oasis-open.org/wss/2004/01/oasis-200401-wss-wssecurity-utility-1.0.xsd";

std::string Vector(const std::string& name) { return TestKeys::ReadDataFile("xmlsec/" + name); }

std::string Replace(std::string text, const std::string& from, const std::string& to) {
  for (size_t at = text.find(from); at != std::string::npos; at = text.find(from, at + to.size())) {
    text.replace(at, from.size(), to);
  }
  return text;
}

// ---- Vectors signed by xmlsec1 that verify

struct Valid {
  const char* file;
  std::vector<std::string> trusted;
};

class ValidVectorTest : public testing::TestWithParam<Valid> {};

TEST_P(ValidVectorTest, VerifiesAndReportsTheSignedElement) {
  SCOPED_TRACE(GetParam().file);
  SignedVector vector(Vector(GetParam().file));
  std::vector<ElementNode*> verified;
  EXPECT_TRUE(SignatureTest::Verify(vector, GetParam().trusted, verified));
  ASSERT_EQ(1u, verified.size());
  EXPECT_EQ(vector.assertion, verified[0]);
}

INSTANTIATE_TEST_SUITE_P(
    Table, ValidVectorTest,
    testing::Values(Valid{"assertion-rsa.xml", {"ca"}},          // chains to the listed CA
                    Valid{"assertion-rsa.xml", {"sts"}},         // the signer itself is listed
                    Valid{"assertion-rsa.xml", {"client", "ca"}},
                    Valid{"assertion-ec.xml", {"ca"}},
                    Valid{"assertion-inclusive.xml", {"ca"}},
                    Valid{"assertion-empty-uri.xml", {"ca"}},
                    Valid{"assertion-without-keyinfo.xml", {"client", "sts"}},  // each listed key is tried
                    Valid{"expired-signer.xml", {"expired-sts"}},  // listed itself: its dates do not matter
                    // Signed in place inside a SOAP body whose ancestors declare namespaces and xml:lang.
                    Valid{"soap-embedded-exclusive.xml", {"ca"}},
                    Valid{"soap-embedded-inclusive.xml", {"ca"}}),
    [](const testing::TestParamInfo<Valid>& info) { return "Row" + std::to_string(info.index); });

// ---- Vectors that are refused, each for its single defect

enum Outcome { INVALID, SYNTAX_ERROR, VERIFICATION_ERROR };

struct Refused {
  const char* file;
  std::vector<std::string> trusted;
  Outcome outcome;
  std::string message;  // "PORT" stands for the port of the test's listening socket
};

class RefusedVectorTest : public testing::TestWithParam<Refused> {};

TEST_P(RefusedVectorTest, IsRefusedForItsDefect) {
  const Refused& row = GetParam();
  SCOPED_TRACE(row.file);
  TestSupport::LoopbackListener listener;
  std::string port = std::to_string(listener.GetPort());
  SignedVector vector(Replace(Vector(row.file), "PORT", port));
  std::string expected = Replace(row.message, "PORT", port);

  Ref<Signature> signature;
  std::vector<ElementNode*> verified;
  try {
    CreateSignatureFromDom(vector.assertion, vector.signature, signature);
    ASSERT_NE(SYNTAX_ERROR, row.outcome) << "read without complaint";
    bool valid = signature->Verify(SignatureTest::Resolver(row.trusted).get(), verified);
    ASSERT_EQ(INVALID, row.outcome) << "verified without an error";
    EXPECT_FALSE(valid);
  } catch (const SignatureSyntaxException& e) {
    EXPECT_EQ(SYNTAX_ERROR, row.outcome);
    EXPECT_EQ(expected, e.what());
  } catch (const XmlSecurityException& e) {
    EXPECT_EQ(VERIFICATION_ERROR, row.outcome);
    EXPECT_EQ(expected, e.what());
  }
  EXPECT_TRUE(verified.empty());
  EXPECT_EQ(0, listener.CountConnections());
}

const char kNotSameDocument[] = "\" is not accepted; expected \"\" or \"#id\"";

INSTANTIATE_TEST_SUITE_P(
    Table, RefusedVectorTest,
    testing::Values(
        Refused{"tampered-digest.xml", {"ca"}, INVALID, ""},
        Refused{"tampered-signature-value.xml", {"ca"}, INVALID, ""},
        Refused{"tampered-content.xml", {"ca"}, INVALID, ""},
        Refused{"untrusted-signer.xml", {"ca"}, INVALID, ""},
        Refused{"expired-signer.xml", {"ca"}, INVALID, ""},  // chains to the CA but expired in 2001
        Refused{"keyvalue-attacker-key.xml", {"sts"}, INVALID, ""},
        Refused{"certificate-swapped.xml", {"ca"}, INVALID, ""},
        Refused{"assertion-without-keyinfo.xml", {"ca"}, INVALID, ""},  // the CA's own key did not sign
        Refused{"assertion-rsa.xml", {}, INVALID, ""},                   // nothing trusted
        Refused{"assertion-ec.xml", {"sts"}, INVALID, ""},               // a listed key of another type
        Refused{"reference-uri-http.xml", {"ca"}, SYNTAX_ERROR,
                "Reference URI \"http://127.0.0.1:PORT/" + std::string(kNotSameDocument)},
        Refused{"reference-uri-file.xml", {"ca"}, SYNTAX_ERROR,
                "Reference URI \"file:///etc/hostname" + std::string(kNotSameDocument)},
        Refused{"rsa-sha1.xml", {"ca"}, SYNTAX_ERROR,
                "Signature method \"http://www.w3.org/2000/09/xmldsig#rsa-sha1\" is not accepted"},
        Refused{"hmac-sha256.xml", {"ca"}, SYNTAX_ERROR,
                "Signature method \"http://www.w3.org/2001/04/xmldsig-more#hmac-sha256\" is not accepted"},
        Refused{"md5-digest.xml", {"ca"}, SYNTAX_ERROR,
                "Digest method \"http://www.w3.org/2001/04/xmldsig-more#md5\" is not accepted"},
        Refused{"xpath-transform.xml", {"ca"}, SYNTAX_ERROR,
                "Transform \"http://www.w3.org/TR/1999/REC-xpath-19991116\" is not accepted"},
        Refused{"object.xml", {"ca"}, SYNTAX_ERROR, "ds:Object is not accepted"},
        Refused{"retrieval-method.xml", {"ca"}, SYNTAX_ERROR, "ds:RetrievalMethod is not accepted"},
        Refused{"too-many-references.xml", {"ca"}, SYNTAX_ERROR, "Too many references (at most 4 are accepted)"},
        Refused{"too-many-transforms.xml", {"ca"}, SYNTAX_ERROR,
                "Too many transforms in a reference (at most 4 are accepted)"},
        Refused{"duplicate-id-wrapping.xml", {"ca"}, VERIFICATION_ERROR,
                "ID \"_a1\" of the signed element is not unique in the document"},
        Refused{"reference-other-id.xml", {"ca"}, VERIFICATION_ERROR,
                "Reference URI \"#_s1\" does not name the signed element"},
        Refused{"transform-after-canonicalization.xml", {"ca"}, SYNTAX_ERROR,
                "Transform \"http://www.w3.org/2000/09/xmldsig#enveloped-signature\" after a canonicalization is not "
                "accepted"},
        Refused{"signature-value-not-base64.xml", {"ca"}, SYNTAX_ERROR,
                "ds:SignatureValue is not base64: Invalid base64 text: unexpected character 0x2A at offset 0"},
        Refused{"digest-value-not-base64.xml", {"ca"}, SYNTAX_ERROR,
                "ds:DigestValue is not base64: Invalid base64 text: unexpected character 0x2A at offset 0"},
        Refused{"ec-signature-value-truncated.xml", {"ca"}, INVALID, ""}),
    [](const testing::TestParamInfo<Refused>& info) { return "Row" + std::to_string(info.index); });

TEST(SignatureTest, ListsTheReferencesWithTheirUris) {
  for (const char* file : {"assertion-rsa.xml", "assertion-empty-uri.xml"}) {
    SignedVector vector(Vector(file));
    Ref<Signature> signature;
    CreateSignatureFromDom(vector.assertion, vector.signature, signature);
    ASSERT_EQ(1u, signature->GetReferences().size());
    EXPECT_EQ(std::string(file) == "assertion-rsa.xml" ? "#_a1" : "", signature->GetReferences()[0]->GetURI());
    EXPECT_EQ(vector.signature, signature->GetElement());
  }
}

TEST(SignatureTest, VerificationLeavesTheDocumentAsItWas) {
  SignedVector vector(Vector("soap-embedded-exclusive.xml"));
  std::string before = XmlTest::Serialize(vector.document->GetRootElement());
  std::vector<ElementNode*> verified;
  EXPECT_TRUE(SignatureTest::Verify(vector, {"ca"}, verified));
  EXPECT_TRUE(SignatureTest::Verify(vector, {"ca"}, verified));
  EXPECT_EQ(before, XmlTest::Serialize(vector.document->GetRootElement()));
  EXPECT_EQ(nullptr, xmlGetID(ToXmlNode(vector.assertion)->doc, BAD_CAST "_a1"));  // no ID left registered
}

TEST(SignatureTest, VerifiesOnManyThreadsAtOnce) {
  std::string rsa = Vector("assertion-rsa.xml");
  std::string tampered = Vector("tampered-digest.xml");
  Ref<KeyInfoResolver> resolver = SignatureTest::Resolver({"ca"});
  std::vector<int> outcomes(4, 0);
  std::vector<std::thread> threads;
  for (int t = 0; t < 4; ++t) {
    threads.emplace_back([&, t] {
      for (int i = 0; i < 20; ++i) {
        for (const std::string* text : {&rsa, &tampered}) {
          SignedVector vector(*text);
          Ref<Signature> signature;
          CreateSignatureFromDom(vector.assertion, vector.signature, signature);
          std::vector<ElementNode*> verified;
          outcomes[t] += signature->Verify(resolver.get(), verified) ? 1 : 100;
        }
      }
    });
  }
  for (std::thread& thread : threads) thread.join();
  EXPECT_EQ(std::vector<int>(4, 20 * 101), outcomes);
}

TEST(SignatureTest, RefusesASignatureOutsideTheSignedElement) {
  SignedVector vector(Vector("assertion-rsa.xml"));
  ElementNode* subject = vector.assertion->FindChildElement(QName(SignatureTest::kAssertionNamespace, "Subject"));
  Ref<Signature> signature;
  try {
    CreateSignatureFromDom(subject, vector.signature, signature);
    FAIL() << "accepted";
  } catch (const SignatureSyntaxException& e) {
    EXPECT_STREQ("ds:Signature is not inside the signed element", e.what());
  }
}

struct Malformed {
  const char* name;
  std::string from;
  std::string to;
  const char* message;
};

class MalformedSignatureTest : public testing::TestWithParam<Malformed> {};

TEST_P(MalformedSignatureTest, IsRefusedNamingWhatWasFound) {
  const Malformed& row = GetParam();
  SCOPED_TRACE(row.name);
  std::string text = Vector("assertion-rsa.xml");
  ASSERT_NE(std::string::npos, text.find(row.from));
  SignedVector vector(Replace(text, row.from, row.to));
  Ref<Signature> signature;
  try {
    CreateSignatureFromDom(vector.assertion, vector.signature, signature);
    FAIL() << "accepted";
  } catch (const SignatureSyntaxException& e) {
    EXPECT_STREQ(row.message, e.what());
  }
  EXPECT_FALSE(signature);
}

INSTANTIATE_TEST_SUITE_P(
    Table, MalformedSignatureTest,
    testing::Values(
        Malformed{"no SignedInfo", "ds:SignedInfo>", "ds:Signedinfo>",
                  "Expected ds:SignedInfo in ds:Signature, found ds:Signedinfo"},
        Malformed{"text in SignedInfo", "<ds:SignedInfo>", "<ds:SignedInfo>junk",
                  "Unexpected text in ds:SignedInfo"},
        Malformed{"reference without URI", "URI=\"#_a1\"", "",
                  "ds:Reference without URI is not accepted"},
        Malformed{"XPointer URI", "URI=\"#_a1\"", "URI=\"#xpointer(/)\"",
                  "Reference URI \"#xpointer(/)\" is not accepted; expected \"\" or \"#id\""},
        Malformed{"manifest type", "URI=\"#_a1\"", "URI=\"#_a1\" Type=\"http://www.w3.org/2000/09/xmldsig#Manifest\"",
                  "ds:Manifest is not accepted"},
        Malformed{"inclusive C14N 1.1", "<ds:CanonicalizationMethod Algorithm=\"http://www.w3.org/2001/10/xml-exc-c14n#\"/>",
                  "<ds:CanonicalizationMethod Algorithm=\"http://www.w3.org/2006/12/xml-c14n11\"/>",
                  "Canonicalization method \"http://www.w3.org/2006/12/xml-c14n11\" is not accepted"},
        Malformed{"no algorithm", "<ds:SignatureMethod Algorithm=\"http://www.w3.org/2001/04/xmldsig-more#rsa-sha256\"/>",
                  "<ds:SignatureMethod/>", "ds:SignatureMethod has no Algorithm"},
        Malformed{"base64 transform", "<ds:Transform Algorithm=\"" + std::string(kExclusive) + "\"/>",
                  "<ds:Transform Algorithm=\"http://www.w3.org/2000/09/xmldsig#base64\"/>",
                  "Transform \"http://www.w3.org/2000/09/xmldsig#base64\" is not accepted"},
        Malformed{"certificate not base64", "<ds:X509Certificate>", "<ds:X509Certificate>*",
                  "ds:X509Certificate is not base64: Invalid base64 text: unexpected character 0x2A at offset 0"},
        Malformed{"unknown child", "<ds:SignatureValue>", "<ds:Foo/><ds:SignatureValue>",
                  "Expected ds:SignatureValue in ds:Signature, found ds:Foo"}),
    [](const testing::TestParamInfo<Malformed>& info) { return "Row" + std::to_string(info.index); });

// ---- Signatures built with the layer

Ref<ElementNode> X509DataOf(const std::string& certificateName) {
  Ref<ElementNode> data = XmlTest::Element("ds", "X509Data");
  Ref<ElementNode> certificate = XmlTest::Element("ds", "X509Certificate");
  certificate->AppendChild(XmlTest::Text(StringUtil::Base64Encode(TestKeys::Certificate(certificateName)->GetDer())).get());
  data->AppendChild(certificate.get());
  return data;
}

// The status and output of the xmlsec1 tool verifying `element` as a document of its own.
std::string VerifyWithXmlSecTool(const ElementNode* element, const std::string& idAttributes, int& status) {
  char path[] = "/tmp/signature-test-XXXXXX";
  int file = mkstemp(path);
  EXPECT_GE(file, 0);
  close(file);
  std::ofstream(path) << XmlTest::Serialize(element);
  std::string output = TestKeys::RunCommand("xmlsec1 --verify --trusted-pem " + TestKeys::DataPath("keys/ca.pem") + " " +
                                                idAttributes + " " + path,
                                            status);
  std::remove(path);
  return output;
}

const char kUnsigned[] =
    "<saml2:Assertion xmlns:saml2=\"urn:oasis:names:tc:SAML:2.0:assertion\" ID=\"_b1\" Version=\"2.0\">"
    "<saml2:Issuer>https://sts.example/sts</saml2:Issuer>"
    "<saml2:Subject><saml2:NameID>user@example.com</saml2:NameID></saml2:Subject>"
    "</saml2:Assertion>";

struct Signer {
  const char* key;
  const char* method;
};

class EnvelopedSigningTest : public testing::TestWithParam<Signer> {};

TEST_P(EnvelopedSigningTest, SignsWhatTheLayerAndXmlSecToolVerify) {
  SCOPED_TRACE(GetParam().key);
  Ref<Document> document = XmlTest::Parse(kUnsigned);
  ElementNode* assertion = document->GetRootElement();
  Ref<Signature> signature;
  CreateBlankSignature(assertion, kExclusive, GetParam().method, "ds", signature);
  Reference* reference = signature->AddReference("#_b1", kSha256);
  reference->AddTransform(kEnveloped);
  reference->AddTransform(kExclusive);
  signature->SetKeyInfo(X509DataOf(GetParam().key).get());
  signature->Sign(TestKeys::PrivateKey(GetParam().key).get());
  ElementNode* element = signature->GetElement();
  EXPECT_EQ(nullptr, element->GetParent());  // not placed: the caller does that
  assertion->AppendChild(element);

  std::vector<ElementNode*> verified;
  SignedVector reparsed(XmlTest::Serialize(assertion));
  EXPECT_TRUE(SignatureTest::Verify(reparsed, {"ca"}, verified));
  Ref<Signature> inPlace;
  CreateSignatureFromDom(assertion, element, inPlace);
  EXPECT_TRUE(inPlace->Verify(SignatureTest::Resolver({"ca"}).get(), verified));

  int status = 0;
  std::string output =
      VerifyWithXmlSecTool(assertion, "--id-attr:ID urn:oasis:names:tc:SAML:2.0:assertion:Assertion", status);
  EXPECT_EQ(0, status) << output;
  EXPECT_NE(std::string::npos, output.find("OK")) << output;
}

INSTANTIATE_TEST_SUITE_P(Table, EnvelopedSigningTest,
                         testing::Values(Signer{"sts", kRsaSha256}, Signer{"sts-ec", kEcdsaSha256}),
                         [](const testing::TestParamInfo<Signer>& info) { return "Row" + std::to_string(info.index); });

// A request as the library builds it: prefixes first, declarations as attributes, wsu:Id on the
// signed parts, the signature appended to wsse:Security after signing.
struct Request {
  Ref<ElementNode> envelope = XmlTest::Element("soapenv", "Envelope");
  Ref<ElementNode> header = XmlTest::Element("soapenv", "Header");
  Ref<ElementNode> security = XmlTest::Element("wsse", "Security");
  Ref<ElementNode> timestamp = XmlTest::Element("wsu", "Timestamp");
  Ref<ElementNode> body = XmlTest::Element("soapenv", "Body");

  Request() {
    envelope->SetAttribute("xmlns:soapenv", kSoapNamespace);
    security->SetAttribute("xmlns:wsse", kWsseNamespace);
    timestamp->SetAttribute("xmlns:wsu", kWsuNamespace);
    timestamp->SetAttribute("wsu:Id", "Timestamp-1");
    Ref<ElementNode> created = XmlTest::Element("wsu", "Created");
    created->AppendChild(XmlTest::Text("2024-01-01T12:00:00Z").get());
    timestamp->AppendChild(created.get());
    security->AppendChild(timestamp.get());
    header->AppendChild(security.get());
    body->SetAttribute("xmlns:wsu", kWsuNamespace);
    body->SetAttribute("wsu:Id", "Body-1");
    Ref<ElementNode> payload = XmlTest::Element("wst", "RequestSecurityToken");
    payload->SetAttribute("xmlns:wst", "http://docs.oasis-open.org/ws-sx/ws-trust/200512");
    body->AppendChild(payload.get());
    envelope->AppendChild(header.get());
    envelope->AppendChild(body.get());
  }
};

TEST(SignatureTest, SignsARequestWhoseSignatureTheCallerPlaces) {
  Request request;
  Ref<Signature> signature;
  CreateBlankSignature(request.envelope.get(), kExclusive, kRsaSha256, "ds", signature);
  signature->AddReference("#Body-1", kSha256)->AddTransform(kExclusive);
  signature->AddReference("#Timestamp-1", kSha256)->AddTransform(kExclusive);
  signature->SetKeyInfo(X509DataOf("client").get());
  signature->Sign(TestKeys::PrivateKey("client").get());
  ASSERT_EQ(2u, signature->GetReferences().size());
  EXPECT_EQ("#Timestamp-1", signature->GetReferences()[1]->GetURI());

  ElementNode* element = signature->GetElement();
  EXPECT_EQ(nullptr, element->GetParent());
  EXPECT_EQ(nullptr, xmlGetID(ToXmlNode(request.body.get())->doc, BAD_CAST "Body-1"));  // registered while signing only
  element->SetAttribute("Id", "holderOfKeyProofSignature");
  request.security->AppendChild(element);
  EXPECT_EQ(request.security.get(), element->GetParent());
  EXPECT_EQ(nullptr, element->GetNextSibling());
  EXPECT_EQ(nullptr, request.body->GetNextSibling());  // nothing left behind in the envelope
  EXPECT_EQ("ds", element->GetPrefix());
  EXPECT_EQ(SignatureTest::kDsNamespace, element->GetNamespaceURI());

  int status = 0;
  std::string output = VerifyWithXmlSecTool(
      request.envelope.get(),
      "--id-attr:Id http://schemas.xmlsoap.org/soap/envelope/:Body --id-attr:Id " + std::string(kWsuNamespace) +
          ":Timestamp",
      status);
  EXPECT_EQ(0, status) << output;
  EXPECT_NE(std::string::npos, output.find("SignedInfo References (ok/all): 2/2")) << output;
}

TEST(SignatureTest, ABlankSignatureNeverPlacedGoesWithItsDocument) {
  Request request;
  Ref<Signature> signature;
  CreateBlankSignature(request.envelope.get(), kExclusive, kRsaSha256, "ds", signature);
  signature->AddReference("#Body-1", kSha256);
  signature->Sign(TestKeys::PrivateKey("sts").get());
  Ref<ElementNode> element(signature->GetElement());
  signature.reset();
  request = Request();  // the envelope's tree lives on through `element`
  EXPECT_EQ("Signature", element->GetLocalName());
}

struct BuildError {
  const char* name;
  const char* canonicalization;
  const char* method;
  const char* uri;
  const char* digest;
  const char* key;
  const char* message;
};

class BuildErrorTest : public testing::TestWithParam<BuildError> {};

TEST_P(BuildErrorTest, IsReportedWithItsCause) {
  const BuildError& row = GetParam();
  SCOPED_TRACE(row.name);
  Request request;
  try {
    Ref<Signature> signature;
    CreateBlankSignature(request.envelope.get(), row.canonicalization, row.method, "ds", signature);
    signature->AddReference(row.uri, row.digest);
    signature->Sign(TestKeys::PrivateKey(row.key).get());
    FAIL() << "signed";
  } catch (const Exception& e) {
    EXPECT_STREQ(row.message, e.what());
  }
}

INSTANTIATE_TEST_SUITE_P(
    Table, BuildErrorTest,
    testing::Values(
        BuildError{"C14N 1.1", "http://www.w3.org/2006/12/xml-c14n11", kRsaSha256, "#Body-1", kSha256, "sts",
                   "Invalid argument : Unsupported canonicalization algorithm \"http://www.w3.org/2006/12/xml-c14n11\""},
        BuildError{"RSA-SHA1", kExclusive, "http://www.w3.org/2000/09/xmldsig#rsa-sha1", "#Body-1", kSha256, "sts",
                   "Invalid argument : Unsupported signature method \"http://www.w3.org/2000/09/xmldsig#rsa-sha1\""},
        BuildError{"SHA-1", kExclusive, kRsaSha256, "#Body-1", "http://www.w3.org/2000/09/xmldsig#sha1", "sts",
                   "Invalid argument : Unsupported digest method \"http://www.w3.org/2000/09/xmldsig#sha1\""},
        BuildError{"remote URI", kExclusive, kRsaSha256, "http://example.com/", kSha256, "sts",
                   "Invalid argument : Reference URI \"http://example.com/\" is not \"#\" followed by an id"},
        BuildError{"unknown id", kExclusive, kRsaSha256, "#Nowhere", kSha256, "sts",
                   "Reference URI \"#Nowhere\" names no element of the context"},
        BuildError{"EC key for RSA", kExclusive, kRsaSha256, "#Body-1", kSha256, "sts-ec",
                   "Invalid argument : Signature method \"http://www.w3.org/2001/04/xmldsig-more#rsa-sha256\" cannot "
                   "sign with an EC key"}),
    [](const testing::TestParamInfo<BuildError>& info) { return "Row" + std::to_string(info.index); });

TEST(SignatureTest, ReadAndBuiltSignaturesRefuseTheOtherRole) {
  SignedVector vector(Vector("assertion-rsa.xml"));
  Ref<Signature> parsed;
  CreateSignatureFromDom(vector.assertion, vector.signature, parsed);
  EXPECT_THROW(parsed->AddReference("#_a1", kSha256), InvalidStateException);
  EXPECT_THROW(parsed->GetReferences()[0]->AddTransform(kExclusive), InvalidStateException);
  EXPECT_THROW(parsed->Sign(TestKeys::PrivateKey("sts").get()), InvalidStateException);

  Request request;
  Ref<Signature> blank;
  CreateBlankSignature(request.envelope.get(), kExclusive, kRsaSha256, "ds", blank);
  std::vector<ElementNode*> verified;
  EXPECT_THROW(blank->Verify(SignatureTest::Resolver({"ca"}).get(), verified), InvalidStateException);
  EXPECT_THROW(blank->Sign(TestKeys::PrivateKey("sts").get()), InvalidStateException);  // no reference yet
}

}  // namespace
}  // namespace Security
}  // namespace Xml
}  // namespace Tamber
