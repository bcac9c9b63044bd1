// SPNEGO negotiation with the development STS's test mechanism, whole and one leg at a time.

#include <gtest/gtest.h>

#include "DevStsEnvironment.h"
#include "TestMechanism.h"
#include "ssoClient/Exceptions.h"
#include "ssoClient/GssNegotiationContext.h"

namespace E2e {
namespace {

using SsoClient::PrincipalId;
using SsoClient::TokenSpec;

class GssNegotiationTest : public DevStsTest {};

TEST_F(GssNegotiationTest, WholeNegotiationGivesTheUsersToken) {
  const auto handler = DevSts::CreateTestMechanismHandler("alice@example.com", "alice-password");
  const auto token = Service()->AcquireTokenByGSS(TokenSpec(), *handler);
  EXPECT_EQ(token->GetSubject(), PrincipalId("alice", "example.com"));
  EXPECT_EQ(token->GetConfirmationMethod(), SsoClient::SamlToken::CONFIRM_HOLDER_OF_KEY);
}

TEST_F(GssNegotiationTest, WrongPasswordIsInvalidCredentialsOnTheSecondLeg) {
  const auto handler = DevSts::CreateTestMechanismHandler("alice@example.com", "bob-password");
  try {
    Service()->AcquireTokenByGSS(TokenSpec(), *handler);
    ADD_FAILURE() << "no exception";
  } catch (const SsoClient::InvalidCredentialsException& e) {
    EXPECT_STREQ(e.what(), "Authentication failed: Wrong user name or password");
  }
}

TEST_F(GssNegotiationTest, StepApiCarriesTheChallengeAndEndsWithTheToken) {
  TokenSpec spec;
  spec.confirmation = TokenSpec::CONFIRMATION_BEARER;
  const auto context = SsoClient::InternalApi::CreateGssNegotiationContext(environment->ServiceConfig(), spec);

  const SsoClient::InternalApi::NegotiationResult first =
      context->NegotiateToken(DevSts::MechanismFirstLeg("bob@example.com"));
  ASSERT_NE(first.leg, nullptr);
  EXPECT_EQ(first.token, nullptr);
  EXPECT_FALSE(first.leg->empty());

  const SsoClient::InternalApi::NegotiationResult second =
      context->NegotiateToken(DevSts::MechanismProof("bob-password", *first.leg));
  ASSERT_NE(second.token, nullptr);
  ASSERT_NE(second.leg, nullptr);
  EXPECT_TRUE(second.leg->empty());
  EXPECT_EQ(second.token->GetSubject(), PrincipalId("bob", "example.com"));
  EXPECT_EQ(second.token->GetConfirmationMethod(), SsoClient::SamlToken::CONFIRM_BEARER);
}

TEST_F(GssNegotiationTest, ChallengesDifferBetweenNegotiations) {
  const auto config = environment->ServiceConfig();
  const auto one = SsoClient::InternalApi::CreateGssNegotiationContext(config, TokenSpec());
  const auto two = SsoClient::InternalApi::CreateGssNegotiationContext(config, TokenSpec());
  const SsoClient::Leg firstLeg = DevSts::MechanismFirstLeg("alice@example.com");
  EXPECT_NE(*one->NegotiateToken(firstLeg).leg, *two->NegotiateToken(firstLeg).leg);
}

}  // namespace
}  // namespace E2e
