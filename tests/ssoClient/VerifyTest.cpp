#include "ssoClient/Verify.h"

#include <gtest/gtest.h>

namespace SsoClient {
namespace {

TEST(VerifyDeathTest, NullPointerNamesExpressionAsWritten) {
  const int* rootBuilder = nullptr;
  EXPECT_DEATH(SSOCLIENT_VERIFY_NOT_NULL(rootBuilder),
               "Verify failed: rootBuilder != __null at .*VerifyTest.cpp:");
}

}  // namespace
}  // namespace SsoClient
