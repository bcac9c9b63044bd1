#include "ssoClient/OperationFrame.h"

#include <stdexcept>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "support/LogCapture.h"
#include "support/ScriptedSts.h"

namespace SsoClient {
namespace {

using TestSupport::LogCapture;

TEST(OperationFrameTest, StartAndEndShareAFreshOperationId) {
  LogCapture capture;
  std::string firstId, secondId;
  {
    OperationFrame first("AcquireToken");
    firstId = first.opId;
  }
  {
    OperationFrame second("AcquireToken");
    secondId = second.opId;
  }
  EXPECT_NE(firstId, secondId);
  const std::vector<std::string> messages = capture.GetMessages();
  ASSERT_EQ(messages.size(), 4u);
  EXPECT_TRUE(TestSupport::FramedMessages({messages[0], messages[1]}, "AcquireToken").empty());
  EXPECT_EQ(messages[0], "opId=" + firstId + " START operation SecurityTokenServiceImpl::AcquireToken");
  EXPECT_EQ(messages[3], "opId=" + secondId + " END operation SecurityTokenServiceImpl::AcquireToken");
}

TEST(OperationFrameTest, EndIsLoggedWhileAnExceptionPasses) {
  LogCapture capture;
  try {
    OperationFrame frame("RenewToken");
    throw std::runtime_error("failed");
  } catch (const std::runtime_error&) {
    EXPECT_EQ(capture.GetMessages().size(), 2u);
  }
  TestSupport::FramedMessages(capture.GetMessages(), "RenewToken");
}

TEST(OperationFrameTest, BelowTraceLevelNothingIsLogged) {
  LogCapture capture("SsoClient", 63);
  { OperationFrame frame("ValidateSubject"); }
  EXPECT_TRUE(capture.GetEntries().empty());
}

TEST(OperationFrameTest, AThrowingLogSinkDoesNotEndTheProcessAtTheEnd) {
  LogCapture capture;
  Tamber::Service::LogManager* manager = Tamber::Service::GetApp()->GetLogManager();
  const Tamber::Service::LogSink capturing = manager->GetSink();
  {
    OperationFrame frame("AcquireToken");
    manager->SetSink([](const std::string&, int, const std::string&) { throw std::runtime_error("sink broken"); });
  }
  manager->SetSink(capturing);
  EXPECT_EQ(capture.GetMessages().size(), 1u);
}

}  // namespace
}  // namespace SsoClient
