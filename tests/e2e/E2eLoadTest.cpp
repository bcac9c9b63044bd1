// Many threads of mixed operations on one service against one development STS.

#include <atomic>
#include <chrono>
#include <iostream>
#include <thread>

#include <gtest/gtest.h>

#include "DevStsEnvironment.h"
#include "TestMechanism.h"

namespace E2e {
namespace {

using SsoClient::TokenSpec;

const int THREADS = 8;
const int OPERATIONS_PER_THREAD = 100;

class LoadTest : public DevStsTest {};

TEST_F(LoadTest, MixedOperationsFromEightThreadsAllSucceed) {
  const auto service = Service();
  TokenSpec renewable;
  renewable.renewable = true;
  const auto seed = service->AcquireToken("alice@example.com", "alice-password", renewable);

  std::atomic<int> succeeded(0);
  std::vector<std::string> failures(THREADS);
  const auto start = std::chrono::steady_clock::now();
  std::vector<std::thread> threads;
  for (int t = 0; t < THREADS; ++t) {
    threads.emplace_back([&, t] {
      for (int i = 0; i < OPERATIONS_PER_THREAD; ++i) {
        try {
          bool ok = true;
          switch ((t + i) % 6) {
            case 0: ok = service->AcquireToken("bob@example.com", "bob-password", TokenSpec()) != nullptr; break;
            case 1: ok = service->AcquireTokenByCertificate(TokenSpec())->IsSolution(); break;
            case 2: ok = service->AcquireTokenByToken(*seed, TokenSpec()) != nullptr; break;
            case 3: ok = service->ValidateSubject(*seed); break;
            case 4: ok = service->RenewToken(*seed, 600) != nullptr; break;
            default: {
              const auto handler = DevSts::CreateTestMechanismHandler("alice@example.com", "alice-password");
              ok = service->AcquireTokenByGSS(TokenSpec(), *handler) != nullptr;
            }
          }
          if (ok) {
            ++succeeded;
          } else {
            failures[t] = "operation " + std::to_string((t + i) % 6) + " gave a wrong result";
          }
        } catch (const std::exception& e) {
          failures[t] = e.what();
        }
      }
    });
  }
  for (std::thread& thread : threads) thread.join();
  const double seconds = std::chrono::duration<double>(std::chrono::steady_clock::now() - start).count();

  for (int t = 0; t < THREADS; ++t) EXPECT_EQ(failures[t], "") << "thread " << t;
  EXPECT_EQ(succeeded.load(), THREADS * OPERATIONS_PER_THREAD);
  const double perSecond = succeeded.load() / seconds;
  RecordProperty("operations_per_second", std::to_string(perSecond));
  std::cout << "load: " << succeeded.load() << " operations in " << seconds << " s, " << perSecond
            << " operations/s" << std::endl;

  // Still serving.
  EXPECT_NE(service->AcquireToken("alice@example.com", "alice-password", TokenSpec()), nullptr);
}

}  // namespace
}  // namespace E2e
