#include "ssoClient/GssNegotiation.h"

#include <string>
#include <typeinfo>
#include <vector>

#include <boost/make_shared.hpp>
#include <gtest/gtest.h>

#include "ssoClient/Descriptions.h"
#include "ssoClient/Exceptions.h"
#include "ssoClient/RequestBuilderImpl.h"
#include "ssoClient/ResponseHandlerImpl.h"
#include "ssoClient/SecurityTokenServiceImpl.h"
#include "support/LogCapture.h"
#include "support/ScriptedSts.h"
#include "support/TestTokens.h"
#include "tamber/Exception.h"
#include "tamber/StringUtil.h"

namespace SsoClient {
namespace {

using InternalApi::GssNegotiationContextImpl;
using InternalApi::NegotiationResult;
using TestSupport::FramedMessages;
using TestSupport::LogCapture;
using TestSupport::MakeLeg;
using TestSupport::RecordedRequest;
using TestSupport::ScriptedTransport;
using TestSupport::SPNegoFinalAnswer;
using TestSupport::SPNegoLegAnswer;

const Leg kNoLeg;

boost::shared_ptr<Leg> UserLeg(const std::string& text) { return boost::make_shared<Leg>(MakeLeg(text)); }

std::string IssuedToken() { return TestSupport::IssueTestToken(TokenIssuer::TokenRecord()); }

TokenSpec Spec() {
  TokenSpec spec;
  spec.tokenLifetimeSec = 900;
  return spec;
}

bool Carries(const RecordedRequest& sent, const Leg& leg) {
  return sent.request.body.find(">" + Tamber::StringUtil::Base64Encode(leg) + "<") != std::string::npos;
}

bool NamesContext(const RecordedRequest& sent, const std::string& contextId) {
  return sent.request.body.find("\"" + contextId + "\"") != std::string::npos;
}

// The caller's GSS mechanism: answers with the legs it was given, in order, and records the STS
// legs it is handed.
class ScriptedHandler : public NegotiationHandler {
 public:
  explicit ScriptedHandler(std::vector<boost::shared_ptr<Leg>> answers) : _answers(std::move(answers)) {}

  boost::shared_ptr<Leg> NegotiateLeg(const Leg& stsLeg) override {
    received.push_back(stsLeg);
    if (received.size() > _answers.size()) {
      ADD_FAILURE() << "handler called once too often";
      return UserLeg("unexpected");
    }
    return _answers[received.size() - 1];
  }

  std::vector<Leg> received;

 private:
  std::vector<boost::shared_ptr<Leg>> _answers;
};

class AcquireTokenByGssTest : public ::testing::Test {
 protected:
  SecurityTokenServiceImpl Service() const {
    return SecurityTokenServiceImpl(boost::make_shared<RequestBuilderImpl>(boost::none), _transport,
                                    boost::make_shared<ResponseHandlerImpl>(), TestSupport::TrustedCertificates());
  }

