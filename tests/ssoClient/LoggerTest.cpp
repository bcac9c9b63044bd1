#include "ssoClient/Logger.h"

#include <cstdio>
#include <cstdlib>
#include <string>
#include <thread>
#include <vector>

#include <gtest/gtest.h>

#include "ssoClient/Log.h"
#include "support/LogCapture.h"

namespace SsoClient {
namespace {

using Tamber::Service::Logger;

// Runs in a process of its own, where nothing has asked for the logger yet: many threads make
// the first call together and must all get the one published logger.
[[noreturn]] void RaceForFirstLogger() {
  auto fail = [](const char* what) {
    std::fprintf(stderr, "%s\n", what);
    std::exit(1);
  };
  if (logger.load() != nullptr) fail("logger published before the first call");

  constexpr int kThreads = 16;
  std::atomic<int> ready{0};
  std::atomic<bool> start{false};
  std::vector<Logger*> seen(kThreads, nullptr);
  std::vector<std::thread> threads;
  for (int i = 0; i < kThreads; ++i) {
    threads.emplace_back([&, i] {
      ++ready;
      while (!start.load()) std::this_thread::yield();
      seen[i] = getLogger();
    });
  }
  while (ready.load() < kThreads) std::this_thread::yield();
  start = true;
  for (std::thread& thread : threads) thread.join();

  Logger* published = logger.load();
  if (published == nullptr) fail("nothing published");
  for (Logger* each : seen) {
    if (each != published) fail("a thread got another logger than the published one");
  }
  if (published->GetName() != "SsoClient") fail("wrong logger name");
  if (published->GetTraceLevel() != 64) fail("wrong trace level");
  std::exit(0);
}

TEST(GetLoggerTest, ConcurrentFirstCallsShareOnePublishedLogger) {
  GTEST_FLAG_SET(death_test_style, "threadsafe");  // a fresh process: `logger` still null
  EXPECT_EXIT(RaceForFirstLogger(), testing::ExitedWithCode(0), "");
}

TEST(GetLoggerTest, LaterCallsReturnThePublishedLogger) {
  Logger* first = getLogger();
  ASSERT_NE(nullptr, first);
  EXPECT_EQ(first, getLogger());
  EXPECT_EQ(first, logger.load());
}

TEST(GetLoggerTest, TracingIsOffByDefault) { EXPECT_LT(getLogger()->GetLevel(), Tamber::Service::LOG_TRACE); }

// Stands for a costly description of a token or a token request; counts its calls.
int descriptions = 0;
std::string Describe() {
  ++descriptions;
  return "SamlToken [subject=...]";
}

class LogMacroTest : public testing::Test {
 protected:
  void SetUp() override { descriptions = 0; }
};

TEST_F(LogMacroTest, BelowTraceLevelNothingIsFormatted) {
  TestSupport::LogCapture capture("SsoClient", Tamber::Service::LOG_VERBOSE);
  SSOCLIENT_LOG(Tamber::Service::LOG_TRACE, "Validating subject of token %1", Describe());
  EXPECT_EQ(0, descriptions);
  EXPECT_TRUE(capture.GetEntries().empty());
}

TEST_F(LogMacroTest, AtTraceLevelFormatsOnceAndEmits) {
  TestSupport::LogCapture capture("SsoClient", Tamber::Service::LOG_TRACE);
  SSOCLIENT_LOG(Tamber::Service::LOG_TRACE, "Validating subject of token %1", Describe());
  EXPECT_EQ(1, descriptions);
  const std::vector<TestSupport::LogCapture::Entry> entries = capture.GetEntries();
  ASSERT_EQ(1u, entries.size());
  EXPECT_EQ("SsoClient", entries[0].logger);
  EXPECT_EQ(64, entries[0].level);
  EXPECT_EQ("Validating subject of token SamlToken [subject=...]", entries[0].message);
}

TEST_F(LogMacroTest, ContractErrorsAreEmittedWhileTracingIsOff) {
  TestSupport::LogCapture capture("SsoClient", Tamber::Service::LOG_INFO);
  SSOCLIENT_LOG(Tamber::Service::LOG_WARNING,
                "GSS contract error: non-empty user leg after negotiation is complete");
  const std::vector<TestSupport::LogCapture::Entry> entries = capture.GetEntries();
  ASSERT_EQ(1u, entries.size());
  EXPECT_EQ(8, entries[0].level);
  EXPECT_EQ("GSS contract error: non-empty user leg after negotiation is complete", entries[0].message);
}

}  // namespace
}  // namespace SsoClient
