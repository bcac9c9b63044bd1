#include "ssoClient/SamlAssertion.h"

#include <functional>
#include <limits>

#include <boost/make_shared.hpp>
#include <boost/optional/optional_io.hpp>
#include <gtest/gtest.h>

#include "ssoClient/Exceptions.h"
#include "ssoClient/SamlConstants.h"
#include "support/FixedClock.h"
#include "support/TestTokens.h"
#include "tamber/StringUtil.h"

namespace SsoClient {
namespace {

using Tamber::Ref;
using Tamber::Xml::Document;
using Tamber::Xml::ElementNode;
using Tamber::Xml::QName;

const char DECLARATIONS[] =
    "xmlns:saml='urn:oasis:names:tc:SAML:2.0:assertion' "
    "xmlns:ds='http://www.w3.org/2000/09/xmldsig#' "
    "xmlns:xsi='http://www.w3.org/2001/XMLSchema-instance' "
    "xmlns:del='urn:oasis:names:tc:SAML:2.0:conditions:delegation' "
    "xmlns:rsa='http://www.rsa.com/names/2009/12/std-ext/SAML2.0'";

std::string ClientCertificateBase64() {
  return Tamber::StringUtil::Base64Encode(TestSupport::LoadTestKeyPair("client").certificate->GetDer());
}

std::string ReplaceAll(std::string text, const std::string& from, const std::string& to) {
  for (std::string::size_type at = text.find(from); at != std::string::npos; at = text.find(from, at + to.size())) {
    text.replace(at, from.size(), to);
  }
  return text;
}

// XML fragments parsed under a wrapper that declares the usual prefixes; the iterator starts on
// the fragment's first element. "@CERT@" stands for a valid certificate in base64.
class Fragment {
 public:
  explicit Fragment(const std::string& xml)
      : _it(nullptr, boost::make_shared<SkipWsAndCommentsFilter>()) {
    ParseXML("<wrapper " + std::string(DECLARATIONS) + ">" + ReplaceAll(xml, "@CERT@", ClientCertificateBase64()) +
                 "</wrapper>",
             _document);
    _it = NodeFilterIterator(_document->GetRootElement(), boost::make_shared<SkipWsAndCommentsFilter>()).GetChild();
  }

  NodeFilterIterator& It() { return _it; }
  ElementNode* Element() { return IteratorToElement(_it); }