  const boost::shared_ptr<ScriptedTransport> _transport = boost::make_shared<ScriptedTransport>();
};

TEST_F(AcquireTokenByGssTest, TwoExchangesOnOneSession) {
  _transport->Answer(SPNegoLegAnswer("ctx-1", MakeLeg("sts-1")));
  _transport->Answer(SPNegoFinalAnswer("ctx-1", kNoLeg, IssuedToken()));
  ScriptedHandler handler({UserLeg("client-1"), UserLeg("client-2")});
  LogCapture capture;

  const boost::shared_ptr<const SamlToken> token = Service().AcquireTokenByGSS(Spec(), handler);

  ASSERT_TRUE(token);
  EXPECT_EQ(token->GetSubject().name, "alice");
  EXPECT_EQ(handler.received, (std::vector<Leg>{kNoLeg, MakeLeg("sts-1")}));
  const auto requests = _transport->GetRequests();
  ASSERT_EQ(requests.size(), 2u);
  EXPECT_EQ(requests[0].request.soapAction, Request::ISSUE);
  EXPECT_TRUE(Carries(requests[0], MakeLeg("client-1")));
  EXPECT_EQ(requests[1].request.soapAction, Request::CHALLANGE);
  EXPECT_TRUE(Carries(requests[1], MakeLeg("client-2")));
  EXPECT_TRUE(NamesContext(requests[1], "ctx-1"));
  EXPECT_EQ(requests[0].session, requests[1].session);
  EXPECT_EQ(_transport->GetSessionCount(), 1u);
  const std::vector<std::string> expected = {"Requested token with spec `" + WriteTokenSpec(Spec()) + "'",
                                             "Successfully acquired token: " + CreateRedactedDescription(*token)};
  EXPECT_EQ(FramedMessages(capture.GetMessages(), "AcquireTokenByGSS"), expected);
}

TEST_F(AcquireTokenByGssTest, EachLegNamesTheLatestContextId) {
  _transport->Answer(SPNegoLegAnswer("ctx-1", MakeLeg("sts-1")));
  _transport->Answer(SPNegoLegAnswer("ctx-2", MakeLeg("sts-2")));
  _transport->Answer(SPNegoFinalAnswer("ctx-2", kNoLeg, IssuedToken()));
  ScriptedHandler handler({UserLeg("client-1"), UserLeg("client-2"), UserLeg("client-3")});

  EXPECT_TRUE(Service().AcquireTokenByGSS(Spec(), handler));

  const auto requests = _transport->GetRequests();
  ASSERT_EQ(requests.size(), 3u);
  EXPECT_TRUE(NamesContext(requests[1], "ctx-1"));
  EXPECT_TRUE(NamesContext(requests[2], "ctx-2"));
  EXPECT_FALSE(NamesContext(requests[2], "ctx-1"));
}

// The STS issues the token in its first answer, with or without a last leg for the mechanism.
struct FinalLegCase {
  const char* name;
  Leg stsLeg;
  // The handler's answer to that last leg; unused when the STS sends none.
  boost::shared_ptr<Leg> finalUserLeg;
  bool contractErrorLogged;
};

std::ostream& operator<<(std::ostream& out, const FinalLegCase& c) { return out << c.name; }

class FinalLegTest : public AcquireTokenByGssTest, public ::testing::WithParamInterface<FinalLegCase> {};

TEST_P(FinalLegTest, LastStsLegGoesToTheHandlerOnceAndIsNeverSent) {
  const FinalLegCase& c = GetParam();
  SCOPED_TRACE(c.name);
  _transport->Answer(SPNegoFinalAnswer("ctx-1", c.stsLeg, IssuedToken()));
  ScriptedHandler handler({UserLeg("client-1"), c.finalUserLeg});
  LogCapture capture;

  EXPECT_TRUE(Service().AcquireTokenByGSS(Spec(), handler));

  const std::vector<Leg> expectedCalls =
      c.stsLeg.empty() ? std::vector<Leg>{kNoLeg} : std::vector<Leg>{kNoLeg, c.stsLeg};
  EXPECT_EQ(handler.received, expectedCalls);
  EXPECT_EQ(_transport->GetRequests().size(), 1u);
  bool logged = false;
  for (const LogCapture::Entry& entry : capture.GetEntries()) {
    if (entry.level != 8) continue;
    EXPECT_EQ(entry.message, "GSS contract error: non-empty user leg after negotiation is complete");
    logged = true;
  }
  EXPECT_EQ(logged, c.contractErrorLogged);
}

INSTANTIATE_TEST_SUITE_P(
    LastLegs, FinalLegTest,
    ::testing::Values(FinalLegCase{"no last leg", kNoLeg, nullptr, false},
                      FinalLegCase{"answered by an empty leg", MakeLeg("sts-last"), boost::make_shared<Leg>(), false},
                      FinalLegCase{"answered by a null leg", MakeLeg("sts-last"), nullptr, false},
                      FinalLegCase{"answered by a non-empty leg", MakeLeg("sts-last"), UserLeg("surplus"), true}));

// A negotiation that fails: the STS's answers, the handler's legs, what is raised, and how many
// requests went out before.
struct GssFailureCase {
  const char* name;
  std::vector<std::string> answers;
  std::vector<boost::shared_ptr<Leg>> userLegs;
  const std::type_info* raised;
  std::string message;
  size_t requestsSent;
};

std::ostream& operator<<(std::ostream& out, const GssFailureCase& c) { return out << c.name; }

class GssFailureTest : public AcquireTokenByGssTest, public ::testing::WithParamInterface<GssFailureCase> {};

TEST_P(GssFailureTest, RaisesAfterEndWasLogged) {
  const GssFailureCase& c = GetParam();
  SCOPED_TRACE(c.name);
  for (const std::string& answer : c.answers) _transport->Answer(answer);
  ScriptedHandler handler(c.userLegs);
  LogCapture capture;
  try {
    Service().AcquireTokenByGSS(Spec(), handler);
    FAIL() << "no exception";
  } catch (const Tamber::Exception& e) {
    EXPECT_EQ(typeid(e), *c.raised) << typeid(e).name();
    EXPECT_EQ(e.what(), c.message);
  }
  EXPECT_EQ(_transport->GetRequests().size(), c.requestsSent);
  EXPECT_EQ(FramedMessages(capture.GetMessages(), "AcquireTokenByGSS").size(), 1u);
}

const char kNoContextId[] = "Error processing the response to SPNego token request: no Context ID was returned.";

std::string VersionedToken(const std::string& version) {
  TokenIssuer::TokenRecord record;
  record.version = version;
  return TestSupport::IssueTestToken(record);
}

std::vector<GssFailureCase> GssFailures() {
  std::string versionMessage;
  try {
    CreateSamlToken(VersionedToken("1.1"), TestSupport::TrustedCertificates());
  } catch (const ParseException& e) {
    versionMessage = e.what();
  }
  return {
      {"null first leg", {}, {nullptr}, &typeid(Tamber::InvalidArgumentException),
       "Invalid argument : Invalid NegotiationHandler: the returned leg may not be NULL", 0},
      {"empty first leg", {}, {boost::make_shared<Leg>()}, &typeid(Tamber::InvalidArgumentException),
       "Invalid argument : Invalid NegotiationHandler: the returned leg may not be empty while the negotiation goes on",
       0},
      {"null second leg", {SPNegoLegAnswer("ctx-1", MakeLeg("sts-1"))}, {UserLeg("client-1"), nullptr},
       &typeid(Tamber::InvalidArgumentException),
       "Invalid argument : Invalid NegotiationHandler: the returned leg may not be NULL", 1},
      {"empty second leg", {SPNegoLegAnswer("ctx-1", MakeLeg("sts-1"))}, {UserLeg("client-1"), boost::make_shared<Leg>()},
       &typeid(Tamber::InvalidArgumentException),
       "Invalid argument : Invalid NegotiationHandler: the returned leg may not be empty while the negotiation goes on",
       1},
      {"no context id beside the token", {SPNegoFinalAnswer("", kNoLeg, IssuedToken())}, {UserLeg("client-1")},
       &typeid(CommunicationException), kNoContextId, 1},
      {"no context id in a later leg",
       {SPNegoLegAnswer("ctx-1", MakeLeg("sts-1")), SPNegoLegAnswer("", MakeLeg("sts-2"))},
       {UserLeg("client-1"), UserLeg("client-2")}, &typeid(CommunicationException), kNoContextId, 2},
      {"issued assertion that does not parse", {SPNegoFinalAnswer("ctx-1", kNoLeg, VersionedToken("1.1"))},
       {UserLeg("client-1")}, &typeid(SsoException), versionMessage, 1},
      {"SOAP fault", {TestSupport::FaultAnswer("wst:FailedAuthentication", "")}, {UserLeg("client-1")},
       &typeid(InvalidCredentialsException), "Authentication failed", 1},
  };
}

INSTANTIATE_TEST_SUITE_P(Failures, GssFailureTest, ::testing::ValuesIn(GssFailures()));

class GssNegotiationContextTest : public ::testing::Test {
 protected:
  GssNegotiationContextImpl Context() const {
    return GssNegotiationContextImpl(Spec(), boost::make_shared<RequestBuilderImpl>(boost::none),
                                     _transport->CreateSession(), boost::make_shared<ResponseHandlerImpl>(),
                                     TestSupport::TrustedCertificates());
  }

