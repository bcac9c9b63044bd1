#include "TokenIssuer.h"

#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <functional>
#include <ostream>

#include <gtest/gtest.h>

#include "ssoClient/Exceptions.h"
#include "ssoClient/SamlConstants.h"
#include "ssoClient/SignatureAlgorithms.h"
#include "ssoClient/XmlUtils.h"
#include "support/FixedClock.h"
#include "support/TestTokens.h"
#include "tamber/StringUtil.h"

namespace TokenIssuer {
namespace {

using SsoClient::Algorithms::ECDSA_SHA256;
using SsoClient::Algorithms::ENVELOPED_SIGNATURE;
using SsoClient::Algorithms::EXCLUSIVE_C14N;
using SsoClient::Algorithms::RSA_SHA256;
using SsoClient::Algorithms::SHA256;
using Tamber::Xml::ElementNode;
using Tamber::Xml::QName;

const char NOW[] = "2027-06-01T10:00:00Z";

ElementNode* Ds(const ElementNode* parent, const char* localName) {
  ElementNode* child = parent->FindChildElement(QName(SsoClient::Saml::DSIG_NS, localName));
  EXPECT_NE(nullptr, child) << localName;
  return child;
}

std::string Attribute(const ElementNode* element, const char* name) {
  std::string value;
  EXPECT_TRUE(element->GetAttribute(name, value)) << name;
  return value;
}

// The element children of `parent`, in order.
std::vector<ElementNode*> Children(const ElementNode* parent) {
  std::vector<ElementNode*> children;
  for (Tamber::Xml::Node* node = parent->GetFirstChild(); node != nullptr; node = node->GetNextSibling()) {
    if (node->GetKind() == Tamber::Xml::Node::ELEMENT) children.push_back(Tamber::DynamicCast<ElementNode>(node));
  }
  return children;
}

class TokenIssuerTest : public ::testing::Test {
 protected:
  // Issues `record` with a test key and parses the text back.
  Tamber::Ref<Tamber::Xml::Document> IssueAndParse(const TokenRecord& record, const std::string& signer = "sts") {
    _xml = TestSupport::IssueTestToken(record, signer);
    Tamber::Ref<Tamber::Xml::Document> document;
    SsoClient::ParseXML(_xml, document);
    return document;
  }

  static boost::shared_ptr<const SsoClient::SamlToken> Accept(const std::string& xml) {
    return SsoClient::CreateSamlToken(xml, TestSupport::TrustedCertificates());
  }

