#include "ssoClient/SecurityTokenServiceImpl.h"

#include <atomic>
#include <functional>
#include <string>
#include <typeinfo>
#include <vector>

#include <boost/make_shared.hpp>
#include <gtest/gtest.h>

#include "ssoClient/Descriptions.h"
#include "ssoClient/Exceptions.h"
#include "ssoClient/RequestBuilderImpl.h"
#include "ssoClient/ResponseHandlerImpl.h"
#include "ssoClient/WireConstants.h"
#include "support/LogCapture.h"
#include "support/ScriptedSts.h"
#include "support/TestTokens.h"
#include "tamber/Exception.h"
#include "tamber/xml/Dom.h"

namespace SsoClient {
namespace {

using TestSupport::FramedMessages;
using TestSupport::IssueAnswer;
using TestSupport::IssueTestToken;
using TestSupport::LogCapture;
using TestSupport::ScriptedTransport;

using TestSupport::ClientKeyMaterial;

TokenSpec Spec() {
  TokenSpec spec;
  spec.tokenLifetimeSec = 1800;
  spec.audienceRestriction = {"https://app.example"};
  return spec;
}

boost::shared_ptr<const SamlToken> Validated(const std::string& xml) {
  return CreateSamlToken(xml, TestSupport::TrustedCertificates());
}

boost::shared_ptr<const SamlToken> HolderOfKeyToken() {
  return Validated(IssueTestToken(TestSupport::HolderOfKeyRecord()));
}

// The message of what CreateSamlToken raises for `xml`, to compare the service's translation with.
std::string RejectionOf(const std::string& xml) {
  try {
    Validated(xml);
  } catch (const Tamber::Exception& e) {
    return e.what();
  }
  ADD_FAILURE() << "token accepted";
  return "";
}

class SecurityTokenServiceImplTest : public ::testing::Test {
 protected:
  SecurityTokenServiceImpl Service(const boost::optional<HolderOfKeyConfig>& keyMaterial = ClientKeyMaterial()) const {
    return SecurityTokenServiceImpl(boost::make_shared<RequestBuilderImpl>(keyMaterial), _transport,
                                    boost::make_shared<ResponseHandlerImpl>(), TestSupport::TrustedCertificates());
  }

