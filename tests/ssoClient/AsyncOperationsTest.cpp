#include "ssoClient/AsyncOperations.h"

#include <chrono>
#include <condition_variable>
#include <functional>
#include <mutex>
#include <stdexcept>
#include <string>
#include <thread>
#include <vector>

#include <boost/function.hpp>
#include <boost/make_shared.hpp>
#include <boost/none.hpp>
#include <boost/optional/optional_io.hpp>
#include <boost/weak_ptr.hpp>
#include <gtest/gtest.h>

#include "ssoClient/Exceptions.h"
#include "ssoClient/RequestBuilderImpl.h"
#include "ssoClient/ResponseHandlerImpl.h"
#include "ssoClient/SecurityTokenServiceImpl.h"
#include "support/LogCapture.h"
#include "support/ScriptedSts.h"
#include "support/TestTokens.h"
#include "tamber/Exception.h"

namespace SsoClient {
namespace {

using TestSupport::LogCapture;
using TestSupport::MakeLeg;
using TestSupport::ScriptedTransport;

constexpr std::chrono::seconds kPatience(60);

// What the callback of one asynchronous operation received. The callbacks hold it by a shared
// pointer, so that its use count tells when the work item (and its copy of the callback) is gone.
class Delivery {
 public:
  void Record(const boost::shared_ptr<const SamlToken>& token, const boost::optional<bool>& valid,
              const Tamber::Exception* error) {
    std::lock_guard<std::mutex> lock(_mutex);
    ++_calls;
    _thread = std::this_thread::get_id();
    _token = token;
    _valid = valid;
    _error.reset(error ? error->Clone() : nullptr);
    _delivered.notify_all();
  }

  TokenCallback TokenRecorder(const boost::shared_ptr<Delivery>& self) {
    return [self](const boost::shared_ptr<const SamlToken>& token, const Tamber::Exception* error) {
      self->Record(token, boost::none, error);
    };
  }

  ValidateCallback ValidateRecorder(const boost::shared_ptr<Delivery>& self) {
    return [self](const boost::optional<bool>& valid, const Tamber::Exception* error) {
      self->Record(nullptr, valid, error);
    };
  }

  // Waits until the callback has run and the work item has released everything it held.
  static bool AwaitFinished(const boost::shared_ptr<Delivery>& delivery) {
    {
      std::unique_lock<std::mutex> lock(delivery->_mutex);
      if (!delivery->_delivered.wait_for(lock, kPatience, [&] { return delivery->_calls > 0; })) return false;
    }
    const auto deadline = std::chrono::steady_clock::now() + kPatience;
    while (delivery.use_count() > 1) {
      if (std::chrono::steady_clock::now() > deadline) return false;
      std::this_thread::sleep_for(std::chrono::milliseconds(1));
    }
    return true;
  }

  int Calls() const {
    std::lock_guard<std::mutex> lock(_mutex);
    return _calls;
  }
  std::thread::id Thread() const {
    std::lock_guard<std::mutex> lock(_mutex);
    return _thread;
  }
  boost::shared_ptr<const SamlToken> Token() const {
    std::lock_guard<std::mutex> lock(_mutex);
    return _token;
  }
  boost::optional<bool> Valid() const {
    std::lock_guard<std::mutex> lock(_mutex);
    return _valid;
  }
  boost::shared_ptr<Tamber::Exception> Error() const {
    std::lock_guard<std::mutex> lock(_mutex);
    return _error;
  }

