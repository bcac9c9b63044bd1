#include "ssoClient/xmlSoapBuilders.h"

#include <regex>
#include <sstream>

#include <gtest/gtest.h>

#include "ssoClient/BuiltTreeSupport.h"
#include "ssoClient/XmlUtils.h"
#include "ssoClient/xmlRequestBuilders.h"
#include "support/FixedClock.h"
#include "support/RequestSignatureCheck.h"
#include "support/TestTokens.h"
#include "tamber/Exception.h"
#include "tamber/Stream.h"
#include "tamber/xml/QName.h"

namespace SsoClient {
namespace {

using BuiltTree::Build;
using BuiltTree::ChildElements;
using BuiltTree::ChildNames;
using BuiltTree::Serialize;
using Tamber::Ref;
using Tamber::Xml::ElementNode;
using Tamber::Xml::QName;

// The texts as the STS expects them, written out here independently of the library's constants.
const std::string SOAPENV = "http://schemas.xmlsoap.org/soap/envelope/";
const std::string WST = "http://docs.oasis-open.org/ws-sx/ws-trust/200512";
const std::string WSSE = "http://docs.oasis-open.org/wss/2004/01/oasis-200401-wss-wssecurity-secext-1.0.xsd";
const std::string WSSE11 = "http://docs.oasis-open.org/wss/2004/01/oasis-200401-wss-wssecurity-secext-1.1.xsd";
const std::string WSU = "http://docs.oasis-open.org/wss/2004/01/oasis-200401-wss-wssecurity-utility-1.0.xsd";
const std::string DS = "http://www.w3.org/2000/09/xmldsig#";
const std::string X509V3 = "http://docs.oasis-open.org/wss/2004/01/oasis-200401-wss-x509-token-profile-1.0#X509v3";
const std::string BASE64_BINARY =
    "http://docs.oasis-open.org/wss/2004/01/oasis-200401-wss-soap-message-security-1.0#Base64Binary";
const std::string EXC_C14N = "http://www.w3.org/2001/10/xml-exc-c14n#";
const std::regex UUID_SUFFIX("(Body|Timestamp)[0-9a-f]{8}-[0-9a-f]{4}-[0-9a-f]{4}-[0-9a-f]{4}-[0-9a-f]{12}");

ElementNode* Find(const ElementNode* element, const std::string& ns, const std::string& localName) {
  ElementNode* child = element == nullptr ? nullptr : element->FindChildElement(QName(ns, localName));
  EXPECT_NE(nullptr, child) << "no child {" << ns << "}" << localName;
  return child;
}

std::string Attribute(const ElementNode* element, const std::string& name) {
  std::string value;
  EXPECT_TRUE(element != nullptr && element->GetAttribute(name, value)) << "no attribute " << name;
  return value;
}

std::string WsuId(const ElementNode* element) {
  std::string value;
  EXPECT_TRUE(element->GetAttribute(QName(WSU, "Id"), value)) << "no wsu:Id on " << element->GetLocalName();
  return value;
}

ElementNode* Security(const ElementNode* envelope) { return Find(Find(envelope, SOAPENV, "Header"), WSSE, "Security"); }

// The base64 body of a PEM file: what the certificate's DER encodes to.
std::string PemBody(const std::string& pem) {
  std::string body;
  std::istringstream lines(pem);
  for (std::string line; std::getline(lines, line);) {
    if (line.rfind("-----", 0) != 0) body += line;
  }
  return body;
}

TokenSpec Spec() {
  TokenSpec spec;
  spec.tokenLifetimeSec = 600;
  return spec;
}

const TestSupport::TestKeyPair& Client() { return TestSupport::LoadTestKeyPair("client"); }

TEST(SoapBuilderTest, TheEnvelopeHoldsHeaderThenBodyWithTheTrustNamespaceOnTheBody) {
  EXPECT_EQ("<soapenv:Envelope xmlns:soapenv=\"" + SOAPENV + "\"><soapenv:Header><h:x xmlns:h=\"urn:h\"/></soapenv:Header>"
            "<soapenv:Body xmlns:wst=\"" + WST + "\"><b:y xmlns:b=\"urn:b\"/></soapenv:Body></soapenv:Envelope>",
            SerializeToXML(SoapBuilder(ElementBuilder("h", "x", {{"xmlns:h", "urn:h"}}),
                                       ElementBuilder("b", "y", {{"xmlns:b", "urn:b"}}))));
}

TEST(SoapBuilderTest, TheBodyDeclaresTheTrustNamespaceEvenWhenItsContentDoesToo) {
  const Ref<ElementNode> envelope = Build(SoapBuilder(WsSecurityHeaderBuilder(10), AcquireSecurityTokenBuilder(SamlToken::CONFIRM_BEARER, Spec())));
  EXPECT_EQ((std::vector<std::string>{"soapenv:Header", "soapenv:Body"}), ChildNames(envelope.get()));
  EXPECT_EQ((std::vector<std::string>{"xmlns:soapenv"}), envelope->GetAttributeNames());
  ElementNode* body = Find(envelope.get(), SOAPENV, "Body");
  EXPECT_EQ((std::vector<std::string>{"xmlns:wst"}), body->GetAttributeNames());
  EXPECT_EQ((std::vector<std::string>{"wst:RequestSecurityToken"}), ChildNames(body));
}

TEST(SoapBuilderTest, AContinuedLegTakesItsPrefixFromTheBody) {
  const Ref<ElementNode> envelope =
      Build(SoapBuilder(WsSecurityHeaderBuilder(10), BuilderPtr(new XMLBodyBuilderContinuedSPNego("ctx", {1}))));
  ElementNode* response = Find(Find(envelope.get(), SOAPENV, "Body"), WST, "RequestSecurityTokenResponse");
  ASSERT_NE(nullptr, response);
  EXPECT_EQ((std::vector<std::string>{"Context"}), response->GetAttributeNames());
}

TEST(SoapBuilderTest, BuildingTwiceGivesEqualButSeparateTrees) {
  const BuilderPtr builder = SoapBuilder(WsSecurityHeaderBuilder(10), ElementBuilder("wst", "Body"));
  const Ref<ElementNode> first = Build(builder);
  const Ref<ElementNode> second = Build(builder);
  const std::string text = Serialize(second.get());
  EXPECT_EQ(Serialize(first.get()), text);

  SignSoapMessage(Client().key.get(), BuilderPtr(), first.get());
  EXPECT_NE(Serialize(first.get()), text);
  EXPECT_EQ(text, Serialize(second.get()));
}

TEST(TokenReferenceBuilderTest, TheBinarySecurityTokenCarriesTheCertificateInBase64) {
  const std::string expected = "<wsse:BinarySecurityToken xmlns:wsu=\"" + WSU + "\" EncodingType=\"" + BASE64_BINARY +
                               "\" ValueType=\"" + X509V3 + "\" wsu:Id=\"holderOfKeyCertificate\">" +
                               PemBody(TestSupport::ReadTestData("keys/client.pem")) + "</wsse:BinarySecurityToken>";
  EXPECT_EQ(expected, SerializeToXML(WsseX509v3BinarySecTokenBuilder("holderOfKeyCertificate", Client().certificate.get())));
}

TEST(TokenReferenceBuilderTest, TheCertificateReferencePointsAtTheTokenId) {
  EXPECT_EQ("<wsse:SecurityTokenReference xmlns:wsse=\"" + WSSE + "\"><wsse:Reference URI=\"#holderOfKeyCertificate\" "
            "ValueType=\"" + X509V3 + "\"/></wsse:SecurityTokenReference>",
            SerializeToXML(WsseX509v3BSTReferenceBuilder("holderOfKeyCertificate")));
}

TEST(TokenReferenceBuilderTest, TheSamlReferenceSpellsBothProfileUrisAsPublished) {
  EXPECT_EQ("<wsse:SecurityTokenReference xmlns:wsse=\"" + WSSE + "\" xmlns:wsse11=\"" + WSSE11 +
                "\" wsse11:TokenType=\"http://docs.oasis-open.org/wss/oasis-wss-saml-tokenprofile-1.1#SAMLV2.0\">"
                "<wsse:KeyIdentifier ValueType=\"http://docs.oasis-open.org/wss/oasis-wss-saml-token-profile-1.1#SAMLID\">"
                "_a-b</wsse:KeyIdentifier></wsse:SecurityTokenReference>",
            SerializeToXML(WsseSamlKeyIdReferenceBuilder("_a-b")));
}

TEST(CreateWssuIdTest, GivesANewIdOfTheLocalNameAndAUuidWithItsDeclaration) {
  const Ref<ElementNode> body = Build(ElementBuilder("soapenv", "Body", {{"xmlns:soapenv", SOAPENV}}));
  const std::string id = CreateWssuId(body.get());
  EXPECT_TRUE(std::regex_match(id, UUID_SUFFIX)) << id;
  EXPECT_EQ(0u, id.find("Body"));
  EXPECT_EQ(id, WsuId(body.get()));
  EXPECT_EQ((std::vector<std::string>{"wsu:Id", "xmlns:soapenv", "xmlns:wsu"}), body->GetAttributeNames());
  EXPECT_NE(id, CreateWssuId(Build(ElementBuilder("soapenv", "Body", {{"xmlns:soapenv", SOAPENV}})).get()));
}

TEST(CreateWssuIdTest, KeepsAnIdTheElementAlreadyHasAndWritesNothing) {
  const Ref<ElementNode> timestamp = Build(ElementBuilder("wsu", "Timestamp", {{"xmlns:wsu", WSU}, {"wsu:Id", "ts-1"}}));
  const std::string before = Serialize(timestamp.get());
  EXPECT_EQ("ts-1", CreateWssuId(timestamp.get()));
  EXPECT_EQ(before, Serialize(timestamp.get()));
}

class SignSoapMessageTest : public ::testing::Test {
 protected:
  Ref<ElementNode> SignedEnvelope(const BuilderPtr& header, const BuilderPtr& keyInfo) {
    const Ref<ElementNode> envelope = Build(SoapBuilder(header, AcquireSecurityTokenBuilder(SamlToken::CONFIRM_HOLDER_OF_KEY, Spec())));
    SignSoapMessage(Client().key.get(), keyInfo, envelope.get());
    return envelope;
  }