  const boost::shared_ptr<ScriptedTransport> _transport = boost::make_shared<ScriptedTransport>();
};

TEST_F(SecurityTokenServiceImplTest, AcquireTokenLogsSixMessagesUnderOneOperationId) {
  _transport->Answer(IssueAnswer(IssueTestToken(TokenIssuer::TokenRecord())));
  LogCapture capture;
  const TokenSpec spec = Spec();
  const boost::shared_ptr<const SamlToken> token = Service().AcquireToken("alice@example.com", "s3cret!", spec);

  ASSERT_TRUE(token);
  EXPECT_EQ(token->GetSubject().name, "alice");
  const std::vector<std::string> messages = capture.GetMessages();
  ASSERT_EQ(messages.size(), 6u);
  const std::vector<std::string> expected = {
      "Requested token for subject `alice@example.com', spec `" + WriteTokenSpec(spec) + "'",
      "SecurityTokenServiceImpl::AcquireToken sending request",
      "SecurityTokenServiceImpl::AcquireToken processing response",
      "Successfully acquired token: " + CreateRedactedDescription(*token),
  };
  EXPECT_EQ(FramedMessages(messages, "AcquireToken"), expected);
  for (const LogCapture::Entry& entry : capture.GetEntries()) {
    EXPECT_EQ(entry.level, 64);
    EXPECT_EQ(entry.message.find("s3cret!"), std::string::npos) << entry.message;
  }
  // The request went through the real builder: an Issue request carrying the user name.
  const auto requests = _transport->GetRequests();
  ASSERT_EQ(requests.size(), 1u);
  EXPECT_EQ(requests[0].request.soapAction, Request::ISSUE);
  EXPECT_NE(requests[0].request.body.find(">alice@example.com</"), std::string::npos);
}

TEST_F(SecurityTokenServiceImplTest, AcquireTokenByCertificateTracesItsSpec) {
  _transport->Answer(IssueAnswer(IssueTestToken(TestSupport::HolderOfKeyRecord())));
  LogCapture capture;
  const boost::shared_ptr<const SamlToken> token = Service().AcquireTokenByCertificate(Spec());

  ASSERT_TRUE(token);
  EXPECT_EQ(token->GetConfirmationMethod(), SamlToken::CONFIRM_HOLDER_OF_KEY);
  const std::vector<std::string> expected = {"Requested token with spec `" + WriteTokenSpec(Spec()) + "'",
                                             "Successfully acquired token: " + CreateRedactedDescription(*token)};
  EXPECT_EQ(FramedMessages(capture.GetMessages(), "AcquireTokenByCertificate"), expected);
  EXPECT_EQ(_transport->GetRequests().at(0).request.soapAction, Request::ISSUE);
}

TEST_F(SecurityTokenServiceImplTest, AcquireTokenByTokenTracesThePresentedToken) {
  const boost::shared_ptr<const SamlToken> presented = HolderOfKeyToken();
  TokenIssuer::TokenRecord issued;
  issued.subject = "bob@example.com";
  _transport->Answer(IssueAnswer(IssueTestToken(issued)));
  LogCapture capture;
  const boost::shared_ptr<const SamlToken> token = Service().AcquireTokenByToken(*presented, Spec());

  ASSERT_TRUE(token);
  EXPECT_EQ(token->GetSubject().name, "bob");
  const std::vector<std::string> expected = {
      "Requested token for " + CreateRedactedDescription(*presented) + " with spec `" + WriteTokenSpec(Spec()) + "'",
      "Successfully acquired token: " + CreateRedactedDescription(*token)};
  EXPECT_EQ(FramedMessages(capture.GetMessages(), "AcquireTokenByToken"), expected);
  EXPECT_NE(_transport->GetRequests().at(0).request.body.find(presented->GetId()), std::string::npos);
}

TEST_F(SecurityTokenServiceImplTest, RenewTokenTracesTheTokenAndTheLifetime) {
  const boost::shared_ptr<const SamlToken> presented = HolderOfKeyToken();
  _transport->Answer(TestSupport::RenewAnswer(IssueTestToken(TestSupport::HolderOfKeyRecord())));
  LogCapture capture;
  const boost::shared_ptr<const SamlToken> token = Service().RenewToken(*presented, 7200);

  ASSERT_TRUE(token);
  const std::vector<std::string> expected = {
      "Renewing token " + CreateRedactedDescription(*presented) + " for 7200 more seconds",
      "Successfully acquired token: " + CreateRedactedDescription(*token)};
  EXPECT_EQ(FramedMessages(capture.GetMessages(), "RenewToken"), expected);
  EXPECT_EQ(_transport->GetRequests().at(0).request.soapAction, Request::RENEW);
}

class ValidateSubjectTest : public SecurityTokenServiceImplTest, public ::testing::WithParamInterface<bool> {};

TEST_P(ValidateSubjectTest, ReturnsAndLogsTheStsAnswer) {
  const boost::shared_ptr<const SamlToken> presented = Validated(IssueTestToken(TokenIssuer::TokenRecord()));
  _transport->Answer(TestSupport::ValidateAnswer(GetParam()));
  LogCapture capture;
  EXPECT_EQ(Service().ValidateSubject(*presented), GetParam());

  const std::vector<std::string> expected = {"Validating subject of token " + CreateRedactedDescription(*presented),
                                             GetParam() ? "Result: true" : "Result: false"};
  EXPECT_EQ(FramedMessages(capture.GetMessages(), "ValidateSubject"), expected);
  EXPECT_EQ(_transport->GetRequests().at(0).request.soapAction, Request::VALIDATE);
}

INSTANTIATE_TEST_SUITE_P(Answers, ValidateSubjectTest, ::testing::Bool());

TEST_F(SecurityTokenServiceImplTest, EveryOperationOpensASessionOfItsOwn) {
  const std::string answer = IssueAnswer(IssueTestToken(TokenIssuer::TokenRecord()));
  _transport->Answer(answer);
  _transport->Answer(answer);
  const SecurityTokenServiceImpl service = Service();
  service.AcquireToken("alice@example.com", "pw", Spec());
  service.AcquireToken("alice@example.com", "pw", Spec());
  const auto requests = _transport->GetRequests();
  ASSERT_EQ(requests.size(), 2u);
  EXPECT_EQ(requests[0].session, 0u);
  EXPECT_EQ(requests[1].session, 1u);
}

TEST_F(SecurityTokenServiceImplTest, WithoutKeyMaterialTheDefaultConfirmationAsksForBearer) {
  _transport->Answer(IssueAnswer(IssueTestToken(TokenIssuer::TokenRecord())));
  Service(boost::none).AcquireToken("alice@example.com", "pw", Spec());
  const std::string body = _transport->GetRequests().at(0).request.body;
  EXPECT_NE(body.find(Wire::kKeyTypeBearer), std::string::npos);
  EXPECT_EQ(body.find("Signature"), std::string::npos);
}

// Delegates to a real token and counts the reads that only a description of the token makes
// (the request builder reads the id, the confirmation method and the XML).
class DescriptionCountingToken : public SamlToken {
 public:
  explicit DescriptionCountingToken(const boost::shared_ptr<const SamlToken>& token) : _token(token) {}