 private:
  Ref<Document> _document;
  NodeFilterIterator _it;
};

using Reader = std::function<void(NodeFilterIterator&)>;

template <class Record, void (*Parse)(NodeFilterIterator&, Record&)>
Reader ReaderOf() {
  return [](NodeFilterIterator& it) {
    Record record;
    Parse(it, record);
  };
}

Reader HolderOfKeyDataReader() {
  return [](NodeFilterIterator& it) {
    SubjectConfirmationType confirmation;
    confirmation.method = SamlToken::CONFIRM_HOLDER_OF_KEY;
    ParseSubjectConfirmationDataElement(it, confirmation);
  };
}

Reader BearerDataReader() { return ReaderOf<SubjectConfirmationType, ParseSubjectConfirmationDataElement>(); }

const char HOK_DATA_OPEN[] = "<saml:SubjectConfirmationData xsi:type='saml:KeyInfoConfirmationDataType'>";
const char KEY_INFO[] =
    "<ds:KeyInfo><ds:X509Data><ds:X509Certificate>@CERT@</ds:X509Certificate></ds:X509Data></ds:KeyInfo>";

// ---- One case for every row of the failure table, and the shape rules around them ------------

struct RejectedCase {
  const char* label;
  Reader reader;
  std::string xml;
  std::string message;
};

class RejectedFragmentTest : public ::testing::TestWithParam<RejectedCase> {};

TEST_P(RejectedFragmentTest, RaisesParseExceptionWithExactMessage) {
  const RejectedCase& c = GetParam();
  SCOPED_TRACE(c.label);
  Fragment fragment(c.xml);
  try {
    c.reader(fragment.It());
    FAIL() << "accepted: " << c.xml;
  } catch (const ParseException& e) {
    EXPECT_EQ(c.message, e.what());
  }
}

const std::string CONDITIONS_OPEN =
    "<saml:Conditions NotBefore='2027-06-01T10:00:00Z' NotOnOrAfter='2027-06-01T11:00:00Z'>";
const std::string AUDIENCE = "<saml:AudienceRestriction><saml:Audience>a</saml:Audience></saml:AudienceRestriction>";

INSTANTIATE_TEST_SUITE_P(
    FailureTable, RejectedFragmentTest,
    ::testing::Values(
        RejectedCase{"element missing", ReaderOf<SubjectType, ParseSubjectElement>(), CONDITIONS_OPEN + "</saml:Conditions>",
                     "Expected element 'Subject' not found."},
        RejectedCase{"element in another namespace", ReaderOf<SubjectType, ParseSubjectElement>(),
                     "<x:Subject xmlns:x='urn:other'/>", "Element 'Subject' has unexpected namespace"},
        RejectedCase{"element without namespace", ReaderOf<NameIDType, ParseSamlIssuerElement>(),
                     "<Issuer Format='f'>i</Issuer>", "Element 'Issuer' has unexpected namespace"},
        RejectedCase{"attribute missing, by name", ReaderOf<ConditionsType, ParseConditionsElement>(),
                     "<saml:Conditions NotOnOrAfter='2027-06-01T11:00:00Z'/>",
                     "Node 'Conditions is missing required attribute 'NotBefore'"},
        RejectedCase{"attribute missing, by QName", HolderOfKeyDataReader(),
                     std::string("<saml:SubjectConfirmationData>") + KEY_INFO + "</saml:SubjectConfirmationData>",
                     "Node 'SubjectConfirmationData is missing required attribute "
                     "'http://www.w3.org/2001/XMLSchema-instance:type'"},
        RejectedCase{"extra attribute, by name", ReaderOf<NameIDType, ParseSamlIssuerElement>(),
                     "<saml:Issuer Format='f' NameQualifier='q'>i</saml:Issuer>",
                     "Unexpected attributes on element 'Issuer'"},
        RejectedCase{"extra attribute, by QName", HolderOfKeyDataReader(),
                     std::string("<saml:SubjectConfirmationData xsi:type='saml:KeyInfoConfirmationDataType' "
                                 "Address='10.0.0.1'>") +
                         KEY_INFO + "</saml:SubjectConfirmationData>",
                     "Unexpected attribute 'Address' on element 'SubjectConfirmationData'"},
        RejectedCase{"extra qualified attribute, by QName", HolderOfKeyDataReader(),
                     std::string("<saml:SubjectConfirmationData xsi:type='saml:KeyInfoConfirmationDataType' "
                                 "xsi:nil='false'>") +
                         KEY_INFO + "</saml:SubjectConfirmationData>",
                     "Unexpected attribute 'http://www.w3.org/2001/XMLSchema-instance:nil' on element "
                     "'SubjectConfirmationData'"},
        RejectedCase{"not empty", BearerDataReader(),
                     std::string("<saml:SubjectConfirmationData NotOnOrAfter='2027-06-01T11:00:00Z'>") + KEY_INFO +
                         "</saml:SubjectConfirmationData>",
                     "Element 'SubjectConfirmationData' must be empty"},
        RejectedCase{"bearer data typed as holder-of-key data", BearerDataReader(),
                     std::string(HOK_DATA_OPEN) + KEY_INFO + "</saml:SubjectConfirmationData>",
                     "Element 'SubjectConfirmationData' must be empty"},
        RejectedCase{"text with a child element", ReaderOf<NameIDType, ParseSamlIssuerElement>(),
                     "<saml:Issuer Format='f'>i<saml:Extra/></saml:Issuer>",
                     "Element 'Issuer' must only have textual content (but has extra children or is empty)."},
        RejectedCase{"empty text", ReaderOf<NameIDType, ParseSamlIssuerElement>(), "<saml:Issuer Format='f'/>",
                     "Element 'Issuer' must only have textual content (but has extra children or is empty)."},
        RejectedCase{"text split by a comment", ReaderOf<NameIDType, ParseSubjectNameIdElement>(),
                     "<saml:NameID Format='f'>alice@example.com<!---->.evil.com</saml:NameID>",
                     "Element 'NameID' must only have textual content (but has extra children or is empty)."},
        RejectedCase{"text in a CDATA section", ReaderOf<NameIDType, ParseSubjectNameIdElement>(),
                     "<saml:NameID Format='f'><![CDATA[alice@example.com]]></saml:NameID>",
                     "Element 'NameID' must only have textual content (but has extra children or is empty)."},
        RejectedCase{"text and a processing instruction", ReaderOf<NameIDType, ParseSubjectNameIdElement>(),
                     "<saml:NameID Format='f'>alice@example.com<?pi x?></saml:NameID>",
                     "Element 'NameID' must only have textual content (but has extra children or is empty)."},
        RejectedCase{"not a date", ReaderOf<ConditionsType, ParseConditionsElement>(),
                     "<saml:Conditions NotBefore='yesterday' NotOnOrAfter='2027-06-01T11:00:00Z'/>",
                     "Conditions/@NotBefore is not a date"},
        RejectedCase{"not a non-negative integer", ReaderOf<ConditionsType, ParseConditionsElement>(),
                     CONDITIONS_OPEN + "<saml:ProxyRestriction Count='-1'/></saml:Conditions>",
                     "ProxyRestriction/@Count is not a non-negative integer."},
        RejectedCase{"content after SubjectConfirmation", ReaderOf<SubjectType, ParseSubjectElement>(),
                     "<saml:Subject><saml:NameID Format='f'>a@b</saml:NameID>"
                     "<saml:SubjectConfirmation Method='urn:oasis:names:tc:SAML:2.0:cm:bearer'>"
                     "<saml:SubjectConfirmationData NotOnOrAfter='2027-06-01T11:00:00Z'/></saml:SubjectConfirmation>"
                     "<saml:SubjectConfirmation/></saml:Subject>",
                     "Unexpected elements after SubjectConfirmation"},
        RejectedCase{"unknown confirmation method", ReaderOf<SubjectConfirmationType, ParseSubjectConfirmationElement>(),
                     "<saml:SubjectConfirmation Method='urn:oasis:names:tc:SAML:2.0:cm:sender-vouches'/>",
                     "Unknown subject confirmation method: 'urn:oasis:names:tc:SAML:2.0:cm:sender-vouches'"},
        RejectedCase{"confirmation method in another case",
                     ReaderOf<SubjectConfirmationType, ParseSubjectConfirmationElement>(),
                     "<saml:SubjectConfirmation Method='URN:oasis:names:tc:SAML:2.0:cm:bearer'/>",
                     "Unknown subject confirmation method: 'URN:oasis:names:tc:SAML:2.0:cm:bearer'"},
        RejectedCase{"content after SubjectConfirmationData",
                     ReaderOf<SubjectConfirmationType, ParseSubjectConfirmationElement>(),
                     "<saml:SubjectConfirmation Method='urn:oasis:names:tc:SAML:2.0:cm:bearer'>"
                     "<saml:SubjectConfirmationData NotOnOrAfter='2027-06-01T11:00:00Z'/><saml:Extra/>"
                     "</saml:SubjectConfirmation>",
                     "Unexpected elements after SubjectConfirmationData"},
        RejectedCase{"confirmation without data", ReaderOf<SubjectConfirmationType, ParseSubjectConfirmationElement>(),
                     "<saml:SubjectConfirmation Method='urn:oasis:names:tc:SAML:2.0:cm:bearer'>"
                     "<saml:NameID Format='f'>a@b</saml:NameID></saml:SubjectConfirmation>",
                     "Expected element 'SubjectConfirmationData' not found."},
        RejectedCase{"holder-of-key data of another type", HolderOfKeyDataReader(),
                     std::string("<saml:SubjectConfirmationData xsi:type='saml:SubjectConfirmationDataType'>") +
                         KEY_INFO + "</saml:SubjectConfirmationData>",
                     "Invalid SubjectConfirmationData type: "
                     "'urn:oasis:names:tc:SAML:2.0:assertion:SubjectConfirmationDataType'"},
        RejectedCase{"holder-of-key type without prefix and default namespace", HolderOfKeyDataReader(),
                     std::string("<saml:SubjectConfirmationData xsi:type='KeyInfoConfirmationDataType'>") + KEY_INFO +
                         "</saml:SubjectConfirmationData>",
                     "Invalid SubjectConfirmationData type: 'KeyInfoConfirmationDataType'"},
        RejectedCase{"content after KeyInfo", HolderOfKeyDataReader(),
                     std::string(HOK_DATA_OPEN) + KEY_INFO + "<ds:KeyInfo/></saml:SubjectConfirmationData>",
                     "Unexpected elements after SubjectConfirmationData/KeyInfo"},
        RejectedCase{"content after X509Certificate", HolderOfKeyDataReader(),
                     std::string(HOK_DATA_OPEN) +
                         "<ds:KeyInfo><ds:X509Data><ds:X509Certificate>@CERT@</ds:X509Certificate>"
                         "<ds:X509SubjectName>CN=x</ds:X509SubjectName></ds:X509Data></ds:KeyInfo>"
                         "</saml:SubjectConfirmationData>",
                     "Unexpected elements after X509Certificate"},
        RejectedCase{"content after X509Data", HolderOfKeyDataReader(),
                     std::string(HOK_DATA_OPEN) +
                         "<ds:KeyInfo><ds:X509Data><ds:X509Certificate>@CERT@</ds:X509Certificate></ds:X509Data>"
                         "<ds:KeyName>k</ds:KeyName></ds:KeyInfo></saml:SubjectConfirmationData>",
                     "Unexpected elements after X509Data"},
        RejectedCase{"KeyValue instead of X509Data", HolderOfKeyDataReader(),
                     std::string(HOK_DATA_OPEN) +
                         "<ds:KeyInfo><ds:KeyValue/></ds:KeyInfo></saml:SubjectConfirmationData>",
                     "Expected element 'X509Data' not found."},
        RejectedCase{"KeyInfo with an Id", HolderOfKeyDataReader(),
                     std::string(HOK_DATA_OPEN) +
                         "<ds:KeyInfo Id='k'><ds:X509Data><ds:X509Certificate>@CERT@</ds:X509Certificate>"
                         "</ds:X509Data></ds:KeyInfo></saml:SubjectConfirmationData>",
                     "Unexpected attributes on element 'KeyInfo'"},
        RejectedCase{"duplicate restriction", ReaderOf<ConditionsType, ParseConditionsElement>(),
                     CONDITIONS_OPEN + AUDIENCE + AUDIENCE + "</saml:Conditions>",
                     "Unknown or duplicate restriction node under Conditions: AudienceRestriction"},
        RejectedCase{"unknown restriction", ReaderOf<ConditionsType, ParseConditionsElement>(),
                     CONDITIONS_OPEN + "<saml:OneTimeUse/></saml:Conditions>",
                     "Unknown or duplicate restriction node under Conditions: OneTimeUse"},
        RejectedCase{"text among restrictions", ReaderOf<ConditionsType, ParseConditionsElement>(),
                     CONDITIONS_OPEN + "text</saml:Conditions>",
                     "Unknown or duplicate restriction node under Conditions"},
        RejectedCase{"condition of another type", ReaderOf<ConditionsType, ParseConditionsElement>(),
                     CONDITIONS_OPEN + "<saml:Condition xsi:type='rsa:OtherRestrictionType'/></saml:Conditions>",
                     "Unknown or duplicate restriction node under Conditions: Condition"},
        RejectedCase{"content after AuthnContext", ReaderOf<AuthnStatementType, ParseAuthnStatementElement>(),
                     "<saml:AuthnStatement AuthnInstant='2027-06-01T10:00:00Z'><saml:AuthnContext>"
                     "<saml:AuthnContextClassRef>c</saml:AuthnContextClassRef></saml:AuthnContext>"
                     "<saml:SubjectLocality/></saml:AuthnStatement>",
                     "Unexpected elements after AuthnContext"},
        RejectedCase{"content after AuthnContextClassRef", ReaderOf<AuthnStatementType, ParseAuthnStatementElement>(),
                     "<saml:AuthnStatement AuthnInstant='2027-06-01T10:00:00Z'><saml:AuthnContext>"
                     "<saml:AuthnContextClassRef>c</saml:AuthnContextClassRef><saml:AuthnContextDeclRef>d"
                     "</saml:AuthnContextDeclRef></saml:AuthnContext></saml:AuthnStatement>",
                     "Unexpected elements after AuthnContextClassRef"},
        RejectedCase{"signature missing", ReaderOf<SamlAssertionType, ParseSamlAssertionElement>(),
                     "<saml:Assertion Version='2.0' ID='_a' IssueInstant='2027-06-01T10:00:00Z'>"
                     "<saml:Issuer Format='f'>i</saml:Issuer> <!-- nothing else --> </saml:Assertion>",
                     "Expected element ds:Signature not found"},
        RejectedCase{"text where the signature belongs", ReaderOf<SamlAssertionType, ParseSamlAssertionElement>(),
                     "<saml:Assertion Version='2.0' ID='_a' IssueInstant='2027-06-01T10:00:00Z'>"
                     "<saml:Issuer Format='f'>i</saml:Issuer>text</saml:Assertion>",
                     "Expected element ds:Signature not found"},
        RejectedCase{"assertion with a schema location", ReaderOf<SamlAssertionType, ParseSamlAssertionElement>(),
                     "<saml:Assertion Version='2.0' ID='_a' IssueInstant='2027-06-01T10:00:00Z' "
                     "xsi:schemaLocation='urn:x x.xsd'/>",
                     "Unexpected attributes on element 'Assertion'"},
        RejectedCase{"assertion without ID", ReaderOf<SamlAssertionType, ParseSamlAssertionElement>(),
                     "<saml:Assertion Version='2.0' IssueInstant='2027-06-01T10:00:00Z'/>",
                     "Node 'Assertion is missing required attribute 'ID'"},
        RejectedCase{"ID written with a prefix", ReaderOf<SamlAssertionType, ParseSamlAssertionElement>(),
                     "<saml:Assertion Version='2.0' saml:ID='_a' IssueInstant='2027-06-01T10:00:00Z'/>",
                     "Node 'Assertion is missing required attribute 'ID'"},
        RejectedCase{"assertion issued at no date", ReaderOf<SamlAssertionType, ParseSamlAssertionElement>(),
                     "<saml:Assertion Version='2.0' ID='_a' IssueInstant=' 2027-06-01T10:00:00Z'/>",
                     "Assertion/@IssueInstant is not a date"},
        RejectedCase{"audience restriction without audience", ReaderOf<ConditionsType, ParseConditionsElement>(),
                     CONDITIONS_OPEN + "<saml:AudienceRestriction/></saml:Conditions>",
                     "Expected element 'Audience' not found."},
        RejectedCase{"proxy restriction with content", ReaderOf<ConditionsType, ParseConditionsElement>(),
                     CONDITIONS_OPEN + "<saml:ProxyRestriction Count='1'><saml:Audience>a</saml:Audience>"
                         "</saml:ProxyRestriction></saml:Conditions>",
                     "Element 'ProxyRestriction' must be empty"},
        RejectedCase{"proxy restriction without count", ReaderOf<ConditionsType, ParseConditionsElement>(),
                     CONDITIONS_OPEN + "<saml:ProxyRestriction/></saml:Conditions>",
                     "Node 'ProxyRestriction is missing required attribute 'Count'"},
        RejectedCase{"delegation restriction without delegate", ReaderOf<ConditionsType, ParseConditionsElement>(),
                     CONDITIONS_OPEN + "<saml:Condition xsi:type='del:DelegationRestrictionType'/></saml:Conditions>",
                     "Expected element 'Delegate' not found."},
        RejectedCase{"delegate without NameID", ReaderOf<ConditionsType, ParseConditionsElement>(),
                     CONDITIONS_OPEN +
                         "<saml:Condition xsi:type='del:DelegationRestrictionType'>"
                         "<del:Delegate DelegationInstant='2027-06-01T10:00:00Z'/></saml:Condition></saml:Conditions>",
                     "Expected element 'NameID' not found."},
        RejectedCase{"delegation restriction with an extra attribute",
                     ReaderOf<ConditionsType, ParseConditionsElement>(),
                     CONDITIONS_OPEN +
                         "<saml:Condition xsi:type='del:DelegationRestrictionType' Count='1'>"
                         "<del:Delegate DelegationInstant='2027-06-01T10:00:00Z'><saml:NameID Format='f'>a@b"
                         "</saml:NameID></del:Delegate></saml:Condition></saml:Conditions>",
                     "Unexpected attribute 'Count' on element 'Condition'"},
        RejectedCase{"renew restriction with an unknown attribute", ReaderOf<ConditionsType, ParseConditionsElement>(),
                     CONDITIONS_OPEN +
                         "<saml:Condition xsi:type='rsa:RenewRestrictionType' Forever='true'/></saml:Conditions>",
                     "Unexpected attribute 'Forever' on element 'Condition'"},
        RejectedCase{"advice without RSAAdvice", ReaderOf<boost::optional<AdviceType>, TryParseAdviceElement>(),
                     "<saml:Advice/>", "Expected element 'RSAAdvice' not found."},
        RejectedCase{"RSAAdvice without attribute", ReaderOf<boost::optional<AdviceType>, TryParseAdviceElement>(),
                     "<saml:Advice><rsa:RSAAdvice AdviceSource='s'/></saml:Advice>",
                     "Expected element 'Attribute' not found."},
        RejectedCase{"assertion reference in advice",
                     ReaderOf<boost::optional<AdviceType>, TryParseAdviceElement>(),
                     "<saml:Advice><saml:AssertionIDRef>_x</saml:AssertionIDRef></saml:Advice>",
                     "Expected element 'RSAAdvice' not found."},
        RejectedCase{"attribute without NameFormat", ReaderOf<AttributeType, ParseAttributeElement>(),
                     "<saml:Attribute Name='n'/>", "Node 'Attribute is missing required attribute 'NameFormat'"},
        RejectedCase{"attribute value with an element", ReaderOf<AttributeType, ParseAttributeElement>(),
                     "<saml:Attribute Name='n' NameFormat='f'><saml:AttributeValue><x/></saml:AttributeValue>"
                     "</saml:Attribute>",
                     "Element 'AttributeValue' must only have textual content (but has extra children or is empty)."},
        RejectedCase{"attribute with foreign content", ReaderOf<AttributeType, ParseAttributeElement>(),
                     "<saml:Attribute Name='n' NameFormat='f'><saml:EncryptedAttribute/></saml:Attribute>",
                     "Expected element 'AttributeValue' not found."},
        RejectedCase{"attribute statement without attribute",
                     ReaderOf<AttributeStatementType, ParseAttributeStatementElement>(), "<saml:AttributeStatement/>",
                     "Expected element 'Attribute' not found."}),
    [](const ::testing::TestParamInfo<RejectedCase>& info) { return "Row" + std::to_string(info.index); });

// ---- The certificate of a holder-of-key token ------------------------------------------------

struct CertificateCase {
  const char* label;
  std::string base64;
  std::string cause;  // the core layer's message for the same input
};

class HolderOfKeyCertificateTest : public ::testing::TestWithParam<CertificateCase> {};

std::string CauseOf(const std::function<void()>& failing) {
  try {
    failing();
  } catch (const Tamber::Exception& e) {
    return e.what();
  }
  return "(no failure)";
}

TEST_P(HolderOfKeyCertificateTest, MalformedCertificateIsParseException) {
  const CertificateCase& c = GetParam();
  SCOPED_TRACE(c.label);
  Fragment fragment(std::string(HOK_DATA_OPEN) + "<ds:KeyInfo><ds:X509Data><ds:X509Certificate>" + c.base64 +
                    "</ds:X509Certificate></ds:X509Data></ds:KeyInfo></saml:SubjectConfirmationData>");
  try {
    HolderOfKeyDataReader()(fragment.It());
    FAIL() << "accepted";
  } catch (const ParseException& e) {
    EXPECT_EQ("Invalid X509Certificate in SubjectConfirmationData/KeyInfo: " + c.cause, e.what());
  }
}

INSTANTIATE_TEST_SUITE_P(
    Malformed, HolderOfKeyCertificateTest,
    ::testing::Values(
        CertificateCase{"not base64", "MIIB*AAA",
                        CauseOf([] { Tamber::StringUtil::Base64Decode("MIIB*AAA"); })},
        CertificateCase{"base64 of no certificate", "AAECAwQF",
                        CauseOf([] {
                          const std::vector<unsigned char> bytes = Tamber::StringUtil::Base64Decode("AAECAwQF");
                          Tamber::Ref<const Tamber::Crypto::Certificate> certificate;
                          Tamber::Crypto::CreateCertificate(bytes.data(), bytes.size(), certificate);
                        })}),
    [](const ::testing::TestParamInfo<CertificateCase>& info) { return "Case" + std::to_string(info.index); });

TEST(HolderOfKeyDataTest, ReadsTheCertificateAndAllowsNotOnOrAfter) {
  Fragment fragment(std::string("<saml:SubjectConfirmationData xsi:type='saml:KeyInfoConfirmationDataType' "
                                "NotOnOrAfter='not read'>\n  ") +
                    "<ds:KeyInfo><ds:X509Data>\n<ds:X509Certificate>@CERT@</ds:X509Certificate>\n</ds:X509Data>"
                    "</ds:KeyInfo></saml:SubjectConfirmationData>");
  SubjectConfirmationType confirmation;
  confirmation.method = SamlToken::CONFIRM_HOLDER_OF_KEY;
  ParseSubjectConfirmationDataElement(fragment.It(), confirmation);
  ASSERT_TRUE(confirmation.subjectConfirmationData.certificate);
  EXPECT_EQ(TestSupport::LoadTestKeyPair("client").certificate->GetDer(),
            confirmation.subjectConfirmationData.certificate->GetDer());
  EXPECT_TRUE(fragment.It().AtEnd());
}

// xsi:type matches by namespace, whatever prefix names it.
class XsiTypeSpellingTest : public ::testing::TestWithParam<const char*> {};

TEST_P(XsiTypeSpellingTest, MatchesKeyInfoConfirmationDataType) {
  Fragment fragment(GetParam());
  SubjectConfirmationType confirmation;
  confirmation.method = SamlToken::CONFIRM_HOLDER_OF_KEY;
  EXPECT_NO_THROW(ParseSubjectConfirmationDataElement(fragment.It(), confirmation));
}

INSTANTIATE_TEST_SUITE_P(
    AnyPrefix, XsiTypeSpellingTest,
    ::testing::Values(
        "<saml:SubjectConfirmationData xmlns:s2='urn:oasis:names:tc:SAML:2.0:assertion' "
        "xsi:type='s2:KeyInfoConfirmationDataType'><ds:KeyInfo><ds:X509Data><ds:X509Certificate>@CERT@"
        "</ds:X509Certificate></ds:X509Data></ds:KeyInfo></saml:SubjectConfirmationData>",
        "<SubjectConfirmationData xmlns='urn:oasis:names:tc:SAML:2.0:assertion' "
        "xsi:type='KeyInfoConfirmationDataType'><ds:KeyInfo><ds:X509Data><ds:X509Certificate>@CERT@"
        "</ds:X509Certificate></ds:X509Data></ds:KeyInfo></SubjectConfirmationData>",
        "<saml:SubjectConfirmationData xmlns:i='http://www.w3.org/2001/XMLSchema-instance' "
        "i:type='saml:KeyInfoConfirmationDataType'><ds:KeyInfo><ds:X509Data><ds:X509Certificate>@CERT@"
        "</ds:X509Certificate></ds:X509Data></ds:KeyInfo></saml:SubjectConfirmationData>"));

TEST(XsiTypeTest, UndefinedPrefixInTypeIsNamedWithItsPosition) {
  Fragment fragment(std::string("<saml:SubjectConfirmationData xsi:type='foo:KeyInfoConfirmationDataType'>") +
                    KEY_INFO + "</saml:SubjectConfirmationData>");
  const ElementNode* data = fragment.Element();
  SubjectConfirmationType confirmation;
  confirmation.method = SamlToken::CONFIRM_HOLDER_OF_KEY;
  try {
    ParseSubjectConfirmationDataElement(fragment.It(), confirmation);
    FAIL();
  } catch (const ParseException& e) {
    EXPECT_EQ("Element SubjectConfirmationDataat " + std::to_string(data->GetLine()) + "," +
                  std::to_string(data->GetColumn()) + " uses undefined prefix: `foo'",
              e.what());
  }
}

TEST(XsiTypeTest, ElementXsiTypeIsFalseWithoutTheAttribute) {
  Fragment fragment("<saml:Condition/>");
  EXPECT_FALSE(ElementXsiTypeIs(fragment.Element(), QName(Saml::DEL_NS, "DelegationRestrictionType")));
}

// ---- Strictness checks ----------------------------------------------------------------------

TEST(AttributeChecksTest, NamespaceDeclarationsAreAlwaysAllowed) {
  Fragment fragment("<saml:Subject xmlns='urn:default' xmlns:foo='urn:foo'/>");
  EXPECT_NO_THROW(RequireNoAttributes(fragment.Element()));
  EXPECT_NO_THROW(RequireElementAttributesQNames(fragment.Element(), {}, {}));
}

TEST(AttributeChecksTest, MissingRequiredIsReportedInListOrder) {
  Fragment fragment("<saml:Assertion IssueInstant='x'/>");
  try {
    RequireElementAttributesNames(fragment.Element(), {"Version", "ID", "IssueInstant"}, {});
    FAIL();
  } catch (const ParseException& e) {
    EXPECT_STREQ("Node 'Assertion is missing required attribute 'Version'", e.what());
  }
}

TEST(AttributeChecksTest, OptionalAttributesAreAccepted) {
  Fragment fragment("<saml:Attribute Name='n' NameFormat='f' FriendlyName='x'/>");
  EXPECT_NO_THROW(RequireElementAttributesNames(fragment.Element(), {"Name", "NameFormat"}, {"FriendlyName"}));
  EXPECT_NO_THROW(RequireElementAttributesQNames(fragment.Element(), {LocalName("Name"), LocalName("NameFormat")},
                                                 {LocalName("FriendlyName")}));
}

TEST(AttributeChecksTest, QNameCheckNamesTheMissingUnqualifiedAttribute) {
  Fragment fragment("<saml:Condition xsi:type='x'/>");
  try {
    RequireElementAttributesQNames(fragment.Element(), {QName(Saml::XSI_NS, "type"), LocalName("Count")}, {});
    FAIL();
  } catch (const ParseException& e) {
    EXPECT_STREQ("Node 'Condition is missing required attribute 'Count'", e.what());
  }
}

TEST(ElementChecksTest, ElementQNameIsNeverThrows) {
  Fragment fragment("<x:Subject xmlns:x='urn:other'/>");
  EXPECT_FALSE(ElementQNameIs(nullptr, "Subject", Saml::SAML_NS));
  EXPECT_FALSE(ElementQNameIs(fragment.Element(), "Subject", Saml::SAML_NS));
  EXPECT_TRUE(ElementQNameIs(fragment.Element(), "Subject", "urn:other"));
  EXPECT_FALSE(ElementQNameIs(fragment.Element(), "Issuer", "urn:other"));
}

TEST(ElementChecksTest, RequireElementQNameOnTheEndNamesTheExpectedElement) {
  try {
    RequireElementQName(nullptr, "Conditions", Saml::SAML_NS);
    FAIL();
  } catch (const ParseException& e) {
    EXPECT_STREQ("Expected element 'Conditions' not found.", e.what());
  }
}

TEST(ElementChecksTest, EmptyElementMayHoldWhitespaceAndComments) {
  Fragment fragment("<saml:ProxyRestriction Count='1'> <!-- c --> \n</saml:ProxyRestriction>");
  EXPECT_NO_THROW(RequireEmptyElement(fragment.It()));
}

TEST(ElementChecksTest, TextualContentIsReturnedUntrimmedAndCommentsBesideItAreSkipped) {
  Fragment fragment("<saml:Audience><!-- c --> a b </saml:Audience>");
  std::string text;
  RequireTextualContent(fragment.It(), text);
  EXPECT_EQ(" a b ", text);
}

TEST(ElementChecksTest, ReferencesAreResolvedIntoText) {
  Fragment fragment("<saml:Audience>a&amp;b&#x43;</saml:Audience>");
  std::string text;
  RequireTextualContent(fragment.It(), text);
  EXPECT_EQ("a&bC", text);
}

struct BoolCase {
  const char* value;
  bool expected;
};

class BoolAttributeTest : public ::testing::TestWithParam<BoolCase> {};

TEST_P(BoolAttributeTest, ReadsBooleanWords) {
  SCOPED_TRACE(GetParam().value);
  Fragment fragment(std::string("<e flag='") + GetParam().value + "'/>");
  bool value = !GetParam().expected;
  GetBoolAttribute(fragment.Element(), "flag", value);
  EXPECT_EQ(GetParam().expected, value);
}

INSTANTIATE_TEST_SUITE_P(Words, BoolAttributeTest,
                         ::testing::Values(BoolCase{"1", true}, BoolCase{"true", true}, BoolCase{"TRUE", true},
                                           BoolCase{"0", false}, BoolCase{"false", false},
                                           BoolCase{"False", false}));

TEST(BoolAttributeTest, RejectsOtherWordsAndAbsence) {
  for (const char* xml : {"<e flag='yes'/>", "<e flag=' true'/>", "<e/>"}) {
    SCOPED_TRACE(xml);
    Fragment fragment(xml);
    bool value = false;
    try {
      GetBoolAttribute(fragment.Element(), "flag", value);
      FAIL();
    } catch (const ParseException& e) {
      EXPECT_STREQ("e/@flag is not a Boolean", e.what());
    }
  }
}

struct CountCase {
  const char* value;
  boost::optional<unsigned long long> expected;  // none: rejected
};

class CountAttributeTest : public ::testing::TestWithParam<CountCase> {};

TEST_P(CountAttributeTest, ReadsNonNegativeSignedIntegers) {
  const CountCase& c = GetParam();
  SCOPED_TRACE(c.value);
  Fragment fragment(std::string("<e Count='") + c.value + "'/>");
  boost::optional<unsigned long long> count;
  if (c.expected) {
    GetULongOptionalAttribute(fragment.Element(), "Count", count);
    EXPECT_EQ(c.expected, count);
    return;
  }
  try {
    GetULongOptionalAttribute(fragment.Element(), "Count", count);
    FAIL() << "read " << *count;
  } catch (const ParseException& e) {
    EXPECT_STREQ("e/@Count is not a non-negative integer.", e.what());
    EXPECT_FALSE(count);
  }
}

INSTANTIATE_TEST_SUITE_P(
    Values, CountAttributeTest,
    ::testing::Values(CountCase{"0", 0ULL}, CountCase{"-0", 0ULL}, CountCase{"5", 5ULL},
                      CountCase{"9223372036854775807", 9223372036854775807ULL}, CountCase{"-1", boost::none},
                      CountCase{"abc", boost::none}, CountCase{"9223372036854775808", boost::none},
                      CountCase{"18446744073709551615", boost::none}, CountCase{"", boost::none},
                      CountCase{" 1", boost::none}, CountCase{"1.0", boost::none}));

TEST(CountAttributeTest, AbsentCountLeavesTheValueUnchanged) {
  Fragment fragment("<e/>");
  boost::optional<unsigned long long> count = 7ULL;
  GetULongOptionalAttribute(fragment.Element(), "Count", count);
  EXPECT_EQ(boost::optional<unsigned long long>(7ULL), count);
}

// ---- Readers ---------------------------------------------------------------------------------

TEST(ConditionsReaderTest, ReadsTheFourRestrictionsInAnyOrder) {
  const std::string delegation =
      "<saml:Condition xsi:type='del:DelegationRestrictionType'>"
      "<del:Delegate DelegationInstant='2027-06-01T09:00:00Z'><saml:NameID Format='f'>a@b</saml:NameID></del:Delegate>"
      "<del:Delegate DelegationInstant='2027-06-01T09:30:00Z'><saml:NameID Format='f'>c@d</saml:NameID>"
      "<del:Extension/></del:Delegate></saml:Condition>";
  const std::string renew = "<saml:Condition xsi:type='rsa:RenewRestrictionType' Count='3' Postdatable='true' "
                            "RenewExpired='false'/>";
  const std::string proxy = "<saml:ProxyRestriction Count='2'/>";
  const std::string audience =
      "<saml:AudienceRestriction><saml:Audience>a</saml:Audience><saml:Audience>b</saml:Audience>"
      "<saml:Audience>a</saml:Audience></saml:AudienceRestriction>";
  for (const std::string& content :
       {delegation + audience + proxy + renew, renew + proxy + audience + delegation, proxy + delegation + renew + audience}) {
    SCOPED_TRACE(content);
    Fragment fragment(CONDITIONS_OPEN + content + "</saml:Conditions><next/>");
    ConditionsType conditions;
    ParseConditionsElement(fragment.It(), conditions);
    EXPECT_EQ(Tamber::System::DateTime("2027-06-01T10:00:00Z"), conditions.notBefore);
    EXPECT_EQ(Tamber::System::DateTime("2027-06-01T11:00:00Z"), conditions.notOnOrAfter);
    ASSERT_TRUE(conditions.delegationRestriction);
    ASSERT_EQ(2u, conditions.delegationRestriction->delegate.size());
    EXPECT_EQ("a@b", conditions.delegationRestriction->delegate[0].nameId.value);
    EXPECT_EQ("c@d", conditions.delegationRestriction->delegate[1].nameId.value);
    EXPECT_EQ(Tamber::System::DateTime("2027-06-01T09:30:00Z"),
              conditions.delegationRestriction->delegate[1].delegationInstant);
    ASSERT_TRUE(conditions.audienceRestriction);
    EXPECT_EQ((std::set<std::string>{"a", "b"}), conditions.audienceRestriction->audience);
    ASSERT_TRUE(conditions.proxyRestriction);
    EXPECT_EQ(boost::optional<unsigned long long>(2ULL), conditions.proxyRestriction->count);
    ASSERT_TRUE(conditions.renewRestriction);
    EXPECT_EQ(boost::optional<unsigned long long>(3ULL), conditions.renewRestriction->count);
    ASSERT_EQ("next", fragment.Element()->GetLocalName());
  }
}

TEST(ConditionsReaderTest, RenewRestrictionWithoutCountLeavesCountUnset) {
  Fragment fragment(CONDITIONS_OPEN + "<saml:Condition xsi:type='rsa:RenewRestrictionType'><any/></saml:Condition>" +
                    "</saml:Conditions>");
  ConditionsType conditions;
  ParseConditionsElement(fragment.It(), conditions);
  ASSERT_TRUE(conditions.renewRestriction);
  EXPECT_FALSE(conditions.renewRestriction->count);
  EXPECT_FALSE(conditions.delegationRestriction);
  EXPECT_FALSE(conditions.audienceRestriction);
  EXPECT_FALSE(conditions.proxyRestriction);
}

TEST(TryParseTest, OtherElementLeavesIteratorAndRecordAlone) {
  Fragment fragment("<saml:AuthnStatement/>");
  NodeFilterIterator& it = fragment.It();
  const Tamber::Xml::Node* before = it.GetNode();
  boost::optional<AdviceType> advice;
  boost::optional<AudienceRestrictionType> audience;
  boost::optional<ProxyRestrictionType> proxy;
  boost::optional<RenewRestrictionType> renew;
  boost::optional<DelegationRestrictionType> delegation;
  TryParseAdviceElement(it, advice);
  TryParseAudienceRestriction(it, audience);
  TryParseProxyRestriction(it, proxy);
  TryParseRenewRestriction(it, renew);
  TryParseDelegationRestriction(it, delegation);
  EXPECT_EQ(before, it.GetNode());
  EXPECT_FALSE(advice || audience || proxy || renew || delegation);
}

TEST(AdviceReaderTest, ReadsSourcesAttributesAndValuesInOrder) {
  Fragment fragment(
      "<saml:Advice><rsa:RSAAdvice AdviceSource='s1'>"
      "<saml:Attribute Name='n1' NameFormat='f' FriendlyName='dropped'><saml:AttributeValue>v1</saml:AttributeValue>"
      "<saml:AttributeValue>v2</saml:AttributeValue></saml:Attribute>"
      "<saml:Attribute Name='n2' NameFormat='f'/></rsa:RSAAdvice>"
      "<rsa:RSAAdvice AdviceSource='s2'><saml:Attribute Name='n3' NameFormat='f'><saml:AttributeValue/>"
      "</saml:Attribute></rsa:RSAAdvice></saml:Advice>");
  boost::optional<AdviceType> advice;
  TryParseAdviceElement(fragment.It(), advice);
  ASSERT_TRUE(advice);
  ASSERT_EQ(2u, advice->advice.size());
  EXPECT_EQ("s1", advice->advice[0].source);
  ASSERT_EQ(2u, advice->advice[0].attributes.size());
  EXPECT_EQ("n1", advice->advice[0].attributes[0].name);
  EXPECT_EQ((std::vector<std::string>{"v1", "v2"}), advice->advice[0].attributes[0].values);
  EXPECT_TRUE(advice->advice[0].attributes[1].values.empty());
  EXPECT_EQ("s2", advice->advice[1].source);
  EXPECT_EQ((std::vector<std::string>{""}), advice->advice[1].attributes[0].values);
  EXPECT_TRUE(fragment.It().AtEnd());
}

TEST(AttributeReaderTest, CopiesNamesAndReadsValues) {
  Fragment fragment(
      "<saml:Attribute Name='n' NameFormat='f' FriendlyName='friend'>"
      "<saml:AttributeValue xsi:type='xs:string' xmlns:xs='http://www.w3.org/2001/XMLSchema'>one</saml:AttributeValue>"
      "<saml:AttributeValue> \n\t</saml:AttributeValue><saml:AttributeValue/>"
      "<saml:AttributeValue><!-- c --></saml:AttributeValue></saml:Attribute>");
  AttributeType attribute;
  ParseAttributeElement(fragment.It(), attribute);
  EXPECT_EQ("n", attribute.name);
  EXPECT_EQ("f", attribute.nameFormat);
  EXPECT_EQ("friend", attribute.friendlyName);
  EXPECT_EQ((std::vector<std::string>{"one", "", "", ""}), attribute.attributeValue);
}

TEST(SubjectReaderTest, ReadsNameAndDelegateIdAndBearerData) {
  Fragment fragment(
      "<saml:Subject><saml:NameID Format='fmt'>alice@example.com</saml:NameID>"
      "<saml:SubjectConfirmation Method='urn:oasis:names:tc:SAML:2.0:cm:bearer'>"
      "<saml:NameID Format='fmt2'>svc@example.com</saml:NameID>"
      "<saml:SubjectConfirmationData NotOnOrAfter='2027-06-01T11:00:00Z'/></saml:SubjectConfirmation>"
      "</saml:Subject>");
  SubjectType subject;
  ParseSubjectElement(fragment.It(), subject);
  EXPECT_EQ("fmt", subject.nameId.format);
  EXPECT_EQ("alice@example.com", subject.nameId.value);
  EXPECT_EQ(SamlToken::CONFIRM_BEARER, subject.subjectConfirmation.method);
  ASSERT_TRUE(subject.subjectConfirmation.nameId);
  EXPECT_EQ("fmt2", subject.subjectConfirmation.nameId->format);
  EXPECT_EQ("svc@example.com", subject.subjectConfirmation.nameId->value);
  EXPECT_EQ(Tamber::System::DateTime("2027-06-01T11:00:00Z"),
            subject.subjectConfirmation.subjectConfirmationData.notOnOrAfter);
  EXPECT_FALSE(subject.subjectConfirmation.subjectConfirmationData.certificate);
}

TEST(SubjectReaderTest, ConfirmationWithoutNameIdClearsTheDelegateId) {
  Fragment fragment(
      "<saml:SubjectConfirmation Method='urn:oasis:names:tc:SAML:2.0:cm:bearer'>"
      "<saml:SubjectConfirmationData NotOnOrAfter='2027-06-01T11:00:00Z'/></saml:SubjectConfirmation>");
  SubjectConfirmationType confirmation;
  confirmation.nameId = NameIDType{"f", "v"};
  ParseSubjectConfirmationElement(fragment.It(), confirmation);
  EXPECT_FALSE(confirmation.nameId);
}

TEST(AuthnStatementReaderTest, ReadsInstantAndClass) {
  Fragment fragment(
      "<saml:AuthnStatement AuthnInstant='2027-06-01T09:59:59.5Z'><saml:AuthnContext>"
      "<saml:AuthnContextClassRef>urn:c</saml:AuthnContextClassRef></saml:AuthnContext></saml:AuthnStatement>");
  AuthnStatementType statement;
  ParseAuthnStatementElement(fragment.It(), statement);
  EXPECT_EQ(Tamber::System::DateTime("2027-06-01T09:59:59.5Z"), statement.authnInstant);
  EXPECT_EQ("urn:c", statement.authnContext.authnContextClassRef);
}

// ---- Whole assertions -------------------------------------------------------------------------

class AssertionReaderTest : public ::testing::Test {
 protected:
  // Reads the root of `xml` as an assertion.
  static SamlAssertionType Read(const std::string& xml) {
    Tamber::Ref<Document> document;
    ParseXML(xml, document);
    NodeFilterIterator it(document->GetRootElement(), boost::make_shared<SkipWsAndCommentsFilter>());
    SamlAssertionType assertion;
    ParseSamlAssertionElement(it, assertion);
    EXPECT_TRUE(it.AtEnd());
    return assertion;
  }

