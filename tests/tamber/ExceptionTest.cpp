#include "tamber/Exception.h"

#include <gtest/gtest.h>

#include <functional>
#include <memory>
#include <typeinfo>

#include "tamber/Ref.h"

namespace {

using Tamber::Exception;
using Tamber::InvalidArgumentException;

struct ThrowCase {
  const char* name;
  std::function<void()> raise;
  const char* message;
};

class ExceptionCloneTest : public testing::TestWithParam<ThrowCase> {};

// A clone of an exception caught through the base keeps its dynamic type and message, even after
// the original is gone, and its Throw() raises that type again.
TEST_P(ExceptionCloneTest, CloneAndThrowKeepDynamicTypeAndMessage) {
  std::unique_ptr<Exception> clone;
  const std::type_info* originalType = nullptr;
  try {
    GetParam().raise();
    FAIL() << "nothing raised";
  } catch (const Exception& e) {
    originalType = &typeid(e);
    clone.reset(e.Clone());
  }
  ASSERT_TRUE(clone);
  const Exception& copy = *clone;
  EXPECT_EQ(typeid(copy), *originalType);
  EXPECT_STREQ(clone->what(), GetParam().message);
  try {
    clone->Throw();
  } catch (const Exception& e) {
    EXPECT_EQ(typeid(e), *originalType);
    EXPECT_STREQ(e.what(), GetParam().message);
  }
}

INSTANTIATE_TEST_SUITE_P(
    Classes, ExceptionCloneTest,
    testing::Values(
        ThrowCase{"Exception", [] { throw Exception("plain"); }, "plain"},
        ThrowCase{"InvalidArgument", [] { throw InvalidArgumentException("bad"); }, "Invalid argument : bad"},
        ThrowCase{"InvalidState", [] { throw Tamber::InvalidStateException("state"); }, "state"},
        ThrowCase{"TypeMismatch", [] { throw Tamber::TypeMismatchException("type"); }, "type"},
        ThrowCase{"DateTimeFormat", [] { throw Tamber::DateTimeFormatException("date"); }, "date"},
        ThrowCase{"Base64Format", [] { throw Tamber::Base64FormatException("b64"); }, "b64"},
        ThrowCase{"IO", [] { throw Tamber::IOException("io"); }, "io"}),
    [](const testing::TestParamInfo<ThrowCase>& info) { return std::string(info.param.name); });

TEST(ExceptionTest, RethrownCloneIsCaughtAsTheDerivedClass) {
  std::unique_ptr<Exception> clone;
  try {
    throw Tamber::DateTimeFormatException("Invalid xs:dateTime value `x'");
  } catch (const Exception& e) {
    clone.reset(e.Clone());
  }
  EXPECT_THROW(
      {
        try {
          clone->Throw();
        } catch (const Tamber::DateTimeFormatException& e) {
          EXPECT_STREQ(e.what(), "Invalid xs:dateTime value `x'");
          throw;
        }
      },
      Tamber::DateTimeFormatException);
}

TEST(ExceptionTest, InvalidArgumentPrefixAppearsOnceAfterCloneAndThrow) {
  const std::string expected = "Invalid argument : Token lifetime must be positive";
  const InvalidArgumentException original("Token lifetime must be positive");
  EXPECT_EQ(original.what(), expected);

  std::unique_ptr<InvalidArgumentException> clone(original.Clone());
  EXPECT_EQ(clone->what(), expected);
  std::unique_ptr<InvalidArgumentException> cloneOfClone(clone->Clone());
  EXPECT_EQ(cloneOfClone->what(), expected);
  try {
    cloneOfClone->Throw();
  } catch (const InvalidArgumentException& e) {
    EXPECT_EQ(e.what(), expected);
  }
}

TEST(ExceptionTest, CloneKeepsTheBacktrace) {
  const Tamber::IOException original("io");
  std::unique_ptr<Exception> clone(original.Clone());
  EXPECT_EQ(clone->GetBacktrace(), original.GetBacktrace());
}

TEST(ExceptionTest, BacktraceHasOneNumberedFramePerLine) {
  const Tamber::IOException e("read failed");
  const std::string backtrace = e.GetBacktrace();
  ASSERT_FALSE(backtrace.empty());
  EXPECT_EQ(backtrace.rfind("#0 ", 0), 0u) << backtrace;
  EXPECT_NE(backtrace.find("\n#1 "), std::string::npos) << backtrace;
  EXPECT_EQ(backtrace.back(), '\n');
}

TEST(ExceptionTest, DumpNamesClassMessageAndBacktrace) {
  const Tamber::IOException e("read failed");
  EXPECT_EQ(e.Dump(), "Tamber::IOException: read failed\n" + e.GetBacktrace());
}

TEST(ExceptionTest, WhereIsAFrameBeyondTheConstructorCapture) {
  const Tamber::IOException e("read failed");
  const std::string where = e.Where();
  ASSERT_FALSE(where.empty());
  const std::string backtrace = e.GetBacktrace();
  const size_t position = backtrace.find(where);
  ASSERT_NE(position, std::string::npos) << where << "\n" << backtrace;
  EXPECT_GT(position, backtrace.find('\n')) << "Where() named the capturing frame itself";
}

struct Base : Tamber::Object {};
struct Derived : Base {};
struct Other : Base {};

TEST(ExceptionTest, DynamicCastKeepsNullAndCastsMatchingType) {
  Base* none = nullptr;
  EXPECT_EQ(Tamber::DynamicCast<Derived>(none), nullptr);
  Tamber::Ref<Base> object(new Derived());
  EXPECT_EQ(Tamber::DynamicCast<Derived>(object.get()), object.get());
}

TEST(ExceptionTest, DynamicCastOfOtherTypeNamesBothTypes) {
  Tamber::Ref<Base> object(new Other());
  try {
    Tamber::DynamicCast<Derived>(object.get());
    FAIL() << "cast succeeded";
  } catch (const Tamber::TypeMismatchException& e) {
    EXPECT_STREQ(e.what(), "Type mismatch: expected (anonymous namespace)::Derived, found (anonymous namespace)::Other");
  }
}

}  // namespace