  int GetDescriptionReads() const { return _reads; }

  const std::string& GetId() const override { return _token->GetId(); }
  const Tamber::System::DateTime& GetStartDate() const override { return Count(_token->GetStartDate()); }
  const Tamber::System::DateTime& GetEndDate() const override { return Count(_token->GetEndDate()); }
  const PrincipalId& GetSubject() const override { return Count(_token->GetSubject()); }
  bool IsRenewable() const override { return Count(_token->IsRenewable()); }
  bool IsDelegable() const override { return Count(_token->IsDelegable()); }
  bool IsSolution() const override { return Count(_token->IsSolution()); }
  ConfirmationType GetConfirmationMethod() const override { return _token->GetConfirmationMethod(); }
  void GetFullName(std::pair<std::string, std::string>& fullName) const override {
    Count(0);
    _token->GetFullName(fullName);
  }
  void GetGroups(std::vector<PrincipalId>& groups) const override {
    Count(0);
    _token->GetGroups(groups);
  }
  void GetDelegationChain(std::vector<Delegate>& chain) const override {
    Count(0);
    _token->GetDelegationChain(chain);
  }
  void GetAudience(std::set<std::string>& audience) const override {
    Count(0);
    _token->GetAudience(audience);
  }
  void GetAdvice(std::vector<Advice>& advice) const override {
    Count(0);
    _token->GetAdvice(advice);
  }
  const Tamber::Crypto::Certificate* GetConfirmationCertificate() const override {
    return _token->GetConfirmationCertificate();
  }
  const std::string& ToXml() const override { return _token->ToXml(); }

 private:
  template <class T>
  const T& Count(const T& value) const {
    ++_reads;
    return value;
  }

