#include "ssoClient/xmlRequestBuilders.h"

#include <limits>

#include <gtest/gtest.h>

#include "ssoClient/BuiltTreeSupport.h"
#include "ssoClient/XmlUtils.h"
#include "support/FixedClock.h"
#include "support/TestTokens.h"
#include "tamber/Exception.h"
#include "tamber/Stream.h"

namespace SsoClient {
namespace {

using BuiltTree::Build;
using BuiltTree::ChildElements;
using BuiltTree::ChildNames;
using BuiltTree::Serialize;
using Tamber::Ref;
using Tamber::Xml::ElementNode;

// The texts as the STS expects them, written out here independently of the library's constants.
const std::string WSSE = "http://docs.oasis-open.org/wss/2004/01/oasis-200401-wss-wssecurity-secext-1.0.xsd";
const std::string WSU = "http://docs.oasis-open.org/wss/2004/01/oasis-200401-wss-wssecurity-utility-1.0.xsd";
const std::string WST = "http://docs.oasis-open.org/ws-sx/ws-trust/200512";
const std::string PASSWORD_TEXT =
    "http://docs.oasis-open.org/wss/2004/01/oasis-200401-wss-username-token-profile-1.0#PasswordText";
const char NOON[] = "2027-05-17T12:00:00.250Z";

ElementNode* Child(const ElementNode* element, const std::string& localName) {
  ElementNode* child = element->FindChildElementByLocalName(localName);
  EXPECT_NE(nullptr, child) << "no child " << localName;
  return child;
}

std::string ChildText(const ElementNode* element, const std::string& localName) {
  ElementNode* child = Child(element, localName);
  return child == nullptr ? "" : GetText(GetTextNode(child));
}

std::string Attribute(const ElementNode* element, const std::string& name) {
  std::string value;
  EXPECT_TRUE(element->GetAttribute(name, value)) << "no attribute " << name;
  return value;
}

TokenSpec Spec() {
  TokenSpec spec;
  spec.tokenLifetimeSec = 600;
  spec.delegable = false;
  spec.renewable = false;
  return spec;
}

Advice MakeAdvice(const std::string& source, std::vector<AdviceAttribute> attributes) {
  Advice advice;
  advice.source = source;
  advice.attributes = std::move(attributes);
  return advice;
}

AdviceAttribute MakeAttribute(const std::string& name, std::vector<std::string> values) {
  AdviceAttribute attribute;
  attribute.name = name;
  attribute.values = std::move(values);
  return attribute;
}

class WsSecurityHeaderTest : public ::testing::Test {
 protected:
  TestSupport::FixedClock _clock{NOON};
};

TEST_F(WsSecurityHeaderTest, SecurityHeaderHoldsATimestampExpiringTenMinutesLater) {
  EXPECT_EQ("<wsse:Security xmlns:wsse=\"" + WSSE + "\"><wsu:Timestamp xmlns:wsu=\"" + WSU +
                "\"><wsu:Created>2027-05-17T12:00:00.250Z</wsu:Created>"
                "<wsu:Expires>2027-05-17T12:10:00.250Z</wsu:Expires></wsu:Timestamp></wsse:Security>",
            SerializeToXML(WsSecurityHeaderBuilder(10)));
}

TEST_F(WsSecurityHeaderTest, TheTimestampCarriesNoIdUntilSigned) {
  const Ref<ElementNode> timestamp = Build(WssuTimestampBuilder(10));
  EXPECT_EQ((std::vector<std::string>{"xmlns:wsu"}), timestamp->GetAttributeNames());
}

TEST_F(WsSecurityHeaderTest, TimesAreFixedWhenTheFactoryIsCalledNotWhenBuilt) {
  const BuilderPtr timestamp = WssuTimestampBuilder(10);
  const BuilderPtr lifetime = WssuLifetimeBuilder(60);
  const std::string timestampText = SerializeToXML(timestamp);
  const std::string lifetimeText = SerializeToXML(lifetime);
  _clock.AdvanceSeconds(3600);
  EXPECT_EQ(timestampText, SerializeToXML(timestamp));
  EXPECT_EQ(lifetimeText, SerializeToXML(lifetime));
}

TEST_F(WsSecurityHeaderTest, UsernameTokenWithPasswordHasUsernameThenPasswordWithOnlyItsType) {
  EXPECT_EQ("<wsse:UsernameToken xmlns:wsse=\"" + WSSE +
                "\"><wsse:Username>alice@example.com</wsse:Username>"
                "<wsse:Password Type=\"" + PASSWORD_TEXT + "\">s3cret</wsse:Password></wsse:UsernameToken>",
            SerializeToXML(WsseUsernameTokenBuilder("alice@example.com", "s3cret")));
  const Ref<ElementNode> token = Build(WsseUsernameTokenBuilder("alice@example.com", "s3cret"));
  EXPECT_EQ((std::vector<std::string>{"Type"}), Child(token.get(), "Password")->GetAttributeNames());
}

TEST_F(WsSecurityHeaderTest, UsernameTokenWithoutPasswordHasOnlyTheUsername) {
  EXPECT_EQ("<wsse:UsernameToken xmlns:wsse=\"" + WSSE + "\"><wsse:Username>bob</wsse:Username></wsse:UsernameToken>",
            SerializeToXML(WsseUsernameTokenBuilder("bob")));
}

TEST_F(WsSecurityHeaderTest, EmptyUserNameAndPasswordAreSentAsEmptyTexts) {
  const Ref<ElementNode> token = Build(WsseUsernameTokenBuilder("", ""));
  EXPECT_EQ((std::vector<std::string>{"wsse:Username", "wsse:Password"}), ChildNames(token.get()));
  EXPECT_EQ("", ChildText(token.get(), "Username"));
  EXPECT_EQ("", ChildText(token.get(), "Password"));
}

TEST_F(WsSecurityHeaderTest, MarkupInUserNameAndPasswordTravelsEscapedAndComesBackIntact) {
  const std::string user = "a<b>&c]]>\"x'</wsse:Username>";
  const std::string password = "p&amp;<![CDATA[x]]>";
  const std::string text = SerializeToXML(WsseUsernameTokenBuilder(user, password));
  Ref<Tamber::Xml::Document> document;
  ParseXML(text, document);
  const ElementNode* token = document->GetRootElement();
  EXPECT_EQ((std::vector<std::string>{"wsse:Username", "wsse:Password"}), ChildNames(token));
  EXPECT_EQ(user, ChildText(token, "Username"));
  EXPECT_EQ(password, ChildText(token, "Password"));
}

TEST_F(WsSecurityHeaderTest, LifetimeExpiresTheGivenSecondsAfterItIsCreated) {
  EXPECT_EQ("<wst:Lifetime xmlns:wsu=\"" + WSU +
                "\"><wsu:Created>2027-05-17T12:00:00.250Z</wsu:Created>"
                "<wsu:Expires>2027-05-17T12:10:00.250Z</wsu:Expires></wst:Lifetime>",
            SerializeToXML(WssuLifetimeBuilder(600)));
}

TEST_F(WsSecurityHeaderTest, ADayLongLifetimeBuiltLateInTheEveningEndsOnTheNextDay) {
  _clock.Set(Tamber::System::DateTime("2027-12-31T23:59:30.000Z").GetUtcTime());
  const Ref<ElementNode> lifetime = Build(WssuLifetimeBuilder(86400));
  EXPECT_EQ("2027-12-31T23:59:30.000Z", ChildText(lifetime.get(), "Created"));
  EXPECT_EQ("2028-01-01T23:59:30.000Z", ChildText(lifetime.get(), "Expires"));
}

TEST_F(WsSecurityHeaderTest, ALifetimeBeyondTheClockIsRefusedInsteadOfWrappingAround) {
  for (long long seconds : {std::numeric_limits<long long>::max(), std::numeric_limits<long long>::max() / 1000000}) {
    SCOPED_TRACE(seconds);
    try {
      WssuLifetimeBuilder(seconds);
      FAIL() << "accepted";
    } catch (const Tamber::InvalidArgumentException& e) {
      EXPECT_EQ("Invalid argument : Token lifetime of " + std::to_string(seconds) +
                    " seconds ends beyond the range of the clock",
                e.what());
    }
  }
}

class WsTrustBodyTest : public ::testing::Test {
 protected:
  TestSupport::FixedClock _clock{NOON};
};

TEST_F(WsTrustBodyTest, ABearerRequestWithNothingOptionalHasExactlySixChildren) {
  const std::string expected =
      "<wst:RequestSecurityToken xmlns:wst=\"" + WST +
      "\"><wst:TokenType>urn:oasis:names:tc:SAML:2.0:assertion</wst:TokenType>"
      "<wst:RequestType>" + WST + "/Issue</wst:RequestType>"
      "<wst:KeyType>" + WST + "/Bearer</wst:KeyType>"
      "<wst:Lifetime xmlns:wsu=\"" + WSU + "\"><wsu:Created>2027-05-17T12:00:00.250Z</wsu:Created>"
      "<wsu:Expires>2027-05-17T12:10:00.250Z</wsu:Expires></wst:Lifetime>"
      "<wst:Renewing Allow=\"false\" OK=\"false\"/>"
      "<wst:Delegatable>false</wst:Delegatable></wst:RequestSecurityToken>";
  EXPECT_EQ(expected, SerializeToXML(AcquireSecurityTokenBuilder(SamlToken::CONFIRM_BEARER, Spec())));
  EXPECT_EQ(expected, SerializeToXML(ExchangeSecurityTokenBuilder(SamlToken::CONFIRM_BEARER, Spec())));
}

TEST_F(WsTrustBodyTest, AFullHolderOfKeyRequestKeepsTheWireOrder) {
  TokenSpec spec = Spec();
  spec.renewable = true;
  spec.delegable = true;
  spec.audienceRestriction = {"urn:b", "urn:a"};
  spec.advice = {MakeAdvice("urn:source", {MakeAttribute("urn:name", {"v"})})};
  const Ref<ElementNode> rst = Build(AcquireSecurityTokenBuilder(SamlToken::CONFIRM_HOLDER_OF_KEY, spec));

  EXPECT_EQ((std::vector<std::string>{"wst:TokenType", "wst:RequestType", "wst:KeyType", "wst:Lifetime",
                                      "wst:Renewing", "wst:Delegatable", "wst:Participants",
                                      "rsa-advice:AdviceSet", "wst:UseKey"}),
            ChildNames(rst.get()));
  EXPECT_EQ(WST + "/PublicKey", ChildText(rst.get(), "KeyType"));
  EXPECT_EQ("true", ChildText(rst.get(), "Delegatable"));
  EXPECT_EQ("true", Attribute(Child(rst.get(), "Renewing"), "Allow"));
  EXPECT_EQ((std::vector<std::string>{"Sig"}), Child(rst.get(), "UseKey")->GetAttributeNames());
  EXPECT_EQ("holderOfKeyProofSignature", Attribute(Child(rst.get(), "UseKey"), "Sig"));
}

TEST_F(WsTrustBodyTest, AHolderOfKeyRequestForADelegateHasDelegateToAndNoUseKey) {
  TokenSpec spec = Spec();
  spec.delegateTo = std::string("service@example.com");
  spec.audienceRestriction = {"urn:a"};
  const Ref<ElementNode> rst = Build(AcquireSecurityTokenBuilder(SamlToken::CONFIRM_HOLDER_OF_KEY, spec));

  EXPECT_EQ((std::vector<std::string>{"wst:TokenType", "wst:RequestType", "wst:KeyType", "wst:Lifetime",
                                      "wst:Renewing", "wst:Delegatable", "wst:DelegateTo", "wst:Participants"}),
            ChildNames(rst.get()));
  EXPECT_EQ(WST + "/PublicKey", ChildText(rst.get(), "KeyType"));
  EXPECT_EQ("<wst:DelegateTo><wsse:UsernameToken xmlns:wsse=\"" + WSSE +
                "\"><wsse:Username>service@example.com</wsse:Username></wsse:UsernameToken></wst:DelegateTo>",
            SerializeToXML(WstDelegateToBuilder("service@example.com")));
}

TEST_F(WsTrustBodyTest, TheCommonRequestIsOpenForFurtherChildren) {
  boost::shared_ptr<XMLCompositeBuilder> rst = CommonAcquireSecurityTokenBuilder(SamlToken::CONFIRM_HOLDER_OF_KEY, Spec());
  rst->Add(ElementBuilder("wst", "Extra"));
  const std::vector<std::string> names = ChildNames(Build(rst).get());
  ASSERT_EQ(7u, names.size());
  EXPECT_EQ("wst:Extra", names.back());
}

TEST_F(WsTrustBodyTest, ATokenExchangeNeverAsksForUseKey) {
  const Ref<ElementNode> rst = Build(ExchangeSecurityTokenBuilder(SamlToken::CONFIRM_HOLDER_OF_KEY, Spec()));
  EXPECT_EQ(nullptr, rst->FindChildElementByLocalName("UseKey"));
  EXPECT_EQ(WST + "/PublicKey", ChildText(rst.get(), "KeyType"));
}

TEST_F(WsTrustBodyTest, AudienceMembersAreSentInAscendingOrderAsAddresses) {
  EXPECT_EQ("<wst:Participants xmlns:wsa=\"http://www.w3.org/2005/08/addressing\">"
            "<wst:Participant><wsa:EndpointReference><wsa:Address>a</wsa:Address></wsa:EndpointReference></wst:Participant>"
            "<wst:Participant><wsa:EndpointReference><wsa:Address>b &amp; c</wsa:Address></wsa:EndpointReference>"
            "</wst:Participant></wst:Participants>",
            SerializeToXML(WstParticipantsBuilders({"b & c", "a"})));
}

TEST_F(WsTrustBodyTest, RenewingAllowsAfterTheSpecAndNeverSaysOk) {
  EXPECT_EQ("<wst:Renewing Allow=\"false\" OK=\"false\"/>", SerializeToXML(WstRenewingBuilder(false)));
  EXPECT_EQ("<wst:Renewing Allow=\"true\" OK=\"false\"/>", SerializeToXML(WstRenewingBuilder(true)));
}

TEST_F(WsTrustBodyTest, BinaryExchangeCarriesTheLegInBase64) {
  const std::vector<unsigned char> leg{0x60, 0x82, 0x00, 0xff, 0x3e};
  EXPECT_EQ("<wst:BinaryExchange EncodingType=\"http://docs.oasis-open.org/wss/2004/01/"
            "oasis-200401-wss-soap-message-security-1.0#Base64Binary\" "
            "ValueType=\"http://schemas.xmlsoap.org/ws/2005/02/trust/spnego\">YIIA/z4=</wst:BinaryExchange>",
            SerializeToXML(WstSPNegoBinExchangeBuilder(leg)));
}

TEST_F(WsTrustBodyTest, AnEmptyLegIsAnEmptyText) {
  const Ref<ElementNode> exchange = Build(WstSPNegoBinExchangeBuilder({}));
  EXPECT_EQ("", GetText(GetTextNode(exchange.get())));
}

TEST_F(WsTrustBodyTest, TheFirstSpnegoBodyIsTheIssueRequestWithTheLegLastAndAFreshContext) {
  const XMLBodyBuilderInitialSPNego builder(SamlToken::CONFIRM_HOLDER_OF_KEY, Spec(), {1, 2, 3});
  Ref<ElementNode> first;
  builder.build(first);
  EXPECT_EQ((std::vector<std::string>{"wst:TokenType", "wst:RequestType", "wst:KeyType", "wst:Lifetime",
                                      "wst:Renewing", "wst:Delegatable", "wst:UseKey", "wst:BinaryExchange"}),
            ChildNames(first.get()));
  EXPECT_EQ("AQID", ChildText(first.get(), "BinaryExchange"));
  const std::string context = Attribute(first.get(), "Context");
  EXPECT_EQ(0u, Serialize(first.get()).find("<wst:RequestSecurityToken xmlns:wst=\"" + WST + "\" Context=\"" + context + "\">"));
  ASSERT_EQ(0u, context.find("urn:uuid:"));
  EXPECT_EQ(36u, context.size() - 9);

  Ref<ElementNode> second;
  builder.build(second);
  EXPECT_NE(context, Attribute(second.get(), "Context"));
}

TEST_F(WsTrustBodyTest, TheFirstSpnegoBodyReadsTheClockWhenBuilt) {
  const XMLBodyBuilderInitialSPNego builder(SamlToken::CONFIRM_BEARER, Spec(), {1});
  _clock.AdvanceSeconds(60);
  Ref<ElementNode> body;
  builder.build(body);
  EXPECT_EQ("2027-05-17T12:01:00.250Z", ChildText(Child(body.get(), "Lifetime"), "Created"));
  EXPECT_EQ(nullptr, body->FindChildElementByLocalName("UseKey"));
}

TEST_F(WsTrustBodyTest, AContinuedSpnegoBodyCarriesOnlyTheLegInTheGivenContext) {
  const std::string contextId = "urn:uuid:5e1f \"&<odd>";
  const XMLBodyBuilderContinuedSPNego builder(contextId, {0xde, 0xad});
  Ref<ElementNode> body;
  builder.build(body);
  EXPECT_EQ("<wst:RequestSecurityTokenResponse Context=\"urn:uuid:5e1f &quot;&amp;&lt;odd&gt;\">"
            "<wst:BinaryExchange EncodingType=\"http://docs.oasis-open.org/wss/2004/01/"
            "oasis-200401-wss-soap-message-security-1.0#Base64Binary\" "
            "ValueType=\"http://schemas.xmlsoap.org/ws/2005/02/trust/spnego\">3q0=</wst:BinaryExchange>"
            "</wst:RequestSecurityTokenResponse>",
            Serialize(body.get()));
  EXPECT_EQ(contextId, Attribute(body.get(), "Context"));
}

class TokenBodyTest : public WsTrustBodyTest {
 protected:
  static boost::shared_ptr<const SamlToken> Token(SamlToken::ConfirmationType confirmation) {
    TokenIssuer::TokenRecord record =
        confirmation == SamlToken::CONFIRM_HOLDER_OF_KEY ? TestSupport::HolderOfKeyRecord() : TokenIssuer::TokenRecord();
    return CreateSamlToken(TestSupport::IssueTestToken(record), TestSupport::TrustedCertificates());
  }
};

TEST_F(TokenBodyTest, ARenewalSendsTypeRequestLifetimeAndTheTokenOnly) {
  const boost::shared_ptr<const SamlToken> token = Token(SamlToken::CONFIRM_HOLDER_OF_KEY);
  const Ref<ElementNode> rst = Build(RenewSecurityTokenBuilder(*token, 3600));
  EXPECT_EQ((std::vector<std::string>{"wst:TokenType", "wst:RequestType", "wst:Lifetime", "wst:RenewTarget"}),
            ChildNames(rst.get()));
  EXPECT_EQ("urn:oasis:names:tc:SAML:2.0:assertion", ChildText(rst.get(), "TokenType"));
  EXPECT_EQ(WST + "/Renew", ChildText(rst.get(), "RequestType"));
  EXPECT_EQ("2027-05-17T13:00:00.250Z", ChildText(Child(rst.get(), "Lifetime"), "Expires"));
  const std::vector<ElementNode*> target = ChildElements(Child(rst.get(), "RenewTarget"));
  ASSERT_EQ(1u, target.size());
  EXPECT_EQ(token->GetId(), Attribute(target[0], "ID"));
}

TEST_F(TokenBodyTest, AValidationAsksForTheStatusOfTheTokenWithoutLifetime) {
  const boost::shared_ptr<const SamlToken> token = Token(SamlToken::CONFIRM_BEARER);
  const Ref<ElementNode> rst = Build(ValidateSecurityTokenBuilder(*token));
  EXPECT_EQ((std::vector<std::string>{"wst:TokenType", "wst:RequestType", "wst:ValidateTarget"}), ChildNames(rst.get()));
  EXPECT_EQ(WST + "/RSTR/Status", ChildText(rst.get(), "TokenType"));
  EXPECT_EQ(WST + "/Validate", ChildText(rst.get(), "RequestType"));
  const std::vector<ElementNode*> target = ChildElements(Child(rst.get(), "ValidateTarget"));
  ASSERT_EQ(1u, target.size());
  EXPECT_EQ("Assertion", target[0]->GetLocalName());
}

using TokenBodyDeathTest = TokenBodyTest;

TEST_F(TokenBodyDeathTest, RenewingABearerTokenEndsTheProcessNamingTheInvariant) {
  const boost::shared_ptr<const SamlToken> token = Token(SamlToken::CONFIRM_BEARER);
  EXPECT_DEATH(RenewSecurityTokenBuilder(*token, 60),
               "token.GetConfirmationMethod\\(\\) == SamlToken::CONFIRM_HOLDER_OF_KEY");
}

TEST(WsTrustBodyDeathTest, AnUnknownConfirmationTypeEndsTheProcess) {
  // Under clang's UndefinedBehaviorSanitizer the out-of-range value ends the process even before
  // the invariant check does.
  EXPECT_DEATH(CommonAcquireSecurityTokenBuilder(static_cast<SamlToken::ConfirmationType>(7), Spec()),
               "false.*xmlRequestBuilders|not a valid value for type 'SamlToken::ConfirmationType'");
}

TEST(AdviceBuilderTest, AnAdviceSetDeclaresItsFourPrefixesAndNothingElseDoes) {
  EXPECT_EQ("<rsa-advice:AdviceSet xmlns:rsa-advice=\"http://www.rsa.com/names/2009/12/std-ext/WS-Trust1.4/advice\" "
            "xmlns:saml=\"urn:oasis:names:tc:SAML:2.0:assertion\" xmlns:xs=\"http://www.w3.org/2001/XMLSchema\" "
            "xmlns:xsi=\"http://www.w3.org/2001/XMLSchema-instance\">"
            "<rsa-advice:Advice AdviceSource=\"urn:s\"><rsa-advice:Attribute Name=\"urn:n\">"
            "<rsa-advice:AttributeValue xsi:type=\"xs:string\">v</rsa-advice:AttributeValue>"
            "</rsa-advice:Attribute></rsa-advice:Advice></rsa-advice:AdviceSet>",
            SerializeToXML(RsaAdviceSetBuilder({MakeAdvice("urn:s", {MakeAttribute("urn:n", {"v"})})})));
}

TEST(AdviceBuilderTest, AnEmptyVectorYieldsOnlyTheDeclarations) {
  const Ref<ElementNode> set = Build(RsaAdviceSetBuilder({}));
  EXPECT_TRUE(ChildElements(set.get()).empty());
  EXPECT_EQ((std::vector<std::string>{"xmlns:rsa-advice", "xmlns:saml", "xmlns:xs", "xmlns:xsi"}),
            set->GetAttributeNames());
}

TEST(AdviceBuilderTest, AnAdviceWithoutAttributesCarriesOnlyItsSource) {
  EXPECT_EQ("<rsa-advice:Advice AdviceSource=\"urn:s\"/>", SerializeToXML(RsaAdviceBuilder(MakeAdvice("urn:s", {}))));
}

TEST(AdviceBuilderTest, AnAttributeWithoutValuesHasNoChildren) {
  EXPECT_EQ("<rsa-advice:Attribute Name=\"urn:n\"/>", SerializeToXML(RsaAttributeBuilder(MakeAttribute("urn:n", {}))));
}

TEST(AdviceBuilderTest, ValuesKeepTheirOrderRepeatsAndEmptiness) {
  const Ref<ElementNode> attribute = Build(RsaAttributeBuilder(MakeAttribute("urn:n", {"b", "a", "b", ""})));
  std::vector<std::string> values;
  for (const ElementNode* value : ChildElements(attribute.get())) {
    EXPECT_EQ("xs:string", Attribute(value, "xsi:type"));
    values.push_back(GetText(GetTextNode(value)));
  }
  EXPECT_EQ((std::vector<std::string>{"b", "a", "b", ""}), values);
}

TEST(AdviceBuilderTest, EntriesWithTheSameSourceAreNeitherMergedNorSorted) {
  const Ref<ElementNode> set = Build(RsaAdviceSetBuilder(
      {MakeAdvice("urn:z", {MakeAttribute("urn:2", {}), MakeAttribute("urn:1", {})}), MakeAdvice("urn:z", {})}));
  const std::vector<ElementNode*> entries = ChildElements(set.get());
  ASSERT_EQ(2u, entries.size());
  EXPECT_EQ("urn:z", Attribute(entries[1], "AdviceSource"));
  const std::vector<ElementNode*> attributes = ChildElements(entries[0]);
  ASSERT_EQ(2u, attributes.size());
  EXPECT_EQ("urn:2", Attribute(attributes[0], "Name"));
  EXPECT_EQ("urn:1", Attribute(attributes[1], "Name"));
}

}  // namespace
}  // namespace SsoClient