 private:
  mutable std::mutex _mutex;
  std::condition_variable _delivered;
  int _calls = 0;
  std::thread::id _thread;
  boost::shared_ptr<const SamlToken> _token;
  boost::optional<bool> _valid;
  boost::shared_ptr<Tamber::Exception> _error;
};

using TestSupport::ClientKeyMaterial;

TokenSpec Spec() {
  TokenSpec spec;
  spec.tokenLifetimeSec = 600;
  return spec;
}

boost::shared_ptr<const SamlToken> HolderOfKeyToken() {
  return CreateSamlToken(TestSupport::IssueTestToken(TestSupport::HolderOfKeyRecord()),
                         TestSupport::TrustedCertificates());
}

// A GSS mechanism that needs one leg and remembers the thread it was called on.
class OneLegHandler : public NegotiationHandler {
 public:
  boost::shared_ptr<Leg> NegotiateLeg(const Leg&) override {
    thread = std::this_thread::get_id();
    return boost::make_shared<Leg>(MakeLeg("client-1"));
  }
  std::thread::id thread;
};

// Answers every request of every operation successfully. The final SPNEGO answer has the shape
// of an issue answer too, so it serves both.
void AnswerEverything(ScriptedTransport& transport) {
  const std::string issued = TestSupport::IssueTestToken(TestSupport::HolderOfKeyRecord());
  transport.AnswerAlways(Request::ISSUE, TestSupport::SPNegoFinalAnswer("ctx-1", Leg(), issued));
  transport.AnswerAlways(Request::RENEW, TestSupport::RenewAnswer(issued));
  transport.AnswerAlways(Request::VALIDATE, TestSupport::ValidateAnswer(true));
}

class AsyncOperationsTest : public ::testing::Test {
 protected:
  boost::shared_ptr<const SecurityTokenService> Service() const {
    return boost::make_shared<SecurityTokenServiceImpl>(boost::make_shared<RequestBuilderImpl>(ClientKeyMaterial()),
                                                        _transport, boost::make_shared<ResponseHandlerImpl>(),
                                                        TestSupport::TrustedCertificates());
  }

