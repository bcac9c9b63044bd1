#include "tamber/Panic.h"

#include <gtest/gtest.h>

namespace {

TEST(PanicDeathTest, VerifyNamesExpressionFileAndLine) {
  const int line = __LINE__ + 1;
  EXPECT_DEATH(TAMBER_VERIFY(1 + 1 == 3), "Verify failed: 1 \\+ 1 == 3 at .*PanicTest\\.cpp:" + std::to_string(line));
}

TEST(PanicDeathTest, VerifyTextUsesTheGivenText) {
  EXPECT_DEATH(TAMBER_VERIFY_TEXT(false, "rootBuilder != __null"), "Verify failed: rootBuilder != __null at ");
}

TEST(PanicDeathTest, NotReachedNamesTheLocation) {
  EXPECT_DEATH(TAMBER_NOT_REACHED(), "Unreachable code reached at .*PanicTest\\.cpp:[0-9]+");
}

TEST(PanicTest, PassingVerifyDoesNothing) {
  int evaluations = 0;
  TAMBER_VERIFY(++evaluations == 1);
  EXPECT_EQ(evaluations, 1);
}

}  // namespace