  static std::string Replace(const std::string& text, const std::string& from, const std::string& to) {
    const std::string::size_type at = text.find(from);
    EXPECT_NE(std::string::npos, at) << from;
    return at == std::string::npos ? text : text.substr(0, at) + to + text.substr(at + from.size());
  }

  static std::string Excerpt(const std::string& text, const std::string& begin, const std::string& end) {
    const std::string::size_type from = text.find(begin);
    return text.substr(from, text.find(end, from) + end.size() - from);
  }

  TestSupport::FixedClock _clock{TestSupport::TOKEN_VECTORS_CLOCK};
};

TEST_F(AssertionReaderTest, ReadsEveryPartOfAFullToken) {
  const SamlAssertionType a = Read(TestSupport::ReadTestData("tokens/valid-holder-of-key.xml"));
  EXPECT_EQ("2.0", a.version);
  EXPECT_EQ("_holder-of-key-token", a.id);
  EXPECT_EQ(Tamber::System::DateTime("2027-06-01T10:00:00Z"), a.issueInstant);
  EXPECT_EQ("https://sts.example/sts", a.issuer.value);
  EXPECT_TRUE(a.signature);
  EXPECT_EQ("alice@example.com", a.subject.nameId.value);
  EXPECT_EQ(Saml::UPN_FORMAT, a.subject.nameId.format);
  EXPECT_EQ(SamlToken::CONFIRM_HOLDER_OF_KEY, a.subject.subjectConfirmation.method);
  EXPECT_TRUE(a.subject.subjectConfirmation.subjectConfirmationData.certificate);
  EXPECT_EQ(Tamber::System::DateTime("2027-06-01T11:00:00Z"), a.conditions.notOnOrAfter);
  ASSERT_TRUE(a.advice);
  EXPECT_EQ(2u, a.advice->advice.size());
  ASSERT_TRUE(a.attributeStatement);
  EXPECT_EQ(Saml::ATTRIBUTE_GROUP_IDENTITY, a.attributeStatement->attribute[0].name);
  EXPECT_EQ(10u, a.attributeStatement->attribute[0].attributeValue.size());
}

TEST_F(AssertionReaderTest, TokenWithoutAdviceAndAttributesIsRead) {
  const SamlAssertionType a = Read(TestSupport::ReadTestData("tokens/valid-bearer.xml"));
  EXPECT_FALSE(a.advice);
  EXPECT_FALSE(a.attributeStatement);
  EXPECT_EQ(SamlToken::CONFIRM_BEARER, a.subject.subjectConfirmation.method);
}

TEST_F(AssertionReaderTest, AttributeStatementBeforeAuthnStatementIsRejected) {
  const std::string token = TestSupport::ReadTestData("tokens/valid-holder-of-key.xml");
  const std::string authn = Excerpt(token, "<saml2:AuthnStatement", "</saml2:AuthnStatement>");
  const std::string swapped = Replace(Replace(token, authn, ""), "</saml2:AttributeStatement>",
                                      "</saml2:AttributeStatement>" + authn);
  try {
    Read(swapped);
    FAIL();
  } catch (const ParseException& e) {
    EXPECT_STREQ("Expected element 'AuthnStatement' not found.", e.what());
  }
}

TEST_F(AssertionReaderTest, ContentAfterTheLastStatementIsRejected) {
  const std::string token = TestSupport::ReadTestData("tokens/valid-holder-of-key.xml");
  try {
    Read(Replace(token, "</saml2:AttributeStatement>", "</saml2:AttributeStatement><saml2:Statement/>"));
    FAIL();
  } catch (const ParseException& e) {
    EXPECT_STREQ("Unexpected elements under Assertion", e.what());
  }
}

TEST_F(AssertionReaderTest, SignatureThatReferencesAnotherIdIsRejected) {
  const std::string token = TestSupport::ReadTestData("tokens/valid-bearer.xml");
  try {
    Read(Replace(token, "URI=\"#_bearer-token\"", "URI=\"#_other\""));
    FAIL();
  } catch (const ParseException& e) {
    EXPECT_STREQ("Token's signature must cover the entire token", e.what());
  }
}

TEST_F(AssertionReaderTest, SignatureWithEmptyReferenceCoversTheToken) {
  const std::string token = TestSupport::ReadTestData("tokens/valid-bearer.xml");
  EXPECT_NO_THROW(Read(Replace(token, "URI=\"#_bearer-token\"", "URI=\"\"")));
}

}  // namespace
}  // namespace SsoClient