  const boost::shared_ptr<ScriptedTransport> _transport = boost::make_shared<ScriptedTransport>();
};

// One asynchronous twin, started with a recording callback.
struct Twin {
  const char* name;
  bool validates;
  std::function<void(const SecurityTokenService&, const boost::shared_ptr<Delivery>&)> start;
};

std::ostream& operator<<(std::ostream& out, const Twin& twin) { return out << twin.name; }

std::vector<Twin> Twins() {
  return {
      {"AcquireTokenAsync", false,
       [](const SecurityTokenService& service, const boost::shared_ptr<Delivery>& delivery) {
         service.AcquireTokenAsync("alice@example.com", "pw", Spec(), delivery->TokenRecorder(delivery));
       }},
      {"AcquireTokenByGssAsync", false,
       [](const SecurityTokenService& service, const boost::shared_ptr<Delivery>& delivery) {
         service.AcquireTokenByGssAsync(Spec(), boost::make_shared<OneLegHandler>(), delivery->TokenRecorder(delivery));
       }},
      {"AcquireTokenByCertificateAsync", false,
       [](const SecurityTokenService& service, const boost::shared_ptr<Delivery>& delivery) {
         service.AcquireTokenByCertificateAsync(Spec(), delivery->TokenRecorder(delivery));
       }},
      {"AcquireTokenByTokenAsync", false,
       [](const SecurityTokenService& service, const boost::shared_ptr<Delivery>& delivery) {
         service.AcquireTokenByTokenAsync(HolderOfKeyToken(), Spec(), delivery->TokenRecorder(delivery));
       }},
      {"ValidateSubjectAsync", true,
       [](const SecurityTokenService& service, const boost::shared_ptr<Delivery>& delivery) {
         service.ValidateSubjectAsync(HolderOfKeyToken(), delivery->ValidateRecorder(delivery));
       }},
      {"RenewTokenAsync", false,
       [](const SecurityTokenService& service, const boost::shared_ptr<Delivery>& delivery) {
         service.RenewTokenAsync(HolderOfKeyToken(), 1200, delivery->TokenRecorder(delivery));
       }},
  };
}

class TwinTest : public AsyncOperationsTest, public ::testing::WithParamInterface<Twin> {};

TEST_P(TwinTest, DeliversTheResultOnceOnAWorkerThread) {
  AnswerEverything(*_transport);
  const auto delivery = boost::make_shared<Delivery>();
  GetParam().start(*Service(), delivery);
  ASSERT_TRUE(Delivery::AwaitFinished(delivery));

  EXPECT_EQ(delivery->Calls(), 1);
  EXPECT_NE(delivery->Thread(), std::this_thread::get_id());
  EXPECT_FALSE(delivery->Error());
  if (GetParam().validates) {
    EXPECT_EQ(delivery->Valid(), boost::optional<bool>(true));
  } else {
    ASSERT_TRUE(delivery->Token());
    EXPECT_EQ(delivery->Token()->GetSubject().name, "alice");
  }
}

TEST_P(TwinTest, DeliversTheFailureOnceKeepingItsClass) {
  _transport->Answer(TestSupport::FaultAnswer("wst:FailedAuthentication", "denied"));
  const auto delivery = boost::make_shared<Delivery>();
  GetParam().start(*Service(), delivery);
  ASSERT_TRUE(Delivery::AwaitFinished(delivery));

  EXPECT_EQ(delivery->Calls(), 1);
  EXPECT_NE(delivery->Thread(), std::this_thread::get_id());
  EXPECT_FALSE(delivery->Token());
  EXPECT_FALSE(delivery->Valid());
  ASSERT_TRUE(delivery->Error());
  try {
    delivery->Error()->Throw();
  } catch (const InvalidCredentialsException& e) {
    EXPECT_STREQ(e.what(), "Authentication failed: denied");
  }
}

INSTANTIATE_TEST_SUITE_P(Twins, TwinTest, ::testing::ValuesIn(Twins()));

TEST_F(AsyncOperationsTest, TheGssHandlerRunsOnTheWorker) {
  AnswerEverything(*_transport);
  const auto handler = boost::make_shared<OneLegHandler>();
  const auto delivery = boost::make_shared<Delivery>();
  Service()->AcquireTokenByGssAsync(Spec(), handler, delivery->TokenRecorder(delivery));
  ASSERT_TRUE(Delivery::AwaitFinished(delivery));
  EXPECT_EQ(handler->thread, delivery->Thread());
  EXPECT_EQ(handler.use_count(), 1);
}

TEST_F(AsyncOperationsTest, ReleasingServiceAndTokenRightAfterTheCallChangesNothing) {
  AnswerEverything(*_transport);
  _transport->Hold();
  const auto builder = boost::make_shared<RequestBuilderImpl>(ClientKeyMaterial());
  boost::weak_ptr<const RequestBuilderImpl> builderWatch = builder;
  boost::shared_ptr<const SecurityTokenService> service = boost::make_shared<SecurityTokenServiceImpl>(
      builder, _transport, boost::make_shared<ResponseHandlerImpl>(), TestSupport::TrustedCertificates());
  boost::shared_ptr<const SamlToken> token = HolderOfKeyToken();
  boost::weak_ptr<const SamlToken> tokenWatch = token;
  const auto delivery = boost::make_shared<Delivery>();

  service->RenewTokenAsync(token, 1200, delivery->TokenRecorder(delivery));
  service.reset();
  token.reset();
  // Only the work item holds them now.
  EXPECT_FALSE(tokenWatch.expired());
  EXPECT_EQ(builderWatch.use_count(), 2);
  _transport->Release();

  ASSERT_TRUE(Delivery::AwaitFinished(delivery));
  EXPECT_TRUE(delivery->Token());
  EXPECT_FALSE(delivery->Error());
  EXPECT_TRUE(tokenWatch.expired());
  EXPECT_EQ(builderWatch.use_count(), 1);
}

class ThrowingCallbackTest : public AsyncOperationsTest, public ::testing::WithParamInterface<bool> {};

TEST_P(ThrowingCallbackTest, IsNotCalledAgain) {
  const bool succeeds = GetParam();
  if (succeeds) {
    AnswerEverything(*_transport);
  } else {
    _transport->Fail(CommunicationException("connection refused"));
  }
  LogCapture capture("Tamber");
  const auto delivery = boost::make_shared<Delivery>();
  Service()->AcquireTokenByCertificateAsync(
      Spec(), [delivery](const boost::shared_ptr<const SamlToken>& token, const Tamber::Exception* error) {
        delivery->Record(token, boost::none, error);
        throw SsoException("callback failed");
      });
  ASSERT_TRUE(Delivery::AwaitFinished(delivery));

  EXPECT_EQ(delivery->Calls(), 1);
  EXPECT_EQ(static_cast<bool>(delivery->Error()), !succeeds);
  // The pool logged the escaped exception; waiting for it is needed, as it follows the callback.
  const auto deadline = std::chrono::steady_clock::now() + kPatience;
  while (!capture.Contains("callback failed") && std::chrono::steady_clock::now() < deadline) {
    std::this_thread::sleep_for(std::chrono::milliseconds(1));
  }
  EXPECT_TRUE(capture.Contains("Exception left a thread pool work item: callback failed"));
}

INSTANTIATE_TEST_SUITE_P(Paths, ThrowingCallbackTest, ::testing::Bool());

using TokenCall = boost::function<boost::shared_ptr<const SamlToken>()>;

TEST(SyncCallToResultFuncTest, OtherExceptionsLeaveWithoutCallingBack) {
  int callbacks = 0;
  const TokenCallback callback = [&](const boost::shared_ptr<const SamlToken>&, const Tamber::Exception*) {
    ++callbacks;
  };
  const TokenCall call = []() -> boost::shared_ptr<const SamlToken> { throw std::runtime_error("out of luck"); };
  EXPECT_THROW(SyncCallToResultFunc(call, callback, boost::shared_ptr<const SamlToken>()), std::runtime_error);
  EXPECT_EQ(callbacks, 0);
}

TEST(SyncCallToResultFuncTest, AnEmptyCallbackFailsAfterTheCallRan) {
  int calls = 0;
  const boost::function<bool()> call = [&] {
    ++calls;
    return true;
  };
  EXPECT_THROW(SyncCallToResultFunc(call, ValidateCallback(), boost::none), boost::bad_function_call);
  EXPECT_EQ(calls, 1);
}

TEST(SyncCallToResultFuncTest, AFailureDeliversTheFailureValue) {
  boost::optional<bool> delivered = true;
  std::string message;
  const boost::function<bool()> call = []() -> bool { throw Tamber::InvalidStateException("not now"); };
  SyncCallToResultFunc(
      call,
      ValidateCallback([&](const boost::optional<bool>& valid, const Tamber::Exception* error) {
        delivered = valid;
        message = error->what();
      }),
      boost::none);
  EXPECT_FALSE(delivered);
  EXPECT_EQ(message, "not now");
}

class NullArgumentTest : public AsyncOperationsTest {
 protected:
  void SetUp() override { GTEST_FLAG_SET(death_test_style, "threadsafe"); }
};

TEST_F(NullArgumentTest, ANullTokenOrHandlerEndsTheProcess) {
  const auto service = Service();
  const TokenCallback ignore = [](const boost::shared_ptr<const SamlToken>&, const Tamber::Exception*) {};
  const char* const verify = "Verify failed: _p at .*lib/ssoClient/SecurityTokenServiceImpl";
  EXPECT_DEATH(service->RenewTokenAsync(nullptr, 600, ignore), verify);
  EXPECT_DEATH(service->AcquireTokenByTokenAsync(nullptr, Spec(), ignore), verify);
  EXPECT_DEATH(service->ValidateSubjectAsync(nullptr, ValidateCallback()), verify);
  EXPECT_DEATH(service->AcquireTokenByGssAsync(Spec(), nullptr, ignore), verify);
}

TEST_F(AsyncOperationsTest, TwoHundredConcurrentOperationsAllComplete) {
  AnswerEverything(*_transport);
  const auto service = Service();
  const std::vector<Twin> twins = Twins();
  std::vector<boost::shared_ptr<Delivery>> deliveries;
  for (int i = 0; i < 200; ++i) {
    deliveries.push_back(boost::make_shared<Delivery>());
    twins[i % twins.size()].start(*service, deliveries.back());
  }
  for (size_t i = 0; i < deliveries.size(); ++i) {
    SCOPED_TRACE(twins[i % twins.size()].name);
    ASSERT_TRUE(Delivery::AwaitFinished(deliveries[i])) << "operation " << i;
    EXPECT_EQ(deliveries[i]->Calls(), 1);
    EXPECT_FALSE(deliveries[i]->Error());
    EXPECT_TRUE(deliveries[i]->Token() || deliveries[i]->Valid() == boost::optional<bool>(true));
  }
  EXPECT_EQ(_transport->GetRequests().size(), 200u);
  EXPECT_EQ(_transport->GetSessionCount(), 200u);
}

}  // namespace
}  // namespace SsoClient
