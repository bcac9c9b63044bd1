// Golden files: tests/data/requests/<kind>.xml hold the serialised envelope of each request kind,
// with only what changes from run to run masked (UUIDs, and so the ids and context ids built from
// them; digest and signature values). The clock is fixed, so the times stay as written. After an
// intended change of the wire format, regenerate them and review the diff:
//
//   SSOCLIENT_UPDATE_GOLDEN=1 build/tests/RequestBuilderImplTest --gtest_filter='*RequestGolden*'

#include "ssoClient/RequestBuilderImpl.h"

#include <cstdlib>
#include <fstream>
#include <functional>
#include <regex>
#include <thread>
#include <typeinfo>

#include <gtest/gtest.h>

#include "ssoClient/XmlUtils.h"
#include "support/FixedClock.h"
#include "support/RequestSignatureCheck.h"
#include "support/TestTokens.h"
#include "tamber/Exception.h"
#include "tamber/xml/QName.h"

namespace SsoClient {
namespace {

using Tamber::Ref;
using Tamber::Xml::ElementNode;
using Tamber::Xml::QName;

const std::string SOAPENV = "http://schemas.xmlsoap.org/soap/envelope/";
const std::string WST = "http://docs.oasis-open.org/ws-sx/ws-trust/200512";
const std::string WSSE = "http://docs.oasis-open.org/wss/2004/01/oasis-200401-wss-wssecurity-secext-1.0.xsd";
const std::string DS = "http://www.w3.org/2000/09/xmldsig#";
const char CLOCK[] = "2027-05-17T12:00:00.250Z";

// What varies from run to run, replaced by fixed words.
std::string Mask(const std::string& text) {
  static const std::regex uuid("[0-9a-f]{8}-[0-9a-f]{4}-[0-9a-f]{4}-[0-9a-f]{4}-[0-9a-f]{12}");
  static const std::regex digest("(<(\\w+:)?DigestValue>)[^<]*(</(\\w+:)?DigestValue>)");
  static const std::regex signature("(<(\\w+:)?SignatureValue>)[^<]*(</(\\w+:)?SignatureValue>)");
  std::string masked = std::regex_replace(text, uuid, "{UUID}");
  masked = std::regex_replace(masked, digest, "$1{DIGEST}$3");
  return std::regex_replace(masked, signature, "$1{SIGNATURE}$3");
}

using TestSupport::ClientKeyMaterial;

TokenSpec Spec() {
  TokenSpec spec;
  spec.tokenLifetimeSec = 3600;
  spec.delegable = false;
  spec.renewable = false;
  spec.confirmation = TokenSpec::CONFIRMATION_DEFAULT;
  return spec;
}

TokenSpec DelegatedSpec() {
  TokenSpec spec = Spec();
  spec.delegateTo = std::string("service@example.com");
  return spec;
}

TokenSpec BearerSpec() {
  TokenSpec spec = Spec();
  spec.confirmation = TokenSpec::CONFIRMATION_BEARER;
  return spec;
}

// A token issued by the test STS with a fixed id, so that requests carrying it are stable.
boost::shared_ptr<const SamlToken> Token(SamlToken::ConfirmationType confirmation) {
  TokenIssuer::TokenRecord record =
      confirmation == SamlToken::CONFIRM_HOLDER_OF_KEY ? TestSupport::HolderOfKeyRecord() : TokenIssuer::TokenRecord();
  record.id = confirmation == SamlToken::CONFIRM_HOLDER_OF_KEY ? "_hok-token" : "_bearer-token";
  return CreateSamlToken(TestSupport::IssueTestToken(record), TestSupport::TrustedCertificates());
}

Ref<Tamber::Xml::Document> Parse(const std::string& text) {
  Ref<Tamber::Xml::Document> document;
  ParseXML(text, document);
  return document;
}

ElementNode* Path(ElementNode* element, std::initializer_list<std::pair<std::string, std::string>> steps) {
  for (const auto& step : steps) {
    if (element == nullptr) return nullptr;
    element = element->FindChildElement(QName(step.first, step.second));
  }
  return element;
}

ElementNode* Security(const Ref<Tamber::Xml::Document>& document) {
  return Path(document->GetRootElement(), {{SOAPENV, "Header"}, {WSSE, "Security"}});
}

ElementNode* Rst(const Ref<Tamber::Xml::Document>& document) {
  ElementNode* body = Path(document->GetRootElement(), {{SOAPENV, "Body"}});
  return body == nullptr ? nullptr : body->FindChildElementByLocalName("RequestSecurityToken");
}

std::string Text(const ElementNode* element) { return element == nullptr ? "<absent>" : GetText(GetTextNode(element)); }

// --- Golden requests ---

struct GoldenCase {
  const char* kind;
  bool keyMaterial;
  std::function<void(const RequestBuilderImpl&, Request&)> build;
  const char* soapAction;
  // Whose key must have signed: none, the configured client key (by its certificate), or the
  // confirmation certificate of the presented token.
  enum Signer { UNSIGNED, CLIENT_CERTIFICATE, TOKEN_CONFIRMATION } signer;
};

std::ostream& operator<<(std::ostream& out, const GoldenCase& golden) { return out << golden.kind; }

TokenSpec AudienceAndAdviceSpec() {
  TokenSpec spec = Spec();
  spec.delegable = true;
  spec.renewable = true;
  spec.audienceRestriction = {"https://service-b.example", "https://service-a.example"};
  AdviceAttribute roles;
  roles.name = "urn:example:roles";
  roles.values = {"reader", "writer & <admin>"};
  Advice advice;
  advice.source = "urn:example:advice-source";
  advice.attributes = {roles};
  spec.advice = {advice};
  return spec;
}

const GoldenCase GOLDEN_CASES[] = {
    {"userpass-bearer", false,
     [](const RequestBuilderImpl& b, Request& r) { b.BuildUserPassTokenRequest("alice@example.com", "s3cret", Spec(), r); },
     "http://docs.oasis-open.org/ws-sx/ws-trust/200512/RST/Issue", GoldenCase::UNSIGNED},
    {"userpass-holder-of-key", true,
     [](const RequestBuilderImpl& b, Request& r) { b.BuildUserPassTokenRequest("alice@example.com", "s3cret", Spec(), r); },
     "http://docs.oasis-open.org/ws-sx/ws-trust/200512/RST/Issue", GoldenCase::CLIENT_CERTIFICATE},
    {"userpass-delegated", true,
     [](const RequestBuilderImpl& b, Request& r) {
       b.BuildUserPassTokenRequest("alice@example.com", "s3cret", DelegatedSpec(), r);
     },
     "http://docs.oasis-open.org/ws-sx/ws-trust/200512/RST/Issue", GoldenCase::UNSIGNED},
    {"userpass-audience-advice", true,
     [](const RequestBuilderImpl& b, Request& r) {
       b.BuildUserPassTokenRequest("alice@example.com", "s3cret", AudienceAndAdviceSpec(), r);
     },
     "http://docs.oasis-open.org/ws-sx/ws-trust/200512/RST/Issue", GoldenCase::CLIENT_CERTIFICATE},
    {"certificate", true, [](const RequestBuilderImpl& b, Request& r) { b.BuildCertificateTokenRequest(Spec(), r); },
     "http://docs.oasis-open.org/ws-sx/ws-trust/200512/RST/Issue", GoldenCase::CLIENT_CERTIFICATE},
    {"token-exchange", true,
     [](const RequestBuilderImpl& b, Request& r) {
       b.BuildExchangeTokenRequest(*Token(SamlToken::CONFIRM_HOLDER_OF_KEY), DelegatedSpec(), r);
     },
     "http://docs.oasis-open.org/ws-sx/ws-trust/200512/RST/Issue", GoldenCase::TOKEN_CONFIRMATION},
    {"renew", true,
     [](const RequestBuilderImpl& b, Request& r) { b.BuildRenewRequest(*Token(SamlToken::CONFIRM_HOLDER_OF_KEY), 7200, r); },
     "http://docs.oasis-open.org/ws-sx/ws-trust/200512/RST/Renew", GoldenCase::CLIENT_CERTIFICATE},
    {"validate", false,
     [](const RequestBuilderImpl& b, Request& r) { b.BuildValidateSubjectRequest(*Token(SamlToken::CONFIRM_BEARER), r); },
     "http://docs.oasis-open.org/ws-sx/ws-trust/200512/RST/Validate", GoldenCase::UNSIGNED},
    {"spnego-first", true,
     [](const RequestBuilderImpl& b, Request& r) { b.BuildInitialSPNegoRequest(Spec(), {0x60, 0x28, 0x06, 0x06}, r); },
     "http://docs.oasis-open.org/ws-sx/ws-trust/200512/RST/Issue", GoldenCase::CLIENT_CERTIFICATE},
    {"spnego-continued", true,
     [](const RequestBuilderImpl& b, Request& r) {
       b.BuildContinuedSPNegoRequest("urn:example:sts-context-42", {0xa1, 0x17, 0x30, 0x15}, r);
     },
     "http://docs.oasis-open.org/ws-sx/ws-trust/200512/RSTR/Issue", GoldenCase::UNSIGNED},
};

class RequestGoldenTest : public ::testing::TestWithParam<GoldenCase> {
 protected:
  Request Build() const {
    const RequestBuilderImpl builder(GetParam().keyMaterial ? ClientKeyMaterial() : boost::none);
    Request request;
    GetParam().build(builder, request);
    return request;
  }

