// The development STS refuses what a real STS refuses: requests posted as text, built by the
// library's request builder and then aged, altered or stripped of their session.

#include <regex>

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <httplib.h>

#include "DevStsEnvironment.h"
#include "Negotiations.h"
#include "TestMechanism.h"
#include "ssoClient/RequestBuilderImpl.h"
#include "support/FixedClock.h"
#include "support/RequestSignatureCheck.h"
#include "support/TestTokens.h"
#include "tamber/StringUtil.h"
#include "tamber/system/DateTime.h"

namespace E2e {
namespace {

using SsoClient::Request;
using SsoClient::TokenSpec;
using ::testing::HasSubstr;

struct RawAnswer {
  int status = 0;
  std::string body;
  std::string setCookie;
};

class StsRefusalsTest : public DevStsTest {
 protected:
  static RawAnswer Post(const std::string& soapAction, const std::string& body, const std::string& cookie = "") {
    httplib::SSLClient client("127.0.0.1", environment->GetServer().GetPort());
    client.set_ca_cert_path(environment->KeyFile(DevSts::CA_CERTIFICATE_FILE).c_str());
    client.enable_server_certificate_verification(true);
    client.set_read_timeout(120, 0);
    httplib::Headers headers = {{"SOAPAction", "\"" + soapAction + "\""}};
    if (!cookie.empty()) headers.emplace("Cookie", cookie);
    const httplib::Result result = client.Post("/sts/STSService", headers, body, "text/xml");
    if (!result) throw std::runtime_error("no answer from the STS: " + httplib::to_string(result.error()));
    return {result->status, result->body, result->get_header_value("Set-Cookie")};
  }
  static RawAnswer Post(const Request& request, const std::string& cookie = "") {
    return Post(request.soapAction, request.body, cookie);
  }

  static std::string FaultCode(const RawAnswer& answer) {
    std::smatch match;
    return std::regex_search(answer.body, match, std::regex("<faultcode>([^<]*)</faultcode>")) ? match[1].str() : "";
  }

  static SsoClient::RequestBuilderImpl HolderOfKeyBuilder() {
    return SsoClient::RequestBuilderImpl(environment->ClientKeyMaterial());
  }
};

TEST_F(StsRefusalsTest, ExpiredTimestampIsRefusedAsExpiredMessage) {
  Request request;
  {
    const TestSupport::FixedClock twoHoursAgo(Tamber::System::GetUtcDateTime().GetUtcTime() - 2LL * 3600 * 1000000);
    SsoClient::RequestBuilderImpl(boost::none).BuildUserPassTokenRequest("alice@example.com", "alice-password",
                                                                         TokenSpec(), request);
  }

  const RawAnswer answer = Post(request);
  EXPECT_EQ(answer.status, 500);
  EXPECT_EQ(FaultCode(answer), "wsse:MessageExpired");
}

TEST_F(StsRefusalsTest, AlteredSignedContentFailsTheSignatureCheck) {
  Request request;
  TokenSpec spec;
  HolderOfKeyBuilder().BuildUserPassTokenRequest("alice@example.com", "alice-password", spec, request);
  EXPECT_EQ(Post(request).status, 200);

  for (const char* signedElement : {"wst:TokenType", "wsu:Expires"}) {
    SCOPED_TRACE(signedElement);
    const RawAnswer answer = Post(request.soapAction, TestSupport::AlterFirstTextByteOf(request.body, signedElement));
    EXPECT_EQ(answer.status, 500);
    EXPECT_EQ(FaultCode(answer), "wsse:FailedCheck");
  }
}

TEST_F(StsRefusalsTest, ContinuedLegNeedsTheSessionCookieOfTheFirst) {
  Request first;
  SsoClient::RequestBuilderImpl builder(boost::none);
  builder.BuildInitialSPNegoRequest(TokenSpec(), DevSts::MechanismFirstLeg("alice@example.com"), first);
  const RawAnswer challenge = Post(first);
  ASSERT_EQ(challenge.status, 200) << challenge.body;
  std::smatch context, leg;
  ASSERT_TRUE(std::regex_search(challenge.body, context, std::regex("Context=\"([^\"]+)\"")));
  ASSERT_TRUE(std::regex_search(challenge.body, leg, std::regex("BinaryExchange[^>]*>([^<]+)<")));
  const std::string cookie = challenge.setCookie.substr(0, challenge.setCookie.find(';'));
  ASSERT_THAT(cookie, HasSubstr(std::string(DevSts::SESSION_COOKIE_NAME) + "="));

  Request second;
  builder.BuildContinuedSPNegoRequest(
      context[1].str(),
      DevSts::MechanismProof("alice-password", Tamber::StringUtil::Base64Decode(leg[1].str())), second);
  const RawAnswer refused = Post(second);
  EXPECT_EQ(refused.status, 500);
  EXPECT_EQ(FaultCode(refused), "wst:InvalidRequest");
  EXPECT_THAT(refused.body, HasSubstr("session cookie"));

  const RawAnswer completed = Post(second, cookie);
  EXPECT_EQ(completed.status, 200);
  EXPECT_THAT(completed.body, HasSubstr("RequestedSecurityToken"));
}

TEST_F(StsRefusalsTest, ExchangeOfAnotherStsAssertionIsAnInvalidSecurityToken) {
  const auto foreign = SsoClient::CreateSamlToken(TestSupport::IssueTestToken(TestSupport::HolderOfKeyRecord()),
                                                  TestSupport::TrustedCertificates());
  Request request;
  SsoClient::RequestBuilderImpl(TestSupport::ClientKeyMaterial()).BuildExchangeTokenRequest(*foreign, TokenSpec(),
                                                                                           request);
  const RawAnswer answer = Post(request);
  EXPECT_EQ(answer.status, 500);
  EXPECT_EQ(FaultCode(answer), "wst:InvalidSecurityToken");
}

TEST_F(StsRefusalsTest, MalformedRequestsAreInvalidRequests) {
  Request valid;
  SsoClient::RequestBuilderImpl(boost::none).BuildUserPassTokenRequest("alice@example.com", "alice-password",
                                                                       TokenSpec(), valid);
  const struct {
    const char* name;
    std::string soapAction;
    std::string body;
  } cases[] = {
      {"not XML", valid.soapAction, "<soapenv:Envelope"},
      {"DOCTYPE", valid.soapAction, "<!DOCTYPE x [<!ENTITY e \"e\">]>" + valid.body},
      {"unknown action", "urn:example:nothing", valid.body},
      {"no security header", valid.soapAction,
       std::regex_replace(valid.body, std::regex("<soapenv:Header>.*</soapenv:Header>"), "<soapenv:Header/>")},
  };
  for (const auto& malformed : cases) {
    SCOPED_TRACE(malformed.name);
    const RawAnswer answer = Post(malformed.soapAction, malformed.body);
    EXPECT_EQ(answer.status, 500);
    EXPECT_EQ(FaultCode(answer), "wst:InvalidRequest");
  }
}

TEST_F(StsRefusalsTest, LogLineNamesOperationSubjectAndOutcomeButNoPassword) {
  Request request;
  SsoClient::RequestBuilderImpl(boost::none).BuildUserPassTokenRequest("alice@example.com", "alice-password",
                                                                       TokenSpec(), request);
  ::testing::internal::CaptureStderr();
  const RawAnswer answer = Post(request);
  const std::string log = ::testing::internal::GetCapturedStderr();

  EXPECT_EQ(answer.status, 200);
  EXPECT_EQ(log, "dev-sts: issue by password subject=alice@example.com outcome=ok\n");
}

}  // namespace
}  // namespace E2e