  static std::vector<std::string> ReferenceUris(const ElementNode* signature) {
    std::vector<std::string> uris;
    for (const ElementNode* reference : ChildElements(Find(signature, DS, "SignedInfo"))) {
      if (reference->GetLocalName() != "Reference") continue;
      uris.push_back(Attribute(reference, "URI"));
      EXPECT_EQ((std::vector<std::string>{"ds:Transforms", "ds:DigestMethod", "ds:DigestValue"}), ChildNames(reference));
      const std::vector<ElementNode*> transforms = ChildElements(Find(reference, DS, "Transforms"));
      EXPECT_EQ(1u, transforms.size());
      if (!transforms.empty()) {
        EXPECT_EQ(EXC_C14N, Attribute(transforms[0], "Algorithm"));
      }
      EXPECT_EQ("http://www.w3.org/2001/04/xmlenc#sha256", Attribute(Find(reference, DS, "DigestMethod"), "Algorithm"));
    }
    return uris;
  }

  TestSupport::FixedClock _clock{"2027-05-17T12:00:00Z"};
};

TEST_F(SignSoapMessageTest, SignsBodyThenTimestampAndAppendsTheSignatureToTheSecurityHeader) {
  const Ref<ElementNode> envelope = SignedEnvelope(WsSecurityHeaderBuilder(10), WsseX509v3BSTReferenceBuilder("x"));
  ElementNode* security = Security(envelope.get());
  EXPECT_EQ((std::vector<std::string>{"wsu:Timestamp", "ds:Signature"}), ChildNames(security));

  ElementNode* signature = ChildElements(security).back();
  EXPECT_EQ(DS, signature->GetNamespaceURI());
  EXPECT_EQ("holderOfKeyProofSignature", Attribute(signature, "Id"));
  EXPECT_EQ((std::vector<std::string>{"ds:SignedInfo", "ds:SignatureValue", "ds:KeyInfo"}), ChildNames(signature));

  ElementNode* signedInfo = Find(signature, DS, "SignedInfo");
  EXPECT_EQ(EXC_C14N, Attribute(Find(signedInfo, DS, "CanonicalizationMethod"), "Algorithm"));
  EXPECT_EQ("http://www.w3.org/2001/04/xmldsig-more#rsa-sha256", Attribute(Find(signedInfo, DS, "SignatureMethod"), "Algorithm"));
  const std::string bodyId = WsuId(Find(envelope.get(), SOAPENV, "Body"));
  const std::string timestampId = WsuId(Find(security, WSU, "Timestamp"));
  EXPECT_EQ((std::vector<std::string>{"#" + bodyId, "#" + timestampId}), ReferenceUris(signature));
  EXPECT_TRUE(std::regex_match(bodyId, UUID_SUFFIX)) << bodyId;
  EXPECT_TRUE(std::regex_match(timestampId, UUID_SUFFIX)) << timestampId;

  const std::vector<ElementNode*> keyInfo = ChildElements(Find(signature, DS, "KeyInfo"));
  ASSERT_EQ(1u, keyInfo.size());
  EXPECT_EQ(SerializeToXML(WsseX509v3BSTReferenceBuilder("x")), Serialize(keyInfo[0]));
}

TEST_F(SignSoapMessageTest, WithoutTimestampOnlyTheBodyIsSigned) {
  const Ref<ElementNode> envelope =
      SignedEnvelope(ElementBuilder("wsse", "Security", {{"xmlns:wsse", WSSE}}), WsseSamlKeyIdReferenceBuilder("_id"));
  ElementNode* signature = Find(Security(envelope.get()), DS, "Signature");
  EXPECT_EQ((std::vector<std::string>{"#" + WsuId(Find(envelope.get(), SOAPENV, "Body"))}), ReferenceUris(signature));
}

TEST_F(SignSoapMessageTest, AnEmptyKeyInfoBuilderLeavesTheKeyInformationOut) {
  const Ref<ElementNode> envelope = SignedEnvelope(WsSecurityHeaderBuilder(10), BuilderPtr());
  EXPECT_EQ((std::vector<std::string>{"ds:SignedInfo", "ds:SignatureValue"}),
            ChildNames(Find(Security(envelope.get()), DS, "Signature")));
}

TEST_F(SignSoapMessageTest, AnIdTheBodyAlreadyHasIsReferencedAsItIs) {
  const Ref<ElementNode> envelope = Build(SoapBuilder(WsSecurityHeaderBuilder(10), ElementBuilder("wst", "X")));
  ElementNode* body = Find(envelope.get(), SOAPENV, "Body");
  body->SetAttribute("xmlns:wsu", WSU);
  body->SetAttribute("wsu:Id", "theBody");
  SignSoapMessage(Client().key.get(), BuilderPtr(), envelope.get());
  const std::vector<std::string> uris = ReferenceUris(Find(Security(envelope.get()), DS, "Signature"));
  ASSERT_EQ(2u, uris.size());
  EXPECT_EQ("#theBody", uris[0]);
  EXPECT_EQ((std::vector<std::string>{"wsu:Id", "xmlns:wst", "xmlns:wsu"}), body->GetAttributeNames());
}

TEST_F(SignSoapMessageTest, TheSignatureVerifiesWithTheSigningKeyAndFailsWhenBodyOrTimestampChange) {
  const std::string text = Serialize(SignedEnvelope(WsSecurityHeaderBuilder(10), WsseX509v3BSTReferenceBuilder("x")).get());
  const Tamber::Crypto::Certificate& certificate = *Client().certificate;

  const TestSupport::RequestSignatureResult result = TestSupport::VerifyRequestSignature(text, certificate);
  EXPECT_EQ("", result.error);
  EXPECT_TRUE(result.valid);
  EXPECT_EQ((std::vector<bool>{true, true}), result.referenceValid);

  for (const char* element : {"soapenv:Body", "wsu:Timestamp"}) {
    SCOPED_TRACE(element);
    const TestSupport::RequestSignatureResult altered =
        TestSupport::VerifyRequestSignature(TestSupport::AlterFirstTextByteOf(text, element), certificate);
    EXPECT_EQ("", altered.error);
    EXPECT_FALSE(altered.valid);
  }
  EXPECT_FALSE(TestSupport::VerifyRequestSignature(text, *TestSupport::LoadTestCertificate("untrusted")).valid);
}

TEST(CertRefSignedSoapBuilderTest, TheHeaderEndsWithTheCertificateTokenThenTheSignatureReferencingIt) {
  const Ref<ElementNode> envelope = Build(CertRefSignedSoapBuilder(
      WsSecurityHeaderBuilder(10), AcquireSecurityTokenBuilder(SamlToken::CONFIRM_HOLDER_OF_KEY, Spec()),
      Client().key.get(), Client().certificate.get()));
  ElementNode* security = Security(envelope.get());
  EXPECT_EQ((std::vector<std::string>{"wsu:Timestamp", "wsse:BinarySecurityToken", "ds:Signature"}), ChildNames(security));
  ElementNode* token = Find(security, WSSE, "BinarySecurityToken");
  EXPECT_EQ("holderOfKeyCertificate", WsuId(token));

  ElementNode* reference =
      Find(Find(Find(Find(security, DS, "Signature"), DS, "KeyInfo"), WSSE, "SecurityTokenReference"), WSSE, "Reference");
  EXPECT_EQ("#holderOfKeyCertificate", Attribute(reference, "URI"));
}

TEST(SamlRefSignedSoapBuilderTest, TheHeaderIsUnchangedAndTheKeyInformationNamesTheAssertion) {
  const Ref<ElementNode> envelope = Build(SamlRefSignedSoapBuilder(
      WsSecurityHeaderBuilder(10), ElementBuilder("wst", "X"), Client().key.get(), "_token-id"));
  ElementNode* security = Security(envelope.get());
  EXPECT_EQ((std::vector<std::string>{"wsu:Timestamp", "ds:Signature"}), ChildNames(security));
  ElementNode* keyIdentifier = Find(
      Find(Find(Find(security, DS, "Signature"), DS, "KeyInfo"), WSSE, "SecurityTokenReference"), WSSE, "KeyIdentifier");
  EXPECT_EQ("_token-id", GetText(GetTextNode(keyIdentifier)));
}

TEST(XMLSignedSoapBuilderTest, EachBuildHasNewIdsAndANewSignature) {
  const BuilderPtr builder = CertRefSignedSoapBuilder(WsSecurityHeaderBuilder(10), ElementBuilder("wst", "X"),
                                                      Client().key.get(), Client().certificate.get());
  const Ref<ElementNode> first = Build(builder);
  const Ref<ElementNode> second = Build(builder);
  EXPECT_NE(WsuId(Find(first.get(), SOAPENV, "Body")), WsuId(Find(second.get(), SOAPENV, "Body")));
  EXPECT_NE(WsuId(Find(Security(first.get()), WSU, "Timestamp")), WsuId(Find(Security(second.get()), WSU, "Timestamp")));
  const auto signatureValue = [](const ElementNode* envelope) {
    return GetText(GetTextNode(Find(Find(Security(envelope), DS, "Signature"), DS, "SignatureValue")));
  };
  EXPECT_NE(signatureValue(first.get()), signatureValue(second.get()));
}

TEST(XmlSoapBuildersDeathTest, InvariantsEndTheProcessNamingTheExpression) {
  const Tamber::Crypto::PrivateKey* key = Client().key.get();
  const BuilderPtr body = ElementBuilder("wst", "X");
  EXPECT_DEATH((XMLSignedSoapBuilder{BuilderPtr(), body, key, BuilderPtr()}), "headerBuilder != __null");
  EXPECT_DEATH(CertRefSignedSoapBuilder(BuilderPtr(), body, key, Client().certificate.get()), "headerBuilder != __null");

  struct Row {
    BuilderPtr envelope;
    const char* invariant;
  };
  const BuilderPtr header = CompositeBuilder(ElementBuilder("soapenv", "Header"), {WsSecurityHeaderBuilder(10)});
  const Row rows[] = {
      {CompositeBuilder(ElementBuilder("soapenv", "Envelope", {{"xmlns:soapenv", SOAPENV}}), {header}), "soapBody != __null"},
      {CompositeBuilder(ElementBuilder("soapenv", "Envelope", {{"xmlns:soapenv", SOAPENV}}),
                        {ElementBuilder("soapenv", "Body")}),
       "soapHeader != __null"},
      {SoapBuilder(ElementBuilder("wsse", "Other", {{"xmlns:wsse", WSSE}}), body), "wsseSecurity != __null"},
  };
  for (const Row& row : rows) {
    SCOPED_TRACE(row.invariant);
    const Ref<ElementNode> envelope = Build(row.envelope);
    EXPECT_DEATH(SignSoapMessage(key, BuilderPtr(), envelope.get()), row.invariant);
  }
}

}  // namespace
}  // namespace SsoClient
