// The synchronous operations of the service against the development STS over HTTPS.

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "DevStsEnvironment.h"
#include "TokenIssuer.h"
#include "ssoClient/Exceptions.h"
#include "support/TestTokens.h"

namespace E2e {
namespace {

using SsoClient::PrincipalId;
using SsoClient::SamlToken;
using SsoClient::TokenSpec;

const int64_t MICROS = 1000000;

int64_t LifetimeSec(const SamlToken& token) {
  return (token.GetEndDate().GetUtcTime() - token.GetStartDate().GetUtcTime()) / MICROS;
}

class TokenOperationsTest : public DevStsTest {
 protected:
  static TokenSpec RenewableHolderOfKeySpec() {
    TokenSpec spec;
    spec.renewable = true;
    spec.delegable = true;
    return spec;
  }
};

TEST_F(TokenOperationsTest, PasswordWithoutKeyMaterialGivesBearerTokenOfTheUser) {
  const auto token = Service(false)->AcquireToken("alice@example.com", "alice-password", TokenSpec());

  EXPECT_EQ(token->GetConfirmationMethod(), SamlToken::CONFIRM_BEARER);
  EXPECT_EQ(token->GetSubject(), PrincipalId("alice", "example.com"));
  std::vector<PrincipalId> groups;
  token->GetGroups(groups);
  EXPECT_EQ(groups, std::vector<PrincipalId>({PrincipalId("Users", "example.com")}));
  std::pair<std::string, std::string> fullName;
  token->GetFullName(fullName);
  EXPECT_EQ(fullName, std::make_pair(std::string("Alice"), std::string("Example")));
  EXPECT_FALSE(token->IsSolution());
  EXPECT_FALSE(token->IsRenewable());
  EXPECT_FALSE(token->IsDelegable());
  EXPECT_EQ(LifetimeSec(*token), TokenSpec().tokenLifetimeSec);
}

TEST_F(TokenOperationsTest, PasswordWithKeyMaterialGivesHolderOfKeyTokenWithTheRequestedConditions) {
  TokenSpec spec = RenewableHolderOfKeySpec();
  spec.tokenLifetimeSec = 3600;
  spec.audienceRestriction = {"https://service-a.example", "https://service-b.example"};
  spec.advice = {{"urn:example:advice-source", {{"urn:example:roles", {"reader", "writer & <admin>"}}}}};

  const auto token = Service()->AcquireToken("bob@example.com", "bob-password", spec);

  EXPECT_EQ(token->GetConfirmationMethod(), SamlToken::CONFIRM_HOLDER_OF_KEY);
  ASSERT_NE(token->GetConfirmationCertificate(), nullptr);
  EXPECT_EQ(token->GetConfirmationCertificate()->GetDer(),
            environment->Certificate(DevSts::CLIENT_CERTIFICATE_FILE)->GetDer());
  EXPECT_EQ(token->GetSubject(), PrincipalId("bob", "example.com"));
  std::set<std::string> audience;
  token->GetAudience(audience);
  EXPECT_EQ(audience, spec.audienceRestriction);
  std::vector<SsoClient::Advice> advice;
  token->GetAdvice(advice);
  ASSERT_EQ(advice.size(), 1u);
  EXPECT_EQ(advice[0].source, "urn:example:advice-source");
  ASSERT_EQ(advice[0].attributes.size(), 1u);
  EXPECT_EQ(advice[0].attributes[0].values, std::vector<std::string>({"reader", "writer & <admin>"}));
  EXPECT_TRUE(token->IsRenewable());
  EXPECT_TRUE(token->IsDelegable());
  EXPECT_EQ(LifetimeSec(*token), 3600);
}

TEST_F(TokenOperationsTest, LifetimeIsCappedAtTheStsMaximum) {
  TokenSpec spec;
  spec.tokenLifetimeSec = 100 * 24 * 3600;
  const auto token = Service()->AcquireToken("alice@example.com", "alice-password", spec);
  EXPECT_EQ(LifetimeSec(*token), DevSts::Config().maxLifetimeSec);
}

TEST_F(TokenOperationsTest, WrongPasswordOrUnknownUserIsInvalidCredentials) {
  const auto service = Service();
  for (const auto& credentials : {std::make_pair("alice@example.com", "bob-password"),
                                  std::make_pair("carol@example.com", "alice-password")}) {
    SCOPED_TRACE(credentials.first);
    try {
      service->AcquireToken(credentials.first, credentials.second, TokenSpec());
      ADD_FAILURE() << "no exception";
    } catch (const SsoClient::InvalidCredentialsException& e) {
      EXPECT_STREQ(e.what(), "Authentication failed: Wrong user name or password");
    }
  }
}

TEST_F(TokenOperationsTest, CertificateOfASolutionUserGivesItsSolutionToken) {
  const auto token = Service()->AcquireTokenByCertificate(TokenSpec());

  EXPECT_EQ(token->GetSubject(), PrincipalId("demo-solution", "example.com"));
  EXPECT_TRUE(token->IsSolution());
  EXPECT_EQ(token->GetConfirmationMethod(), SamlToken::CONFIRM_HOLDER_OF_KEY);
}

TEST_F(TokenOperationsTest, CertificateOfNoSolutionUserIsInvalidCredentials) {
  SsoClient::SecurityTokenServiceConfig config = environment->ServiceConfig();
  config.holderOfKeyConfig = TestSupport::ClientKeyMaterial();  // signed by another CA, known to no one here
  try {
    SsoClient::CreateSecurityTokenService(config)->AcquireTokenByCertificate(TokenSpec());
    ADD_FAILURE() << "no exception";
  } catch (const SsoClient::InvalidCredentialsException& e) {
    EXPECT_THAT(e.what(), ::testing::HasSubstr("belongs to no solution user"));
  }
}

TEST_F(TokenOperationsTest, UnlistedClientCertificateOfTheStsCaNamesItsSolutionUser) {
  DevSts::Config config = DevSts::DefaultConfig(environment->GetKeyDirectory());
  config.solutionUsers.clear();
  DevSts::Server server(config);
  server.Start();
  SsoClient::SecurityTokenServiceConfig serviceConfig = environment->ServiceConfig();
  serviceConfig.stsUrl = server.GetUrl();

  const auto token = SsoClient::CreateSecurityTokenService(serviceConfig)->AcquireTokenByCertificate(TokenSpec());

  EXPECT_EQ(token->GetSubject(), PrincipalId("demo-solution", "example.com"));
  EXPECT_TRUE(token->IsSolution());
}

TEST_F(TokenOperationsTest, ExchangeKeepsTheSubjectAndAddsTheDelegate) {
  const auto service = Service();
  const auto original = service->AcquireToken("alice@example.com", "alice-password", RenewableHolderOfKeySpec());

  const auto same = service->AcquireTokenByToken(*original, TokenSpec());
  EXPECT_EQ(same->GetSubject(), PrincipalId("alice", "example.com"));
  EXPECT_EQ(same->GetConfirmationMethod(), SamlToken::CONFIRM_HOLDER_OF_KEY);
  EXPECT_NE(same->GetId(), original->GetId());

  TokenSpec delegated;
  delegated.delegateTo = std::string("service@example.com");
  const auto token = service->AcquireTokenByToken(*original, delegated);
  EXPECT_EQ(token->GetSubject(), PrincipalId("alice", "example.com"));
  std::vector<SsoClient::Delegate> chain;
  token->GetDelegationChain(chain);
  ASSERT_EQ(chain.size(), 1u);
  EXPECT_EQ(chain[0].principal, PrincipalId("service", "example.com"));
}

TEST_F(TokenOperationsTest, ExchangeOfAnUndelegableTokenForADelegateIsRefused) {
  const auto service = Service();
  const auto original = service->AcquireToken("alice@example.com", "alice-password", TokenSpec());
  TokenSpec delegated;
  delegated.delegateTo = std::string("service@example.com");
  try {
    service->AcquireTokenByToken(*original, delegated);
    ADD_FAILURE() << "no exception";
  } catch (const SsoClient::SsoException& e) {
    EXPECT_STREQ(e.what(), "Unexpected SOAP fault: wst:RequestFailed; request failed.");
  }
}

TEST_F(TokenOperationsTest, ValidateSaysValidOnlyForItsOwnTokensOfKnownSubjects) {
  const auto service = Service(false);
  EXPECT_TRUE(service->ValidateSubject(*service->AcquireToken("alice@example.com", "alice-password", TokenSpec())));

  // Issued by another STS: a token the library accepts against the test CA, but not ours.
  const auto foreign = SsoClient::CreateSamlToken(TestSupport::IssueTestToken(TokenIssuer::TokenRecord()),
                                                  TestSupport::TrustedCertificates());
  EXPECT_FALSE(service->ValidateSubject(*foreign));

  // Ours, but about a subject the STS does not know (any more).
  TokenIssuer::TokenRecord record;
  record.subject = "carol@example.com";
  const auto signingCertificate = environment->Certificate(DevSts::SIGNING_CERTIFICATE_FILE);
  const auto unknown = SsoClient::CreateSamlToken(
      TokenIssuer::IssueToken(record, *DevSts::ReadPrivateKey(environment->KeyFile(DevSts::SIGNING_KEY_FILE)),
                              *signingCertificate),
      signingCertificate.get());
  EXPECT_FALSE(service->ValidateSubject(*unknown));
}

TEST_F(TokenOperationsTest, RenewGivesAFreshTokenForTheRequestedLifetime) {
  const auto service = Service();
  const auto original = service->AcquireToken("alice@example.com", "alice-password", RenewableHolderOfKeySpec());

  const auto renewed = service->RenewToken(*original, 7200);

  EXPECT_NE(renewed->GetId(), original->GetId());
  EXPECT_EQ(renewed->GetSubject(), original->GetSubject());
  EXPECT_EQ(renewed->GetConfirmationMethod(), SamlToken::CONFIRM_HOLDER_OF_KEY);
  EXPECT_TRUE(renewed->IsRenewable());
  EXPECT_EQ(LifetimeSec(*renewed), 7200);
}

TEST_F(TokenOperationsTest, RenewOfATokenWithoutRenewRestrictionIsRefusedByTheSts) {
  const auto service = Service();
  const auto original = service->AcquireToken("alice@example.com", "alice-password", TokenSpec());
  try {
    service->RenewToken(*original, 600);
    ADD_FAILURE() << "no exception";
  } catch (const SsoClient::SsoException& e) {
    EXPECT_STREQ(e.what(), "Unexpected SOAP fault: wst:UnableToRenew; request failed.");
  }
}

TEST_F(TokenOperationsTest, RenewOfABearerTokenIsRefusedBeforeSending) {
  const auto service = Service();
  TokenSpec spec;
  spec.confirmation = TokenSpec::CONFIRMATION_BEARER;
  spec.renewable = true;
  const auto bearer = service->AcquireToken("alice@example.com", "alice-password", spec);
  try {
    service->RenewToken(*bearer, 600);
    ADD_FAILURE() << "no exception";
  } catch (const Tamber::InvalidArgumentException& e) {
    EXPECT_STREQ(e.what(), "Invalid argument : Unable to renew token: the provided token must be Holder Of Key");
  }
}

TEST_F(TokenOperationsTest, TokenOfAnUntrustedSigningCertificateIsRejected) {
  SsoClient::SecurityTokenServiceConfig config = environment->ServiceConfig();
  config.trustedCertificates = {TestSupport::LoadTestCertificate("sts")};
  EXPECT_THROW(SsoClient::CreateSecurityTokenService(config)->AcquireToken("alice@example.com", "alice-password",
                                                                           TokenSpec()),
               SsoClient::InvalidSignatureException);
}

class PinnedTlsTest : public DevStsTest {
 protected:
  // A client whose SSL context trusts only the test CA, which did not issue the STS's TLS certificate.
  static boost::shared_ptr<SsoClient::SecurityTokenService> ServiceWithPin(const std::string& pin) {
    static const Tamber::Ref<Tamber::Ssl::SSLContext> context = [] {
      Tamber::Ssl::SSLContextOptions options;
      options.trustedCertificates.push_back(TestSupport::LoadTestCertificate("ca"));
      Tamber::Ref<Tamber::Ssl::SSLContext> created;
      Tamber::Ssl::CreateSSLContext(options, created);
      return created;
    }();
    SsoClient::SecurityTokenServiceConfig config = environment->ServiceConfig();
    config.sslContext = context.get();
    config.sslParameter = pin;
    return SsoClient::CreateSecurityTokenService(config);
  }
};

TEST_F(PinnedTlsTest, PinOfTheServerCertificateIsAcceptedWithoutTrustAnchor) {
  const std::string pin = environment->Certificate(DevSts::TLS_CERTIFICATE_FILE)->GetSha256Thumbprint();
  EXPECT_EQ(ServiceWithPin(pin)->AcquireToken("alice@example.com", "alice-password", TokenSpec())->GetSubject(),
            PrincipalId("alice", "example.com"));
}

TEST_F(PinnedTlsTest, WrongPinOrNoPinWithoutTrustAnchorFails) {
  const std::string wrongPin = environment->Certificate(DevSts::CA_CERTIFICATE_FILE)->GetSha256Thumbprint();
  for (const std::string& pin : {wrongPin, std::string()}) {
    SCOPED_TRACE(pin);
    EXPECT_THROW(ServiceWithPin(pin)->AcquireToken("alice@example.com", "alice-password", TokenSpec()),
                 SsoClient::CommunicationException);
  }
}

}  // namespace
}  // namespace E2e
