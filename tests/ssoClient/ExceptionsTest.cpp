#include "ssoClient/Exceptions.h"

#include <memory>
#include <typeinfo>

#include <gtest/gtest.h>

namespace SsoClient {
namespace {

template <class E>
class LibraryExceptionTest : public testing::Test {};

using LibraryExceptions = testing::Types<SsoException, InvalidTokenException, InvalidSignatureException,
                                         ParseException, CommunicationException, InvalidCredentialsException>;
TYPED_TEST_SUITE(LibraryExceptionTest, LibraryExceptions);

// An asynchronous completion keeps a clone of what it caught as Tamber::Exception and rethrows it
// later: the caller's handler for the concrete class must still match.
TYPED_TEST(LibraryExceptionTest, CloneOfBaseReferenceRethrowsDynamicType) {
  std::unique_ptr<Tamber::Exception> clone;
  try {
    throw TypeParam("Signature verification failed");
  } catch (const Tamber::Exception& caught) {
    clone.reset(caught.Clone());
  }
  ASSERT_NE(nullptr, clone);
  const Tamber::Exception& cloned = *clone;
  EXPECT_EQ(typeid(TypeParam), typeid(cloned));

  try {
    clone->Throw();
  } catch (const TypeParam& rethrown) {
    EXPECT_EQ(typeid(TypeParam), typeid(rethrown));
    EXPECT_STREQ("Signature verification failed", rethrown.what());
    return;
  } catch (...) {
  }
  FAIL() << "Throw() of the clone did not raise " << typeid(TypeParam).name();
}

TYPED_TEST(LibraryExceptionTest, CopyKeepsMessage) {
  const TypeParam original("Unexpected SOAP fault");
  const TypeParam copy(original);
  EXPECT_STREQ("Unexpected SOAP fault", copy.what());
}

// Which handlers catch a thrown exception, given as the exception to throw.
template <class Handler>
bool IsCaughtAs(const Tamber::Exception& exception) {
  try {
    exception.Throw();
  } catch (const Handler&) {
    return true;
  } catch (...) {
  }
  return false;
}

TEST(ExceptionHierarchyTest, RejectedTokensAreCaughtAsInvalidTokenAndSsoException) {
  const ParseException parse("Missing element Subject");
  const InvalidSignatureException signature("Signature verification failed");
  for (const Tamber::Exception* exception :
       {static_cast<const Tamber::Exception*>(&parse), static_cast<const Tamber::Exception*>(&signature)}) {
    SCOPED_TRACE(typeid(*exception).name());
    EXPECT_TRUE(IsCaughtAs<InvalidTokenException>(*exception));
    EXPECT_TRUE(IsCaughtAs<SsoException>(*exception));
    EXPECT_TRUE(IsCaughtAs<Tamber::Exception>(*exception));
  }
  EXPECT_FALSE(IsCaughtAs<InvalidSignatureException>(parse));
  EXPECT_FALSE(IsCaughtAs<ParseException>(signature));
}

TEST(ExceptionHierarchyTest, TransportAndCredentialFailuresAreNotTokenFailures) {
  const CommunicationException communication("HTTP status 503");
  const InvalidCredentialsException credentials("Authentication failed");
  for (const Tamber::Exception* exception : {static_cast<const Tamber::Exception*>(&communication),
                                             static_cast<const Tamber::Exception*>(&credentials)}) {
    SCOPED_TRACE(typeid(*exception).name());
    EXPECT_FALSE(IsCaughtAs<InvalidTokenException>(*exception));
    EXPECT_TRUE(IsCaughtAs<SsoException>(*exception));
  }
  EXPECT_FALSE(IsCaughtAs<CommunicationException>(credentials));
}

TEST(CoreExceptionTest, InvalidArgumentPrefixesMessageOnceAcrossClone) {
  const Tamber::InvalidArgumentException original("Token lifetime must be positive");
  EXPECT_STREQ("Invalid argument : Token lifetime must be positive", original.what());

  std::unique_ptr<Tamber::Exception> clone(static_cast<const Tamber::Exception&>(original).Clone());
  try {
    clone->Throw();
  } catch (const Tamber::InvalidArgumentException& rethrown) {
    EXPECT_STREQ("Invalid argument : Token lifetime must be positive", rethrown.what());
    return;
  } catch (...) {
  }
  FAIL() << "Throw() of the clone did not raise InvalidArgumentException";
}

}  // namespace
}  // namespace SsoClient