  TestSupport::FixedClock _clock{CLOCK};
};

TEST_P(RequestGoldenTest, MatchesTheCheckedInEnvelope) {
  const Request request = Build();
  EXPECT_EQ(GetParam().soapAction, request.soapAction);

  const std::string path = std::string(SSOCLIENT_TEST_DATA_DIR) + "/requests/" + GetParam().kind + ".xml";
  const std::string masked = Mask(request.body);
  const char* update = std::getenv("SSOCLIENT_UPDATE_GOLDEN");
  if (update != nullptr && std::string(update) == "1") {
    std::ofstream(path, std::ios::binary) << masked << "\n";
  }
  std::string expected = TestSupport::ReadTestData("requests/" + std::string(GetParam().kind) + ".xml");
  ASSERT_FALSE(expected.empty());
  ASSERT_EQ('\n', expected.back());
  expected.pop_back();
  EXPECT_EQ(expected, masked);
}

TEST_P(RequestGoldenTest, TheSignatureVerifiesAsTheStsSeesItAndBreaksWithOneChangedByte) {
  if (GetParam().signer == GoldenCase::UNSIGNED) {
    const Ref<Tamber::Xml::Document> document = Parse(Build().body);
    ASSERT_NE(nullptr, Security(document));
    EXPECT_EQ(nullptr, Security(document)->FindChildElement(QName(DS, "Signature")));
    EXPECT_EQ(nullptr, Security(document)->FindChildElement(QName(WSSE, "BinarySecurityToken")));
    return;
  }
  const std::string text = Build().body;
  const Tamber::Crypto::Certificate& signer = GetParam().signer == GoldenCase::TOKEN_CONFIRMATION
                                                  ? *Token(SamlToken::CONFIRM_HOLDER_OF_KEY)->GetConfirmationCertificate()
                                                  : *TestSupport::LoadTestKeyPair("client").certificate;

  const TestSupport::RequestSignatureResult result = TestSupport::VerifyRequestSignature(text, signer);
  EXPECT_EQ("", result.error);
  EXPECT_TRUE(result.valid);
  ASSERT_EQ(2u, result.referenceUris.size());
  EXPECT_EQ(0u, result.referenceUris[0].find("#Body"));
  EXPECT_EQ(0u, result.referenceUris[1].find("#Timestamp"));
  EXPECT_EQ((std::vector<bool>{true, true}), result.referenceValid);

  const TestSupport::ToolResult tool = TestSupport::VerifyRequestWithXmlSecTool(text, signer);
  EXPECT_EQ(0, tool.exitCode) << tool.output;
  EXPECT_NE(std::string::npos, tool.output.find("OK")) << tool.output;

  for (const char* element : {"soapenv:Body", "wsu:Timestamp"}) {
    SCOPED_TRACE(element);
    const std::string altered = TestSupport::AlterFirstTextByteOf(text, element);
    const TestSupport::RequestSignatureResult broken = TestSupport::VerifyRequestSignature(altered, signer);
    EXPECT_EQ("", broken.error);
    EXPECT_FALSE(broken.valid);
    const TestSupport::ToolResult refused = TestSupport::VerifyRequestWithXmlSecTool(altered, signer);
    EXPECT_NE(0, refused.exitCode);
    EXPECT_NE(std::string::npos, refused.output.find("FAIL")) << refused.output;
  }
}

INSTANTIATE_TEST_SUITE_P(EveryKind, RequestGoldenTest, ::testing::ValuesIn(GOLDEN_CASES),
                         [](const ::testing::TestParamInfo<GoldenCase>& info) {
                           std::string name = info.param.kind;
                           for (char& c : name) {
                             if (c == '-') c = '_';
                           }
                           return name;
                         });

// --- Refusals ---

struct FailureCase {
  const char* name;
  boost::optional<HolderOfKeyConfig> config;
  std::function<void(const RequestBuilderImpl&, Request&)> build;
  const std::type_info* exception;
  const char* message;
  // The action left in the request: the earlier one when a check refused the call, the new one
  // when building failed after it was set.
  const char* soapActionAfter;
};

std::ostream& operator<<(std::ostream& out, const FailureCase& failure) { return out << failure.name; }

TokenSpec SpecWith(long long lifetime, TokenSpec::Confirmation confirmation = TokenSpec::CONFIRMATION_DEFAULT) {
  TokenSpec spec = Spec();
  spec.tokenLifetimeSec = lifetime;
  spec.confirmation = confirmation;
  return spec;
}

HolderOfKeyConfig Without(bool key, bool certificate) {
  HolderOfKeyConfig config = *ClientKeyMaterial();
  if (!key) config.privateKey.reset();
  if (!certificate) config.certificate.reset();
  return config;
}

const char LIFETIME[] = "Invalid argument : Token lifetime must be positive";
const char EARLIER[] = "urn:earlier-action";

std::vector<FailureCase> FailureCases() {
  const std::type_info& argument = typeid(Tamber::InvalidArgumentException);
  const std::type_info& state = typeid(Tamber::InvalidStateException);
  const auto hok = [] { return Token(SamlToken::CONFIRM_HOLDER_OF_KEY); };
  const auto bearer = [] { return Token(SamlToken::CONFIRM_BEARER); };
  return {
      {"userpass_lifetime_zero", boost::none,
       [](const RequestBuilderImpl& b, Request& r) { b.BuildUserPassTokenRequest("u", "p", SpecWith(0), r); }, &argument,
       LIFETIME, EARLIER},
      {"userpass_lifetime_negative", ClientKeyMaterial(),
       [](const RequestBuilderImpl& b, Request& r) { b.BuildUserPassTokenRequest("u", "p", SpecWith(-1), r); },
       &argument, LIFETIME, EARLIER},
      {"spnego_lifetime_zero", ClientKeyMaterial(),
       [](const RequestBuilderImpl& b, Request& r) { b.BuildInitialSPNegoRequest(SpecWith(0), {1}, r); }, &argument,
       LIFETIME, EARLIER},
      {"certificate_lifetime_before_configuration", boost::none,
       [](const RequestBuilderImpl& b, Request& r) { b.BuildCertificateTokenRequest(SpecWith(0), r); }, &argument,
       LIFETIME, EARLIER},
      {"certificate_without_configuration", boost::none,
       [](const RequestBuilderImpl& b, Request& r) { b.BuildCertificateTokenRequest(SpecWith(60), r); }, &state,
       "No HolderOfKeyConfig provided. Unable to acquire token by certificate", EARLIER},
      {"certificate_configuration_before_confirmation", boost::none,
       [](const RequestBuilderImpl& b, Request& r) {
         b.BuildCertificateTokenRequest(SpecWith(60, TokenSpec::CONFIRMATION_BEARER), r);
       },
       &state, "No HolderOfKeyConfig provided. Unable to acquire token by certificate", EARLIER},
      {"certificate_bearer_confirmation", ClientKeyMaterial(),
       [](const RequestBuilderImpl& b, Request& r) {
         b.BuildCertificateTokenRequest(SpecWith(60, TokenSpec::CONFIRMATION_BEARER), r);
       },
       &argument,
       "Invalid argument : TokenSpec::confirmation must be CONFIRMATION_DEFAULT for acquire token by certificate",
       EARLIER},
      {"certificate_unknown_confirmation", ClientKeyMaterial(),
       [](const RequestBuilderImpl& b, Request& r) {
         b.BuildCertificateTokenRequest(SpecWith(60, static_cast<TokenSpec::Confirmation>(5)), r);
       },
       &argument,
       "Invalid argument : TokenSpec::confirmation must be CONFIRMATION_DEFAULT for acquire token by certificate",
       EARLIER},
      {"exchange_lifetime_before_configuration", boost::none,
       [hok](const RequestBuilderImpl& b, Request& r) { b.BuildExchangeTokenRequest(*hok(), SpecWith(0), r); },
       &argument, LIFETIME, EARLIER},
      {"exchange_without_configuration", boost::none,
       [hok](const RequestBuilderImpl& b, Request& r) { b.BuildExchangeTokenRequest(*hok(), SpecWith(60), r); }, &state,
       "No HolderOfKeyConfig provided. Unable to acquire token by token", EARLIER},
      {"renew_lifetime_before_configuration", boost::none,
       [bearer](const RequestBuilderImpl& b, Request& r) { b.BuildRenewRequest(*bearer(), 0, r); }, &argument, LIFETIME,
       EARLIER},
      {"renew_lifetime_negative", ClientKeyMaterial(),
       [hok](const RequestBuilderImpl& b, Request& r) { b.BuildRenewRequest(*hok(), -600, r); }, &argument, LIFETIME,
       EARLIER},
      {"renew_configuration_before_token", boost::none,
       [bearer](const RequestBuilderImpl& b, Request& r) { b.BuildRenewRequest(*bearer(), 60, r); }, &state,
       "No HolderOfKeyConfig provided. Unable to renew token", EARLIER},
      {"renew_bearer_token", ClientKeyMaterial(),
       [bearer](const RequestBuilderImpl& b, Request& r) { b.BuildRenewRequest(*bearer(), 60, r); }, &argument,
       "Invalid argument : Unable to renew token: the provided token must be Holder Of Key", EARLIER},
      {"userpass_configuration_without_key", Without(false, true),
       [](const RequestBuilderImpl& b, Request& r) { b.BuildUserPassTokenRequest("u", "p", Spec(), r); }, &state,
       "HolderOfKeyConfig has no privateKey. Unable to sign the request",
       "http://docs.oasis-open.org/ws-sx/ws-trust/200512/RST/Issue"},
      {"certificate_configuration_without_certificate", Without(true, false),
       [](const RequestBuilderImpl& b, Request& r) { b.BuildCertificateTokenRequest(Spec(), r); }, &state,
       "HolderOfKeyConfig has no certificate. Unable to sign the request",
       "http://docs.oasis-open.org/ws-sx/ws-trust/200512/RST/Issue"},
      {"exchange_configuration_without_key", Without(false, false),
       [hok](const RequestBuilderImpl& b, Request& r) { b.BuildExchangeTokenRequest(*hok(), Spec(), r); }, &state,
       "HolderOfKeyConfig has no privateKey. Unable to sign the request",
       "http://docs.oasis-open.org/ws-sx/ws-trust/200512/RST/Issue"},
  };
}

class RequestFailureTest : public ::testing::TestWithParam<FailureCase> {
 protected:
  TestSupport::FixedClock _clock{CLOCK};
};

TEST_P(RequestFailureTest, RaisesTheExactClassAndMessageAndLeavesTheBodyAlone) {
  const RequestBuilderImpl builder(GetParam().config);
  Request request;
  request.soapAction = EARLIER;
  request.body = "earlier body";
  try {
    GetParam().build(builder, request);
    FAIL() << "no exception";
  } catch (const Tamber::Exception& e) {
    EXPECT_EQ(*GetParam().exception, typeid(e)) << typeid(e).name();
    EXPECT_STREQ(GetParam().message, e.what());
  }
  EXPECT_EQ(GetParam().soapActionAfter, request.soapAction);
  EXPECT_EQ("earlier body", request.body);
}

INSTANTIATE_TEST_SUITE_P(EveryRefusal, RequestFailureTest, ::testing::ValuesIn(FailureCases()),
                         [](const ::testing::TestParamInfo<FailureCase>& info) { return info.param.name; });

// --- Signing decisions ---

struct SigningCase {
  const char* name;
  bool keyMaterial;
  std::function<void(const RequestBuilderImpl&, Request&)> build;
  const char* soapAction;
  enum Signature { UNSIGNED, CERTIFICATE_REFERENCE, SAML_REFERENCE } signature;
  // The wst:KeyType asked for ("" when the body has none), and the optional issue children.
  const char* keyType;
  bool useKey;
  bool delegateTo;
};

std::ostream& operator<<(std::ostream& out, const SigningCase& signing) { return out << signing.name; }

const char ISSUE[] = "http://docs.oasis-open.org/ws-sx/ws-trust/200512/RST/Issue";
const char PUBLIC_KEY[] = "http://docs.oasis-open.org/ws-sx/ws-trust/200512/PublicKey";
const char BEARER[] = "http://docs.oasis-open.org/ws-sx/ws-trust/200512/Bearer";

void UserPass(const TokenSpec& spec, const RequestBuilderImpl& b, Request& r) {
  b.BuildUserPassTokenRequest("alice", "secret", spec, r);
}

void FirstLeg(const TokenSpec& spec, const RequestBuilderImpl& b, Request& r) { b.BuildInitialSPNegoRequest(spec, {1, 2}, r); }

using std::placeholders::_1;
using std::placeholders::_2;

const SigningCase SIGNING_CASES[] = {
    {"userpass_no_configuration", false, std::bind(UserPass, Spec(), _1, _2), ISSUE, SigningCase::UNSIGNED, BEARER,
     false, false},
    {"userpass_no_configuration_bearer", false, std::bind(UserPass, BearerSpec(), _1, _2), ISSUE,
     SigningCase::UNSIGNED, BEARER, false, false},
    {"userpass_no_configuration_delegated", false, std::bind(UserPass, DelegatedSpec(), _1, _2), ISSUE,
     SigningCase::UNSIGNED, BEARER, false, true},
    {"userpass_default", true, std::bind(UserPass, Spec(), _1, _2), ISSUE, SigningCase::CERTIFICATE_REFERENCE,
     PUBLIC_KEY, true, false},
    {"userpass_bearer", true, std::bind(UserPass, BearerSpec(), _1, _2), ISSUE, SigningCase::UNSIGNED, BEARER, false,
     false},
    {"userpass_delegated", true, std::bind(UserPass, DelegatedSpec(), _1, _2), ISSUE, SigningCase::UNSIGNED,
     PUBLIC_KEY, false, true},
    {"first_leg_no_configuration", false, std::bind(FirstLeg, Spec(), _1, _2), ISSUE, SigningCase::UNSIGNED, BEARER,
     false, false},
    {"first_leg_default", true, std::bind(FirstLeg, Spec(), _1, _2), ISSUE, SigningCase::CERTIFICATE_REFERENCE,
     PUBLIC_KEY, true, false},
    {"first_leg_bearer", true, std::bind(FirstLeg, BearerSpec(), _1, _2), ISSUE, SigningCase::UNSIGNED, BEARER, false,
     false},
    {"first_leg_delegated", true, std::bind(FirstLeg, DelegatedSpec(), _1, _2), ISSUE, SigningCase::UNSIGNED,
     PUBLIC_KEY, false, true},
    {"continued_leg", true,
     [](const RequestBuilderImpl& b, Request& r) { b.BuildContinuedSPNegoRequest("ctx", {1}, r); },
     "http://docs.oasis-open.org/ws-sx/ws-trust/200512/RSTR/Issue", SigningCase::UNSIGNED, "", false, false},
    {"certificate", true, [](const RequestBuilderImpl& b, Request& r) { b.BuildCertificateTokenRequest(Spec(), r); },
     ISSUE, SigningCase::CERTIFICATE_REFERENCE, PUBLIC_KEY, true, false},
    {"certificate_delegated", true,
     [](const RequestBuilderImpl& b, Request& r) { b.BuildCertificateTokenRequest(DelegatedSpec(), r); }, ISSUE,
     SigningCase::CERTIFICATE_REFERENCE, PUBLIC_KEY, false, true},
    {"exchange_default", true,
     [](const RequestBuilderImpl& b, Request& r) {
       b.BuildExchangeTokenRequest(*Token(SamlToken::CONFIRM_HOLDER_OF_KEY), Spec(), r);
     },
     ISSUE, SigningCase::SAML_REFERENCE, PUBLIC_KEY, false, false},
    {"exchange_bearer_spec", true,
     [](const RequestBuilderImpl& b, Request& r) {
       b.BuildExchangeTokenRequest(*Token(SamlToken::CONFIRM_HOLDER_OF_KEY), BearerSpec(), r);
     },
     ISSUE, SigningCase::SAML_REFERENCE, BEARER, false, false},
    {"exchange_of_bearer_token", true,
     [](const RequestBuilderImpl& b, Request& r) {
       b.BuildExchangeTokenRequest(*Token(SamlToken::CONFIRM_BEARER), Spec(), r);
     },
     ISSUE, SigningCase::SAML_REFERENCE, PUBLIC_KEY, false, false},
    {"validate", true,
     [](const RequestBuilderImpl& b, Request& r) {
       b.BuildValidateSubjectRequest(*Token(SamlToken::CONFIRM_HOLDER_OF_KEY), r);
     },
     "http://docs.oasis-open.org/ws-sx/ws-trust/200512/RST/Validate", SigningCase::UNSIGNED, "", false, false},
    {"validate_no_configuration", false,
     [](const RequestBuilderImpl& b, Request& r) { b.BuildValidateSubjectRequest(*Token(SamlToken::CONFIRM_BEARER), r); },
     "http://docs.oasis-open.org/ws-sx/ws-trust/200512/RST/Validate", SigningCase::UNSIGNED, "", false, false},
    {"renew", true,
     [](const RequestBuilderImpl& b, Request& r) { b.BuildRenewRequest(*Token(SamlToken::CONFIRM_HOLDER_OF_KEY), 60, r); },
     "http://docs.oasis-open.org/ws-sx/ws-trust/200512/RST/Renew", SigningCase::CERTIFICATE_REFERENCE, "", false,
     false},
};

class RequestSigningTest : public ::testing::TestWithParam<SigningCase> {
 protected:
  TestSupport::FixedClock _clock{CLOCK};
};

TEST_P(RequestSigningTest, SignsWithTheReferenceItsSlotCallsFor) {
  const RequestBuilderImpl builder(GetParam().keyMaterial ? ClientKeyMaterial() : boost::none);
  Request request;
  GetParam().build(builder, request);
  EXPECT_EQ(GetParam().soapAction, request.soapAction);

  const Ref<Tamber::Xml::Document> document = Parse(request.body);
  ElementNode* security = Security(document);
  ASSERT_NE(nullptr, security);
  ElementNode* signature = security->FindChildElement(QName(DS, "Signature"));
  ElementNode* certificateToken = security->FindChildElement(QName(WSSE, "BinarySecurityToken"));
  ElementNode* reference = Path(signature, {{DS, "KeyInfo"}, {WSSE, "SecurityTokenReference"}});
  switch (GetParam().signature) {
    case SigningCase::UNSIGNED:
      EXPECT_EQ(nullptr, signature);
      EXPECT_EQ(nullptr, certificateToken);
      break;
    case SigningCase::CERTIFICATE_REFERENCE: {
      ASSERT_NE(nullptr, reference);
      ASSERT_NE(nullptr, certificateToken);
      ElementNode* target = reference->FindChildElement(QName(WSSE, "Reference"));
      ASSERT_NE(nullptr, target);
      std::string uri;
      EXPECT_TRUE(target->GetAttribute("URI", uri));
      EXPECT_EQ("#holderOfKeyCertificate", uri);
      EXPECT_TRUE(TestSupport::VerifyRequestSignature(request.body, *TestSupport::LoadTestKeyPair("client").certificate).valid);
      break;
    }
    case SigningCase::SAML_REFERENCE:
      ASSERT_NE(nullptr, reference);
      EXPECT_EQ(nullptr, certificateToken);
      EXPECT_NE(std::string("<absent>"), Text(reference->FindChildElementByLocalName("KeyIdentifier")));
      EXPECT_EQ(0u, Text(reference->FindChildElementByLocalName("KeyIdentifier")).find("_"));
      EXPECT_TRUE(TestSupport::VerifyRequestSignature(request.body, *TestSupport::LoadTestKeyPair("client").certificate).valid);
      break;
  }

  ElementNode* rst = Rst(document);
  if (*GetParam().keyType == '\0') {
    EXPECT_TRUE(rst == nullptr || rst->FindChildElementByLocalName("KeyType") == nullptr);
    return;
  }
  ASSERT_NE(nullptr, rst);
  EXPECT_EQ(GetParam().keyType, Text(rst->FindChildElementByLocalName("KeyType")));
  EXPECT_EQ(GetParam().useKey, rst->FindChildElementByLocalName("UseKey") != nullptr);
  EXPECT_EQ(GetParam().delegateTo, rst->FindChildElementByLocalName("DelegateTo") != nullptr);
}

INSTANTIATE_TEST_SUITE_P(EverySlot, RequestSigningTest, ::testing::ValuesIn(SIGNING_CASES),
                         [](const ::testing::TestParamInfo<SigningCase>& info) { return info.param.name; });

// --- Further cases ---

class RequestBuilderImplTest : public ::testing::Test {
 protected:
  TestSupport::FixedClock _clock{CLOCK};
};

TEST_F(RequestBuilderImplTest, TheSoapActionConstantsAreTheWsTrustActions) {
  EXPECT_STREQ("http://docs.oasis-open.org/ws-sx/ws-trust/200512/RST/Issue", Request::ISSUE);
  EXPECT_STREQ("http://docs.oasis-open.org/ws-sx/ws-trust/200512/RST/Renew", Request::RENEW);
  EXPECT_STREQ("http://docs.oasis-open.org/ws-sx/ws-trust/200512/RST/Validate", Request::VALIDATE);
  EXPECT_STREQ("http://docs.oasis-open.org/ws-sx/ws-trust/200512/RSTR/Issue", Request::CHALLANGE);
}

TEST_F(RequestBuilderImplTest, ALifetimeOfOneSecondIsAccepted) {
  const RequestBuilderImpl builder(boost::none);
  Request request;
  builder.BuildUserPassTokenRequest("u", "p", SpecWith(1), request);
  const Ref<Tamber::Xml::Document> document = Parse(request.body);
  ElementNode* lifetime = Rst(document)->FindChildElementByLocalName("Lifetime");
  ASSERT_NE(nullptr, lifetime);
  EXPECT_EQ("2027-05-17T12:00:01.250Z", Text(lifetime->FindChildElementByLocalName("Expires")));
}

TEST_F(RequestBuilderImplTest, EveryRequestExpiresTenMinutesAfterItWasBuilt) {
  const RequestBuilderImpl builder(ClientKeyMaterial());
  Request request;
  builder.BuildCertificateTokenRequest(Spec(), request);
  const Ref<Tamber::Xml::Document> document = Parse(request.body);
  ElementNode* timestamp = Security(document)->FindChildElementByLocalName("Timestamp");
  ASSERT_NE(nullptr, timestamp);
  EXPECT_EQ("2027-05-17T12:00:00.250Z", Text(timestamp->FindChildElementByLocalName("Created")));
  EXPECT_EQ("2027-05-17T12:10:00.250Z", Text(timestamp->FindChildElementByLocalName("Expires")));
}

TEST_F(RequestBuilderImplTest, MarkupInCredentialsTravelsEscapedAndTheSignatureStillHolds) {
  const std::string user = "a<b>&c]]>\"d'</wsse:Username><x/>";
  const std::string password = "]]><![CDATA[&amp;<";
  const RequestBuilderImpl builder(ClientKeyMaterial());
  Request request;
  builder.BuildUserPassTokenRequest(user, password, Spec(), request);

  const Ref<Tamber::Xml::Document> document = Parse(request.body);
  ElementNode* token = Security(document)->FindChildElement(QName(WSSE, "UsernameToken"));
  ASSERT_NE(nullptr, token);
  EXPECT_EQ(user, Text(token->FindChildElement(QName(WSSE, "Username"))));
  EXPECT_EQ(password, Text(token->FindChildElement(QName(WSSE, "Password"))));
  EXPECT_EQ(nullptr, token->FindChildElementByLocalName("x"));
  EXPECT_TRUE(TestSupport::VerifyRequestSignature(request.body, *TestSupport::LoadTestKeyPair("client").certificate).valid);
}

TEST_F(RequestBuilderImplTest, TheExchangedTokenFollowsTheTimestampAndTheKeyIdentifierNamesIt) {
  const boost::shared_ptr<const SamlToken> token = Token(SamlToken::CONFIRM_HOLDER_OF_KEY);
  const RequestBuilderImpl builder(ClientKeyMaterial());
  Request request;
  builder.BuildExchangeTokenRequest(*token, Spec(), request);

  const Ref<Tamber::Xml::Document> document = Parse(request.body);
  ElementNode* security = Security(document);
  std::vector<std::string> names;
  for (Tamber::Xml::Node* child = security->GetFirstChild(); child != nullptr; child = child->GetNextSibling()) {
    if (child->GetKind() == Tamber::Xml::Node::ELEMENT) {
      names.push_back(Tamber::DynamicCast<ElementNode>(child)->GetLocalName());
    }
  }
  EXPECT_EQ((std::vector<std::string>{"Timestamp", "Assertion", "Signature"}), names);
  EXPECT_EQ(token->GetId(), Text(Path(security, {{DS, "Signature"}, {DS, "KeyInfo"}, {WSSE, "SecurityTokenReference"}})
                                     ->FindChildElementByLocalName("KeyIdentifier")));
}

TEST_F(RequestBuilderImplTest, TheSameBuilderServesSeveralThreadsAtOnce) {
  const RequestBuilderImpl builder(ClientKeyMaterial());
  std::vector<std::string> bodies(4);
  std::vector<std::thread> threads;
  for (size_t i = 0; i < bodies.size(); ++i) {
    threads.emplace_back([&builder, &bodies, i] {
      Request request;
      builder.BuildCertificateTokenRequest(Spec(), request);
      bodies[i] = request.body;
    });
  }
  for (std::thread& thread : threads) thread.join();
  for (const std::string& body : bodies) {
    EXPECT_EQ(Mask(bodies[0]), Mask(body));
    EXPECT_TRUE(TestSupport::VerifyRequestSignature(body, *TestSupport::LoadTestKeyPair("client").certificate).valid);
  }
}

TEST(ConfOverrideWithDelegateTest, ADelegateMakesTheSigningDecisionBearer) {
  TokenSpec spec = Spec();
  EXPECT_EQ(TokenSpec::CONFIRMATION_DEFAULT, ConfOverrideWithDelegate(spec));
  spec.confirmation = TokenSpec::CONFIRMATION_BEARER;
  EXPECT_EQ(TokenSpec::CONFIRMATION_BEARER, ConfOverrideWithDelegate(spec));
  spec.confirmation = TokenSpec::CONFIRMATION_DEFAULT;
  spec.delegateTo = std::string("");
  EXPECT_EQ(TokenSpec::CONFIRMATION_BEARER, ConfOverrideWithDelegate(spec));
}

}  // namespace
}  // namespace SsoClient