  boost::shared_ptr<const SamlToken> _token;
  mutable std::atomic<int> _reads{0};
};

TEST_F(SecurityTokenServiceImplTest, BelowTraceLevelNothingIsFormatted) {
  const DescriptionCountingToken presented(HolderOfKeyToken());
  const std::string issued = IssueTestToken(TestSupport::HolderOfKeyRecord());
  _transport->AnswerAlways(Request::ISSUE, IssueAnswer(issued));
  _transport->AnswerAlways(Request::RENEW, TestSupport::RenewAnswer(issued));
  _transport->AnswerAlways(Request::VALIDATE, TestSupport::ValidateAnswer(true));
  const SecurityTokenServiceImpl service = Service();
  {
    LogCapture capture("SsoClient", 63);
    EXPECT_TRUE(service.AcquireToken("alice@example.com", "pw", Spec()));
    EXPECT_TRUE(service.AcquireTokenByCertificate(Spec()));
    EXPECT_TRUE(service.AcquireTokenByToken(presented, Spec()));
    EXPECT_TRUE(service.RenewToken(presented, 600));
    EXPECT_TRUE(service.ValidateSubject(presented));
    EXPECT_EQ(presented.GetDescriptionReads(), 0);
    EXPECT_TRUE(capture.GetEntries().empty());
  }
  // The counter does see a description when tracing is on.
  LogCapture capture("SsoClient", 64);
  service.ValidateSubject(presented);
  EXPECT_GT(presented.GetDescriptionReads(), 0);
}

// A failing operation: how to run it, what it raises and how many messages it logs in all.
struct FailureCase {
  const char* name;
  std::function<void(ScriptedTransport&)> script;
  std::function<void(const SecurityTokenServiceImpl& service, const SecurityTokenServiceImpl& withoutKeyMaterial)> run;
  const char* operation;
  const std::type_info* raised;
  std::function<std::string()> message;
  size_t messagesLogged;
};

std::ostream& operator<<(std::ostream& out, const FailureCase& failure) { return out << failure.name; }

class OperationFailureTest : public SecurityTokenServiceImplTest, public ::testing::WithParamInterface<FailureCase> {};

TEST_P(OperationFailureTest, RaisesAfterEndWasLogged) {
  const FailureCase& failure = GetParam();
  SCOPED_TRACE(failure.name);
  failure.script(*_transport);
  LogCapture capture;
  try {
    failure.run(Service(), Service(boost::none));
    FAIL() << "no exception";
  } catch (const Tamber::Exception& e) {
    EXPECT_EQ(typeid(e), *failure.raised) << typeid(e).name();
    EXPECT_EQ(e.what(), failure.message());
  }
  const std::vector<std::string> messages = capture.GetMessages();
  EXPECT_EQ(messages.size(), failure.messagesLogged) << ::testing::PrintToString(messages);
  FramedMessages(messages, failure.operation);
  EXPECT_FALSE(capture.Contains("Successfully acquired token"));
  EXPECT_FALSE(capture.Contains("Result:"));
}

std::string VersionedToken(const std::string& version) {
  TokenIssuer::TokenRecord record;
  record.version = version;
  return IssueTestToken(record);
}

const std::string& UntrustedToken() {
  static const std::string token = IssueTestToken(TokenIssuer::TokenRecord(), "untrusted");
  return token;
}

INSTANTIATE_TEST_SUITE_P(
    Failures, OperationFailureTest,
    ::testing::Values(
        FailureCase{"lifetime refused by the request builder", [](ScriptedTransport&) {},
                    [](const SecurityTokenServiceImpl& service, const SecurityTokenServiceImpl&) {
                      TokenSpec spec = Spec();
                      spec.tokenLifetimeSec = 0;
                      service.AcquireToken("alice@example.com", "pw", spec);
                    },
                    "AcquireToken", &typeid(Tamber::InvalidArgumentException),
                    [] { return std::string("Invalid argument : Token lifetime must be positive"); }, 3},
        FailureCase{"transport failure",
                    [](ScriptedTransport& transport) {
                      transport.Fail(CommunicationException("Server returned error: 503 Service Unavailable"));
                    },
                    [](const SecurityTokenServiceImpl& service, const SecurityTokenServiceImpl&) {
                      service.AcquireTokenByCertificate(Spec());
                    },
                    "AcquireTokenByCertificate", &typeid(CommunicationException),
                    [] { return std::string("Server returned error: 503 Service Unavailable"); }, 3},
        FailureCase{"authentication fault",
                    [](ScriptedTransport& transport) {
                      transport.Answer(TestSupport::FaultAnswer("wst:FailedAuthentication", "bad password"));
                    },
                    [](const SecurityTokenServiceImpl& service, const SecurityTokenServiceImpl&) {
                      service.AcquireToken("alice@example.com", "wrong", Spec());
                    },
                    "AcquireToken", &typeid(InvalidCredentialsException),
                    [] { return std::string("Authentication failed: bad password"); }, 5},
        FailureCase{"renew without key material", [](ScriptedTransport&) {},
                    [](const SecurityTokenServiceImpl&, const SecurityTokenServiceImpl& withoutKeyMaterial) {
                      withoutKeyMaterial.RenewToken(*HolderOfKeyToken(), 600);
                    },
                    "RenewToken", &typeid(Tamber::InvalidStateException),
                    [] { return std::string("No HolderOfKeyConfig provided. Unable to renew token"); }, 3},
        FailureCase{"issued assertion that does not parse",
                    [](ScriptedTransport& transport) { transport.Answer(IssueAnswer(VersionedToken("1.1"))); },
                    [](const SecurityTokenServiceImpl& service, const SecurityTokenServiceImpl&) {
                      service.AcquireToken("alice@example.com", "pw", Spec());
                    },
                    "AcquireToken", &typeid(SsoException), [] { return RejectionOf(VersionedToken("1.1")); }, 5},
        FailureCase{"issued assertion of an untrusted signer",
                    [](ScriptedTransport& transport) { transport.Answer(IssueAnswer(UntrustedToken())); },
                    [](const SecurityTokenServiceImpl& service, const SecurityTokenServiceImpl&) {
                      service.AcquireTokenByToken(*HolderOfKeyToken(), Spec());
                    },
                    "AcquireTokenByToken", &typeid(InvalidSignatureException),
                    [] { return RejectionOf(UntrustedToken()); }, 3},
        FailureCase{"validation fault",
                    [](ScriptedTransport& transport) {
                      transport.Answer(TestSupport::FaultAnswer("wst:RequestFailed", "try later"));
                    },
                    [](const SecurityTokenServiceImpl& service, const SecurityTokenServiceImpl&) {
                      service.ValidateSubject(*HolderOfKeyToken());
                    },
                    "ValidateSubject", &typeid(SsoException),
                    [] { return std::string("Unexpected SOAP fault: wst:RequestFailed; request failed."); }, 3}));

// Hands the service a fixed assertion text, as no real answer can (the real handler returns the
// canonical form of an element, which is always well-formed).
class FixedAssertionHandler final : public ResponseHandler {
 public:
  explicit FixedAssertionHandler(const std::string& assertion) : _assertion(assertion) {}
  void HandleAcquireTokenResponse(Tamber::Reader*, std::string& token) const override { token = _assertion; }
  bool HandleValidateSubjectResponse(Tamber::Reader* response) const override {
    return _real.HandleValidateSubjectResponse(response);
  }
  void HandleRenewTokenResponse(Tamber::Reader* response, std::string& token) const override {
    _real.HandleRenewTokenResponse(response, token);
  }
  void HandleSPNegoResponse(Tamber::Reader* response, SPNegoResponse& result) const override {
    _real.HandleSPNegoResponse(response, result);
  }

