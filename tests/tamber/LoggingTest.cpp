#include "tamber/service/Logging.h"

#include <gtest/gtest.h>

#include <set>
#include <thread>
#include <vector>

#include "support/LogCapture.h"

namespace {

using Tamber::Ref;
using namespace Tamber::Service;
using TestSupport::LogCapture;

Ref<Logger> FetchLogger(const std::string& name, int traceLevel = LOG_TRACE) {
  Ref<Logger> logger;
  GetApp()->GetLogManager()->GetLogger(name, traceLevel, logger);
  return logger;
}

// An argument that counts how often it is turned into text.
struct CountingArgument {
  int& conversions;
  operator std::string() const {
    ++conversions;
    return "counted";
  }
};

TEST(LoggingTest, DefaultLevelHidesTracingWithoutFormatting) {
  Ref<Logger> logger = FetchLogger("LoggingTest.Default");
  EXPECT_EQ(logger->GetLevel(), LOG_INFO);
  LogCapture capture("LoggingTest.Other");
  int conversions = 0;
  LogInternal(logger.get(), LOG_TRACE, "traced %1", CountingArgument{conversions});
  EXPECT_EQ(conversions, 0);
  EXPECT_TRUE(capture.GetEntries().empty());
  LogInternal(logger.get(), LOG_INFO, "shown %1", CountingArgument{conversions});
  EXPECT_EQ(conversions, 1);
  EXPECT_EQ(capture.GetMessages(), std::vector<std::string>{"shown counted"});
}

TEST(LoggingTest, SinkReceivesNameLevelAndMessage) {
  Ref<Logger> logger = FetchLogger("LoggingTest.Sink");
  LogCapture capture("LoggingTest.Sink", LOG_TRACE);
  LogInternal(logger.get(), LOG_WARNING, "%1 of %2", 3, "four");
  const auto entries = capture.GetEntries();
  ASSERT_EQ(entries.size(), 1u);
  EXPECT_EQ(entries[0].logger, "LoggingTest.Sink");
  EXPECT_EQ(entries[0].level, LOG_WARNING);
  EXPECT_EQ(entries[0].message, "3 of four");
}

TEST(LoggingTest, LevelChangeTakesEffectAtOnce) {
  Ref<Logger> logger = FetchLogger("LoggingTest.Level", 48);
  LogCapture capture("LoggingTest.Other");
  logger->SetLevel(LOG_ERROR);
  logger->Emit(LOG_WARNING, "hidden");
  logger->EnableTracing();
  EXPECT_EQ(logger->GetLevel(), 48);
  logger->Emit(LOG_VERBOSE, "verbose");
  logger->Emit(LOG_TRACE, "still hidden");
  logger->SetLevel(LOG_TRACE);
  logger->Emit(LOG_TRACE, "traced");
  EXPECT_EQ(capture.GetMessages(), (std::vector<std::string>{"verbose", "traced"}));
}

TEST(LoggingTest, DefaultLevelAppliesToLaterLoggersOnly) {
  Ref<Logger> before = FetchLogger("LoggingTest.BeforeDefault");
  GetApp()->GetLogManager()->SetDefaultLevel(LOG_ERROR);
  Ref<Logger> after = FetchLogger("LoggingTest.AfterDefault");
  GetApp()->GetLogManager()->SetDefaultLevel(LOG_INFO);
  EXPECT_EQ(before->GetLevel(), LOG_INFO);
  EXPECT_EQ(after->GetLevel(), LOG_ERROR);
}

TEST(LoggingTest, OneLoggerPerNameAcrossThreads) {
  constexpr int kThreads = 8;
  std::vector<Ref<Logger>> loggers(kThreads);
  std::vector<std::thread> threads;
  for (int t = 0; t < kThreads; ++t) {
    threads.emplace_back([&loggers, t] { loggers[t] = FetchLogger("LoggingTest.Concurrent"); });
  }
  for (auto& thread : threads) thread.join();
  std::set<Logger*> distinct;
  for (const auto& logger : loggers) distinct.insert(logger.get());
  EXPECT_EQ(distinct.size(), 1u);
  EXPECT_EQ(FetchLogger("LoggingTest.Concurrent").get(), *distinct.begin());
  EXPECT_NE(FetchLogger("LoggingTest.Concurrent2").get(), *distinct.begin());
}

TEST(LoggingTest, DefaultSinkWritesOneLineToStderr) {
  Ref<Logger> logger = FetchLogger("LoggingTest.Stderr");
  GetApp()->GetLogManager()->SetSink(LogSink());
  testing::internal::CaptureStderr();
  logger->Emit(LOG_WARNING, "disk full");
  EXPECT_EQ(testing::internal::GetCapturedStderr(), "LoggingTest.Stderr [8] disk full\n");
}

TEST(LoggingTest, ConcurrentEmittersReachTheSinkIntact) {
  Ref<Logger> logger = FetchLogger("LoggingTest.Emitters");
  LogCapture capture("LoggingTest.Emitters", LOG_INFO);
  std::vector<std::thread> threads;
  for (int t = 0; t < 4; ++t) {
    threads.emplace_back([&logger] {
      for (int i = 0; i < 500; ++i) LogInternal(logger.get(), LOG_INFO, "message %1", i);
    });
  }
  for (auto& thread : threads) thread.join();
  EXPECT_EQ(capture.GetEntries().size(), 2000u);
}

TEST(LoggingTest, GetAppIsOneObject) {
  EXPECT_EQ(GetApp(), GetApp());
  EXPECT_EQ(GetApp()->GetLogManager(), GetApp()->GetLogManager());
}

TEST(LogCaptureTest, RestoresPreviousSinkAndLevel) {
  Ref<Logger> logger = FetchLogger("LoggingTest.Nested");
  LogCapture outer("LoggingTest.Nested", LOG_WARNING);
  {
    LogCapture inner("LoggingTest.Nested", LOG_TRACE);
    logger->Emit(LOG_TRACE, "inner");
    EXPECT_EQ(inner.GetMessages(), std::vector<std::string>{"inner"});
  }
  EXPECT_EQ(logger->GetLevel(), LOG_WARNING);
  logger->Emit(LOG_WARNING, "outer");
  logger->Emit(LOG_INFO, "hidden");
  EXPECT_EQ(outer.GetMessages(), std::vector<std::string>{"outer"});
  EXPECT_TRUE(outer.Contains("out"));
  outer.Clear();
  EXPECT_TRUE(outer.GetEntries().empty());
}

}  // namespace