  const boost::shared_ptr<ScriptedTransport> _transport = boost::make_shared<ScriptedTransport>();
};

TEST_F(GssNegotiationContextTest, FirstStepStartsLaterStepsContinue) {
  _transport->Answer(SPNegoLegAnswer("ctx-1", MakeLeg("sts-1")));
  _transport->Answer(SPNegoFinalAnswer("ctx-1", kNoLeg, IssuedToken()));
  GssNegotiationContextImpl context = Context();
  LogCapture capture;

  const NegotiationResult first = context.NegotiateToken(MakeLeg("client-1"));
  ASSERT_TRUE(first.leg);
  EXPECT_EQ(*first.leg, MakeLeg("sts-1"));
  EXPECT_FALSE(first.token);

  const NegotiationResult second = context.NegotiateToken(MakeLeg("client-2"));
  ASSERT_TRUE(second.leg);
  EXPECT_TRUE(second.leg->empty());
  ASSERT_TRUE(second.token);
  EXPECT_EQ(second.token->GetSubject().name, "alice");

  const auto requests = _transport->GetRequests();
  ASSERT_EQ(requests.size(), 2u);
  EXPECT_EQ(requests[0].request.soapAction, Request::ISSUE);
  EXPECT_TRUE(Carries(requests[0], MakeLeg("client-1")));
  EXPECT_EQ(requests[1].request.soapAction, Request::CHALLANGE);
  EXPECT_TRUE(NamesContext(requests[1], "ctx-1"));
  EXPECT_EQ(requests[0].session, requests[1].session);
  EXPECT_TRUE(capture.GetEntries().empty());
}

TEST_F(GssNegotiationContextTest, AnAnswerWithoutContextIdStartsOver) {
  _transport->Answer(SPNegoLegAnswer("", MakeLeg("sts-1")));
  _transport->Answer(SPNegoLegAnswer("ctx-2", MakeLeg("sts-2")));
  GssNegotiationContextImpl context = Context();

  EXPECT_EQ(*context.NegotiateToken(MakeLeg("client-1")).leg, MakeLeg("sts-1"));
  EXPECT_EQ(*context.NegotiateToken(MakeLeg("client-2")).leg, MakeLeg("sts-2"));

  const auto requests = _transport->GetRequests();
  ASSERT_EQ(requests.size(), 2u);
  EXPECT_EQ(requests[0].request.soapAction, Request::ISSUE);
  EXPECT_EQ(requests[1].request.soapAction, Request::ISSUE);
}

TEST_F(GssNegotiationContextTest, ARejectedAssertionKeepsItsClass) {
  _transport->Answer(SPNegoFinalAnswer("ctx-1", kNoLeg, VersionedToken("1.1")));
  GssNegotiationContextImpl context = Context();
  EXPECT_THROW(context.NegotiateToken(MakeLeg("client-1")), ParseException);
}

TEST(CreateGssNegotiationContextTest, RefusesAnEmptyCertificateList) {
  SecurityTokenServiceConfig config;
  config.stsUrl = "http://sts.example/sts/STSService";
  try {
    InternalApi::CreateGssNegotiationContext(config, Spec());
    FAIL() << "context created";
  } catch (const Tamber::InvalidArgumentException& e) {
    EXPECT_STREQ(e.what(), "Invalid argument : No STS trusted certificates provided");
  }
  EXPECT_TRUE(CreateSecurityTokenService(config));
  config.trustedCertificates = TestSupport::TrustedCertificates();
  EXPECT_TRUE(InternalApi::CreateGssNegotiationContext(config, Spec()));
}

}  // namespace
}  // namespace SsoClient
