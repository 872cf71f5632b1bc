#include <cstddef>
#include <memory>
#include <new>
#include <string>
#include <typeinfo>
#include <utility>

#include <cxxabi.h>
#include <gtest/gtest.h>

#include <ssoclient/exceptions.h>
#include <tarnik/core/exception.h>

#include "support/vtable_slot.h"

namespace SsoClient::Testing {
namespace {

template <class Class>
class ExceptionClassTest : public testing::Test {};

using AllClasses = testing::Types<SsoException, CommunicationException, InvalidCredentialsException,
                                  PasswordExpiredException, InvalidTokenException, ParseException,
                                  InvalidSignatureException>;
TYPED_TEST_SUITE(ExceptionClassTest, AllClasses);

TYPED_TEST(ExceptionClassTest, HoldsItsMessage) {
  const TypeParam fault("what went wrong");
  EXPECT_EQ(fault.Message(), "what went wrong");
  EXPECT_STREQ(fault.what(), "what went wrong");
}

TYPED_TEST(ExceptionClassTest, ClonesAndThrowsItsExactClass) {
  const TypeParam original("message");
  const Tarnik::Exception& base = original;
  const std::unique_ptr<Tarnik::Throwable> clone = base.Clone();
  ASSERT_EQ(typeid(*clone), typeid(TypeParam));
  EXPECT_EQ(clone->Message(), "message");
  EXPECT_EQ(clone->Where().line(), original.Where().line());
  try {
    clone->Throw();
    FAIL() << "nothing was thrown";
  } catch (const SsoException& thrown) {
    EXPECT_EQ(typeid(thrown), typeid(TypeParam));
    EXPECT_EQ(thrown.Message(), "message");
    EXPECT_EQ(thrown.Where().line(), original.Where().line());
  }
}

TYPED_TEST(ExceptionClassTest, KeepsItsSlotOrder) {
  const TypeParam fault("message");
  const void* object = &fault;
  EXPECT_STREQ(VtableSlot<const char*(const void*)>(object, 2)(object), "message");
  EXPECT_EQ(&VtableSlot<const std::string&(const void*)>(object, 3)(object), &fault.Message());
  EXPECT_EQ(VtableSlot<std::string(const void*)>(object, 4)(object), fault.Dump());
  EXPECT_EQ(VtableSlot<boost::source_location(const void*)>(object, 5)(object).line(),
            fault.Where().line());
  const auto clone = VtableSlot<std::unique_ptr<Tarnik::Throwable>(const void*)>(object, 6)(object);
  EXPECT_EQ(typeid(*clone), typeid(TypeParam));
  EXPECT_THROW(VtableSlot<void(const void*)>(object, 7)(object), TypeParam);
}

TYPED_TEST(ExceptionClassTest, BeginsItsSlotsWithTheDestructors) {
  static int destroyed;
  struct Probe : TypeParam {
    using TypeParam::TypeParam;
    Probe(const Probe&) = default;
    ~Probe() override { ++destroyed; }
  };
  destroyed = 0;
  alignas(Probe) std::byte storage[sizeof(Probe)];
  void* inPlace = new (storage) Probe("message");
  VtableSlot<void(void*)>(inPlace, 0)(inPlace);
  EXPECT_EQ(destroyed, 1);
  void* onHeap = new Probe("message");
  VtableSlot<void(void*)>(onHeap, 1)(onHeap);
  EXPECT_EQ(destroyed, 2);
}

TEST(ExceptionsTest, RethrowPasswordExpiredThroughThePlatformsBase) {
  const PasswordExpiredException original("expired");
  const Tarnik::Exception* captured = &original;
  EXPECT_THROW(captured->Clone()->Throw(), PasswordExpiredException);
}

template <class Thrown, class Caught>
bool IsCaughtAs() {
  try {
    throw Thrown("message");
  } catch (const Caught&) {
    return true;
  } catch (...) {
    return false;
  }
}

// The only direct base of a class (Itanium C++ ABI, section 2.9.5).
const std::type_info& BaseOf(const std::type_info& derived) {
  return *dynamic_cast<const abi::__si_class_type_info&>(derived).__base_type;
}

TEST(ExceptionsTest, DeriveFromTheirBases) {
  const std::pair<const std::type_info&, const std::type_info&> cases[] = {
      {typeid(Tarnik::Exception), typeid(Tarnik::Throwable)},
      {typeid(SsoException), typeid(Tarnik::Exception)},
      {typeid(CommunicationException), typeid(SsoException)},
      {typeid(InvalidCredentialsException), typeid(SsoException)},
      {typeid(PasswordExpiredException), typeid(SsoException)},
      {typeid(InvalidTokenException), typeid(SsoException)},
      {typeid(ParseException), typeid(InvalidTokenException)},
      {typeid(InvalidSignatureException), typeid(InvalidTokenException)}};
  for (const auto& [derived, base] : cases) {
    EXPECT_EQ(BaseOf(derived), base) << derived.name();
  }
}

TYPED_TEST(ExceptionClassTest, AddsNoDataOfItsOwn) {
  EXPECT_EQ(sizeof(TypeParam), sizeof(Tarnik::Exception));
}

TYPED_TEST(ExceptionClassTest, CopiesItsMessageAndPlace) {
  const TypeParam original("message");
  const TypeParam copy(original);  // NOLINT(performance-unnecessary-copy-initialization)
  EXPECT_EQ(copy.Message(), "message");
  EXPECT_EQ(copy.Where().line(), original.Where().line());
}

TEST(ExceptionsTest, CatchBothTokenFailuresAsInvalidToken) {
  EXPECT_TRUE((IsCaughtAs<ParseException, InvalidTokenException>()));
  EXPECT_TRUE((IsCaughtAs<InvalidSignatureException, InvalidTokenException>()));
  EXPECT_FALSE((IsCaughtAs<CommunicationException, InvalidTokenException>()));
  EXPECT_FALSE((IsCaughtAs<InvalidTokenException, ParseException>()));
}

TYPED_TEST(ExceptionClassTest, IsCaughtAsTheLibrarysAndThePlatformsBase) {
  EXPECT_TRUE((IsCaughtAs<TypeParam, SsoException>()));
  EXPECT_TRUE((IsCaughtAs<TypeParam, Tarnik::Exception>()));
}

}  // namespace
}  // namespace SsoClient::Testing