 private:
  std::string _assertion;
  ResponseHandlerImpl _real;
};

struct AssertionCase {
  const char* name;
  std::function<std::string()> assertion;
  // Null when the text yields a token.
  const std::type_info* raised;
};

std::ostream& operator<<(std::ostream& out, const AssertionCase& assertion) { return out << assertion.name; }

class ToSamlTokenTest : public SecurityTokenServiceImplTest, public ::testing::WithParamInterface<AssertionCase> {};

TEST_P(ToSamlTokenTest, TranslatesOnlyParseException) {
  SCOPED_TRACE(GetParam().name);
  const std::string assertion = GetParam().assertion();
  _transport->Answer("not read");
  const SecurityTokenServiceImpl service(boost::make_shared<RequestBuilderImpl>(boost::none), _transport,
                                         boost::make_shared<FixedAssertionHandler>(assertion),
                                         TestSupport::TrustedCertificates());
  LogCapture capture;
  if (GetParam().raised == nullptr) {
    const boost::shared_ptr<const SamlToken> token = service.AcquireToken("alice@example.com", "pw", Spec());
    ASSERT_TRUE(token);
    EXPECT_TRUE(capture.Contains("Successfully acquired token: " + CreateRedactedDescription(*token)));
    return;
  }
  try {
    service.AcquireToken("alice@example.com", "pw", Spec());
    FAIL() << "no exception";
  } catch (const Tamber::Exception& e) {
    EXPECT_EQ(typeid(e), *GetParam().raised) << typeid(e).name();
    EXPECT_EQ(e.what(), RejectionOf(assertion));
  }
  EXPECT_FALSE(capture.Contains("Successfully acquired token"));
}

INSTANTIATE_TEST_SUITE_P(
    Assertions, ToSamlTokenTest,
    ::testing::Values(AssertionCase{"valid", [] { return IssueTestToken(TokenIssuer::TokenRecord()); }, nullptr},
                      AssertionCase{"rejected version", [] { return VersionedToken("1.1"); }, &typeid(SsoException)},
                      AssertionCase{"not an assertion",
                                    [] { return std::string("<saml:Assertion xmlns:saml=\"urn:other\"/>"); },
                                    &typeid(SsoException)},
                      AssertionCase{"untrusted signer", [] { return UntrustedToken(); },
                                    &typeid(InvalidSignatureException)},
                      AssertionCase{"not well-formed", [] { return std::string("<saml:Assertion"); },
                                    &typeid(Tamber::Xml::XMLParseException)}));

TEST_F(SecurityTokenServiceImplTest, AnEmptyAssertionYieldsNoTokenAndNoSuccessMessage) {
  _transport->Answer("not read");
  const SecurityTokenServiceImpl service(boost::make_shared<RequestBuilderImpl>(boost::none), _transport,
                                         boost::make_shared<FixedAssertionHandler>(""),
                                         TestSupport::TrustedCertificates());
  LogCapture capture;
  EXPECT_FALSE(service.AcquireToken("alice@example.com", "pw", Spec()));
  EXPECT_EQ(FramedMessages(capture.GetMessages(), "AcquireToken").size(), 3u);
  EXPECT_FALSE(capture.Contains("Successfully acquired token"));
}

TEST(CreateSecurityTokenServiceTest, AcceptsAnEmptyCertificateListAndNoKeyMaterial) {
  SecurityTokenServiceConfig config;
  config.stsUrl = "http://sts.example:8080/sts/STSService";
  EXPECT_TRUE(CreateSecurityTokenService(config));
}

TEST(CreateSecurityTokenServiceTest, RefusesHttpsWithoutSslContext) {
  SecurityTokenServiceConfig config;
  config.stsUrl = "https://sts.example/sts/STSService";
  config.trustedCertificates = TestSupport::TrustedCertificates();
  try {
    CreateSecurityTokenService(config);
    FAIL() << "service created";
  } catch (const Tamber::InvalidArgumentException& e) {
    EXPECT_STREQ(e.what(), "Invalid argument : HTTPS connection requested but no SSLContext provided.");
  }
}

}  // namespace
}  // namespace SsoClient
