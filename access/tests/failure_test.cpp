#include "failure.h"

#include <stdexcept>

#include <gtest/gtest.h>

#include <ssoclient/exceptions.h>

namespace SsoClient::Access {

namespace {

template <class Exception>
Failure Of(const Exception& exception) {
  return Failure(std::make_exception_ptr(exception));
}

TEST(FailureTest, NotSetAtFirst) {
  EXPECT_FALSE(Failure().IsSet());
}

TEST(FailureTest, ExceptionsOfTheClientKeepClassAndMessage) {
  const Failure failure = Of(PasswordExpiredException("old"));
  EXPECT_TRUE(failure.IsSet());
  EXPECT_THROW(failure.Throw(), PasswordExpiredException);
  EXPECT_EQ(failure.Message(), "old");
  EXPECT_EQ(failure.Kind(), FailureKind::kExpiredPassword);
  EXPECT_NE(dynamic_cast<const PasswordExpiredException*>(failure.ForCallback().get()), nullptr);
}

TEST(FailureTest, AttemptsDetermineKindAndText) {
  const auto unauthorised =
      std::make_exception_ptr(CommunicationException("Server returned error: 401 secret"));
  const Failure failure(unauthorised, MakeReason(FailureKind::kRefusedLogin, "401 ***"));
  EXPECT_EQ(failure.Kind(), FailureKind::kRefusedLogin);
  EXPECT_EQ(failure.RecordText(), "401 ***");
  EXPECT_EQ(failure.AsReason().ToString(), "refused-login: 401 ***");
  // The exception is that of the client.
  EXPECT_THROW(failure.Throw(), CommunicationException);
  EXPECT_EQ(failure.Message(), "Server returned error: 401 secret");
  EXPECT_TRUE(failure.Is<CommunicationException>());
  EXPECT_TRUE(failure.Is<SsoException>());
  EXPECT_FALSE(failure.Is<InvalidCredentialsException>());
  const Failure copy = failure;
  EXPECT_EQ(copy.Kind(), FailureKind::kRefusedLogin);
  EXPECT_EQ(Failure(unauthorised).Kind(), FailureKind::kUnreachable);
}

TEST(FailureTest, TextForRecordsIsShortAndWithoutControlCharacters) {
  const Failure failure = Of(SsoException(std::string("a\nb") + std::string(5000, 'c')));
  EXPECT_EQ(failure.RecordText().size(), 1000U);
  EXPECT_EQ(failure.RecordText().substr(0, 4), "a?bc");
  EXPECT_EQ(failure.AsReason().kind, FailureKind::kFault);
}

TEST(FailureTest, EachCallerGetsACopy) {
  const Failure failure = Of(SsoException("shared"));
  const Tarnik::Exception* first = nullptr;
  try {
    failure.Throw();
  } catch (const Tarnik::Exception& one) {
    first = &one;
    try {
      failure.Throw();
    } catch (const Tarnik::Exception& other) {
      EXPECT_NE(&other, first);
    }
  }
  EXPECT_NE(first, nullptr);
}

TEST(FailureTest, CopyAndOfKeepTheClass) {
  EXPECT_THROW(Failure::Copy(ParseException("x")).Throw(), ParseException);
  EXPECT_THROW(Failure::Of(Tarnik::CancelledException("x")).Throw(), Tarnik::CancelledException);
  try {
    throw InvalidCredentialsException("now");
  } catch (...) {
    EXPECT_THROW(Failure::Current().Throw(), InvalidCredentialsException);
  }
}

TEST(FailureTest, OtherExceptionsAreRethrownAndDescribedForCallbacks) {
  const Failure failure = Of(std::out_of_range("no entry"));
  EXPECT_THROW(failure.Throw(), std::out_of_range);
  EXPECT_EQ(failure.Message(), "no entry");
  EXPECT_EQ(failure.Kind(), FailureKind::kLocal);
  const auto reported = failure.ForCallback();
  EXPECT_NE(dynamic_cast<const SsoException*>(reported.get()), nullptr);
  EXPECT_EQ(reported->Message(), "no entry");
}

TEST(FailureTest, ObjectsThatAreNotExceptionsAreDescribed) {
  const Failure failure = Of(42);
  EXPECT_THROW(failure.Throw(), int);
  EXPECT_EQ(failure.ForCallback()->Message(),
            "A function of the login has thrown an object that is not an exception.");
}

TEST(FailureTest, ShortageOfMemoryIsReportedAsSuch) {
  const Failure failure = Of(std::bad_alloc());
  EXPECT_THROW(failure.Throw(), std::bad_alloc);
  EXPECT_EQ(failure.ForCallback().get(), &Tarnik::OutOfMemory());
}

TEST(FailureTest, OutOfMemoryIsThePlatforms) {
  EXPECT_EQ(Failure::OutOfMemory().ForCallback().get(), &Tarnik::OutOfMemory());
  EXPECT_THROW(Failure::OutOfMemory().Throw(), Tarnik::ResourceException);
}

}  // namespace

}  // namespace SsoClient::Access
