#include <cstring>
#include <memory>
#include <string>
#include <typeinfo>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <tarnik/core/exception.h>
#include <tarnik/core/throwable.h>

namespace Tarnik::Testing {
namespace {

using testing::EndsWith;
using testing::HasSubstr;

// Slot `index` of the object's primary virtual table (Itanium C++ ABI, section 2.5).
void* Slot(const void* object, int index) {
  void* const* table = nullptr;
  std::memcpy(&table, object, sizeof table);
  return table[index];
}

TEST(ThrowableTest, KeepsTheOrderOfItsVtableSlots) {
  const InvalidStateException exception("the message");
  const auto what = reinterpret_cast<const char* (*)(const void*)>(Slot(&exception, 2));
  EXPECT_STREQ(what(&exception), "the message");
  const auto message = reinterpret_cast<const std::string* (*)(const void*)>(Slot(&exception, 3));
  EXPECT_EQ(message(&exception), &exception.Message());
  const auto dump = reinterpret_cast<std::string (*)(const void*)>(Slot(&exception, 4));
  EXPECT_EQ(dump(&exception), exception.Dump());
  const auto where = reinterpret_cast<boost::source_location (*)(const void*)>(Slot(&exception, 5));
  EXPECT_EQ(where(&exception).line(), exception.Where().line());
  const auto clone =
      reinterpret_cast<std::unique_ptr<Throwable> (*)(const void*)>(Slot(&exception, 6));
  EXPECT_NE(dynamic_cast<InvalidStateException*>(clone(&exception).get()), nullptr);
  const auto raise = reinterpret_cast<void (*)(const void*)>(Slot(&exception, 7));
  EXPECT_THROW(raise(&exception), InvalidStateException);
}

TEST(ThrowableTest, RecordsWhereItWasCreated) {
  const Exception exception("x");
  const auto line = static_cast<unsigned>(__LINE__ - 1);
  EXPECT_EQ(exception.Where().line(), line);
  EXPECT_THAT(exception.Where().file_name(), EndsWith("throwable_test.cpp"));
}

TEST(ThrowableTest, DumpNamesClassMessageAndPlace) {
  const InvalidArgumentException exception("bad");
  EXPECT_THAT(exception.Dump(), HasSubstr("Tarnik::InvalidArgumentException: bad ("));
  EXPECT_THAT(exception.Dump(), HasSubstr("throwable_test.cpp:"));
}

TEST(ThrowableTest, CopiesShareTheMessage) {
  const Exception original("text");
  const Exception copy(original);  // NOLINT(performance-unnecessary-copy-initialization)
  EXPECT_EQ(original.what(), copy.what());
}

template <class Class>
class ExceptionClassTest : public testing::Test {};

using ExceptionClasses =
    testing::Types<Exception, InvalidArgumentException, InvalidStateException,
                   TypeMismatchException, DateTimeFormatException, Base64FormatException,
                   IOException, TimeoutException, CancelledException>;
TYPED_TEST_SUITE(ExceptionClassTest, ExceptionClasses);

TYPED_TEST(ExceptionClassTest, CloneAndThrowKeepTheExactClass) {
  const TypeParam original("message");
  const Throwable& base = original;
  const auto clone = base.Clone();
  EXPECT_EQ(typeid(*clone), typeid(TypeParam));
  EXPECT_EQ(clone->Message(), "message");
  EXPECT_EQ(clone->Where().line(), original.Where().line());
  try {
    clone->Throw();
  } catch (const Throwable& thrown) {
    EXPECT_EQ(typeid(thrown), typeid(TypeParam));
    EXPECT_STREQ(thrown.what(), "message");
  }
}

TEST(ExceptionTest, TimeoutAndCancellationAreIOExceptions) {
  EXPECT_THROW(throw TimeoutException("t"), IOException);
  EXPECT_THROW(throw CancelledException("c"), IOException);
}

}  // namespace
}  // namespace Tarnik::Testing
