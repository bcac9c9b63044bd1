// The asynchronous twins of the service's operations against the development STS.

#include <chrono>
#include <future>
#include <memory>

#include <gtest/gtest.h>

#include "DevStsEnvironment.h"
#include "TestMechanism.h"
#include "ssoClient/Exceptions.h"

namespace E2e {
namespace {

using SsoClient::PrincipalId;
using SsoClient::SamlToken;
using SsoClient::TokenSpec;

// Generous: a loaded CI machine with sanitizers is slow, and a hang must still end the test.
const std::chrono::seconds COMPLETION_TIMEOUT(120);

struct TokenOutcome {
  boost::shared_ptr<const SamlToken> token;
  std::shared_ptr<Tamber::Exception> error;
};

struct ValidateOutcome {
  boost::optional<bool> valid;
  std::shared_ptr<Tamber::Exception> error;
};

// A callback that fulfils a future, and that future.
class TokenCompletion {
 public:
  SsoClient::TokenCallback Callback() {
    auto promise = _promise;
    return [promise](const boost::shared_ptr<const SamlToken>& token, const Tamber::Exception* error) {
      promise->set_value({token, std::shared_ptr<Tamber::Exception>(error ? error->Clone() : nullptr)});
    };
  }
  TokenOutcome Wait() {
    std::future<TokenOutcome> future = _promise->get_future();
    if (future.wait_for(COMPLETION_TIMEOUT) != std::future_status::ready) throw std::runtime_error("no completion");
    return future.get();
  }

 private:
  std::shared_ptr<std::promise<TokenOutcome>> _promise = std::make_shared<std::promise<TokenOutcome>>();
};

class AsyncOperationsTest : public DevStsTest {
 protected:
  static TokenSpec RenewableSpec() {
    TokenSpec spec;
    spec.renewable = true;
    return spec;
  }
};

TEST_F(AsyncOperationsTest, AcquireTokenAsyncDeliversTheTokenOrTheFailure) {
  const auto service = Service();
  TokenCompletion success;
  service->AcquireTokenAsync("alice@example.com", "alice-password", TokenSpec(), success.Callback());
  const TokenOutcome issued = success.Wait();
  ASSERT_NE(issued.token, nullptr);
  EXPECT_EQ(issued.error, nullptr);
  EXPECT_EQ(issued.token->GetSubject(), PrincipalId("alice", "example.com"));

  TokenCompletion failure;
  service->AcquireTokenAsync("alice@example.com", "wrong", TokenSpec(), failure.Callback());
  const TokenOutcome refused = failure.Wait();
  EXPECT_EQ(refused.token, nullptr);
  ASSERT_NE(refused.error, nullptr);
  EXPECT_THROW(refused.error->Throw(), SsoClient::InvalidCredentialsException);
}

TEST_F(AsyncOperationsTest, AcquireTokenByCertificateAsyncDeliversTheSolutionToken) {
  TokenCompletion completion;
  Service()->AcquireTokenByCertificateAsync(TokenSpec(), completion.Callback());
  const TokenOutcome outcome = completion.Wait();
  ASSERT_NE(outcome.token, nullptr) << (outcome.error ? outcome.error->what() : "");
  EXPECT_TRUE(outcome.token->IsSolution());
}

TEST_F(AsyncOperationsTest, AcquireTokenByGssAsyncNegotiatesOnThePool) {
  TokenCompletion completion;
  Service()->AcquireTokenByGssAsync(TokenSpec(),
                                    DevSts::CreateTestMechanismHandler("bob@example.com", "bob-password"),
                                    completion.Callback());
  const TokenOutcome outcome = completion.Wait();
  ASSERT_NE(outcome.token, nullptr) << (outcome.error ? outcome.error->what() : "");
  EXPECT_EQ(outcome.token->GetSubject(), PrincipalId("bob", "example.com"));
}

TEST_F(AsyncOperationsTest, TokenOperationsAsyncOnAnIssuedToken) {
  const auto service = Service();
  const boost::shared_ptr<const SamlToken> original =
      service->AcquireToken("alice@example.com", "alice-password", RenewableSpec());

  TokenCompletion exchanged;
  service->AcquireTokenByTokenAsync(original, TokenSpec(), exchanged.Callback());
  TokenCompletion renewed;
  service->RenewTokenAsync(original, 1200, renewed.Callback());
  auto validated = std::make_shared<std::promise<ValidateOutcome>>();
  service->ValidateSubjectAsync(original, [validated](const boost::optional<bool>& valid, const Tamber::Exception* e) {
    validated->set_value({valid, std::shared_ptr<Tamber::Exception>(e ? e->Clone() : nullptr)});
  });

  const TokenOutcome exchange = exchanged.Wait();
  ASSERT_NE(exchange.token, nullptr) << (exchange.error ? exchange.error->what() : "");
  EXPECT_EQ(exchange.token->GetSubject(), original->GetSubject());
  const TokenOutcome renewal = renewed.Wait();
  ASSERT_NE(renewal.token, nullptr) << (renewal.error ? renewal.error->what() : "");
  EXPECT_EQ(renewal.token->GetEndDate().GetUtcTime() - renewal.token->GetStartDate().GetUtcTime(), 1200LL * 1000000);
  std::future<ValidateOutcome> validation = validated->get_future();
  ASSERT_EQ(validation.wait_for(COMPLETION_TIMEOUT), std::future_status::ready);
  const ValidateOutcome validity = validation.get();
  EXPECT_EQ(validity.error, nullptr);
  ASSERT_TRUE(validity.valid.is_initialized());
  EXPECT_TRUE(*validity.valid);
}

}  // namespace
}  // namespace E2e