  TestSupport::FixedClock _clock{NOW};
  std::string _xml;
};

TEST_F(TokenIssuerTest, DefaultRecordIsAValidBearerTokenForAnHour) {
  const TokenRecord record;
  EXPECT_EQ('_', record.id[0]);
  const auto token = Accept(TestSupport::IssueTestToken(record));
  EXPECT_EQ(record.id, token->GetId());
  EXPECT_EQ(SsoClient::PrincipalId("alice", "example.com"), token->GetSubject());
  EXPECT_EQ(SsoClient::SamlToken::CONFIRM_BEARER, token->GetConfirmationMethod());
  EXPECT_EQ(Tamber::System::DateTime(NOW), token->GetStartDate());
  EXPECT_EQ(Tamber::System::DateTime("2027-06-01T11:00:00Z"), token->GetEndDate());
  EXPECT_NE(record.id, TokenRecord().id);
}

TEST_F(TokenIssuerTest, SignsEnvelopedRightAfterIssuerAsAnStsDoes) {
  TokenRecord record;
  record.id = "_shape";
  const auto document = IssueAndParse(record);
  const ElementNode* assertion = document->GetRootElement();
  const std::vector<ElementNode*> children = Children(assertion);
  ASSERT_GE(children.size(), 2u);
  EXPECT_EQ("Issuer", children[0]->GetLocalName());
  const ElementNode* signature = children[1];
  EXPECT_EQ("Signature", signature->GetLocalName());
  EXPECT_EQ(SsoClient::Saml::DSIG_NS, signature->GetNamespaceURI());

  const ElementNode* signedInfo = Ds(signature, "SignedInfo");
  EXPECT_EQ(EXCLUSIVE_C14N, Attribute(Ds(signedInfo, "CanonicalizationMethod"), "Algorithm"));
  EXPECT_EQ(RSA_SHA256, Attribute(Ds(signedInfo, "SignatureMethod"), "Algorithm"));
  const ElementNode* reference = Ds(signedInfo, "Reference");
  EXPECT_EQ("#_shape", Attribute(reference, "URI"));
  EXPECT_EQ(SHA256, Attribute(Ds(reference, "DigestMethod"), "Algorithm"));
  const std::vector<ElementNode*> transforms = Children(Ds(reference, "Transforms"));
  ASSERT_EQ(2u, transforms.size());
  EXPECT_EQ(ENVELOPED_SIGNATURE, Attribute(transforms[0], "Algorithm"));
  EXPECT_EQ(EXCLUSIVE_C14N, Attribute(transforms[1], "Algorithm"));
  // Nothing in a bearer token names a prefix inside a value.
  EXPECT_TRUE(Children(transforms[1]).empty());

  const ElementNode* x509 = Ds(Ds(Ds(signature, "KeyInfo"), "X509Data"), "X509Certificate");
  EXPECT_EQ(Tamber::StringUtil::Base64Encode(TestSupport::LoadTestKeyPair("sts").certificate->GetDer()),
            SsoClient::GetText(SsoClient::GetTextNode(x509)));
}

TEST_F(TokenIssuerTest, EcKeySignsWithEcdsaSha256) {
  const auto document = IssueAndParse(TokenRecord(), "sts-ec");
  const ElementNode* signedInfo = Ds(Ds(document->GetRootElement(), "Signature"), "SignedInfo");
  EXPECT_EQ(ECDSA_SHA256, Attribute(Ds(signedInfo, "SignatureMethod"), "Algorithm"));
  EXPECT_NO_THROW(Accept(_xml));
}

struct PrefixListCase {
  const char* label;
  std::function<void(TokenRecord&)> change;
  const char* prefixList;
};

std::ostream& operator<<(std::ostream& out, const PrefixListCase& row) { return out << row.label; }

class InclusiveNamespacesTest : public TokenIssuerTest, public ::testing::WithParamInterface<PrefixListCase> {};

TEST_P(InclusiveNamespacesTest, NamesThePrefixesUsedInValues) {
  SCOPED_TRACE(GetParam().label);
  TokenRecord record = TestSupport::HolderOfKeyRecord();
  record.confirmation = SsoClient::SamlToken::CONFIRM_BEARER;
  GetParam().change(record);
  const auto document = IssueAndParse(record);
  const ElementNode* reference = Ds(Ds(Ds(document->GetRootElement(), "Signature"), "SignedInfo"), "Reference");
  const std::vector<ElementNode*> inclusive = Children(Children(Ds(reference, "Transforms"))[1]);
  ASSERT_EQ(1u, inclusive.size());
  EXPECT_EQ("InclusiveNamespaces", inclusive[0]->GetLocalName());
  EXPECT_EQ(EXCLUSIVE_C14N, inclusive[0]->GetNamespaceURI());
  EXPECT_EQ(GetParam().prefixList, Attribute(inclusive[0], "PrefixList"));
  EXPECT_NO_THROW(Accept(_xml));
}

INSTANTIATE_TEST_SUITE_P(
    Records, InclusiveNamespacesTest,
    ::testing::Values(
        PrefixListCase{"holder-of-key data",
                       [](TokenRecord& r) { r.confirmation = SsoClient::SamlToken::CONFIRM_HOLDER_OF_KEY; }, "saml2"},
        PrefixListCase{"attribute values", [](TokenRecord& r) { r.givenName = "Alice"; }, "xs"},
        PrefixListCase{"delegation and renewal",
                       [](TokenRecord& r) {
                         r.delegates = {DelegateRecord("svc@example.com", Tamber::System::DateTime(NOW))};
                         r.delegateId = r.delegates.back();
                         r.renewCount = 1;
                       },
                       "del rsa"},
        PrefixListCase{"everything",
                       [](TokenRecord& r) {
                         r.confirmation = SsoClient::SamlToken::CONFIRM_HOLDER_OF_KEY;
                         r.groups = {"EXAMPLE\\Users"};
                         r.delegates = {DelegateRecord("svc@example.com", Tamber::System::DateTime(NOW))};
                         r.delegateId = r.delegates.back();
                         r.renewCount = 1;
                       },
                       "del rsa saml2 xs"}),
    [](const ::testing::TestParamInfo<PrefixListCase>& info) { return "Case" + std::to_string(info.index); });

std::string ReplaceOnce(const std::string& text, const std::string& from, const std::string& to) {
  const std::string::size_type at = text.find(from);
  EXPECT_NE(std::string::npos, at) << from;
  return at == std::string::npos ? text : text.substr(0, at) + to + text.substr(at + from.size());
}

TEST_F(TokenIssuerTest, RebindingAValuePrefixBreaksTheSignature) {
  TokenRecord record;
  record.groups = {"EXAMPLE\\Users"};
  const std::string xml = TestSupport::IssueTestToken(record);
  const std::string rebound =
      ReplaceOnce(xml, "xmlns:xs=\"http://www.w3.org/2001/XMLSchema\"", "xmlns:xs=\"urn:attacker\"");
  try {
    Accept(rebound);
    FAIL() << "a re-bound value prefix kept the signature valid";
  } catch (const SsoClient::InvalidSignatureException& e) {
    EXPECT_STREQ("Failed to verify signature: token might have been tampered with.", e.what());
  }
}

TEST_F(TokenIssuerTest, IndentedTokenVerifiesAndHasLineBreaks) {
  TokenRecord record = TestSupport::HolderOfKeyRecord();
  record.indent = true;
  record.audience = {"urn:a"};
  const std::string xml = TestSupport::IssueTestToken(record);
  EXPECT_NE(std::string::npos, xml.find("</saml2:Issuer>\n  <ds:Signature"));
  EXPECT_NE(std::string::npos, xml.find("\n    <saml2:AudienceRestriction>\n      <saml2:Audience>urn:a</saml2:Audience>"
                                        "\n    </saml2:AudienceRestriction>\n  </saml2:Conditions>"));
  EXPECT_EQ("</saml2:Assertion>", xml.substr(xml.size() - 18));
  EXPECT_NO_THROW(Accept(xml));
}

TEST_F(TokenIssuerTest, ElementFormIsAValidToken) {
  Tamber::Ref<ElementNode> assertion;
  const TestSupport::TestKeyPair& sts = TestSupport::LoadTestKeyPair("sts");
  TokenRecord record = TestSupport::HolderOfKeyRecord();
  IssueTokenElement(record, *sts.key, *sts.certificate, assertion);
  const auto token = SsoClient::CreateSamlTokenFromDom(assertion.get(), TestSupport::TrustedCertificates());
  EXPECT_EQ(record.id, token->GetId());
  ASSERT_NE(nullptr, token->GetConfirmationCertificate());
}

TEST_F(TokenIssuerTest, HolderOfKeyWithoutCertificateIsRefused) {
  TokenRecord record;
  record.confirmation = SsoClient::SamlToken::CONFIRM_HOLDER_OF_KEY;
  try {
    TestSupport::IssueTestToken(record);
    FAIL();
  } catch (const Tamber::InvalidArgumentException& e) {
    EXPECT_STREQ("Invalid argument : a holder-of-key token needs its confirmation certificate", e.what());
  }
}

// An independent verifier agrees: the xmlsec1 command-line tool accepts what the issuer signs.
TEST_F(TokenIssuerTest, Xmlsec1CommandLineVerifiesIssuedTokens) {
  if (std::system("xmlsec1 --version >/dev/null 2>&1") != 0) GTEST_SKIP() << "xmlsec1 is not installed";
  TokenRecord record = TestSupport::HolderOfKeyRecord();
  record.groups = {"EXAMPLE\\Users"};
  record.renewCount = 2;
  for (const char* signer : {"sts", "sts-ec"}) {
    SCOPED_TRACE(signer);
    char path[] = "/tmp/issued-token-XXXXXX";
    const int fd = mkstemp(path);
    ASSERT_GE(fd, 0);
    close(fd);
    std::ofstream(path) << TestSupport::IssueTestToken(record, signer);
    const std::string command = "xmlsec1 --verify --trusted-pem '" + std::string(SSOCLIENT_TEST_DATA_DIR) +
                                "/keys/ca.pem' --id-attr:ID urn:oasis:names:tc:SAML:2.0:assertion:Assertion '" +
                                path + "' >/dev/null 2>&1";
    EXPECT_EQ(0, std::system(command.c_str()));
    std::remove(path);
  }
}

}  // namespace
}  // namespace TokenIssuer
