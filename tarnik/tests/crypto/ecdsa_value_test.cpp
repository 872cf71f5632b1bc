#include "crypto/ecdsa_value.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace Tarnik::Crypto {
namespace {

using ::testing::ElementsAre;
using ::testing::IsEmpty;

TEST(EcdsaValue, IsWrittenAsTwoShortestIntegers) {
  EXPECT_THAT(DerFromRawEcdsa({0, 1, 0x80, 0}, 2),
              ElementsAre(0x30, 8, 0x02, 1, 1, 0x02, 3, 0, 0x80, 0));
}

TEST(EcdsaValue, MustBeExactlyTwoOrdersLong) {
  EXPECT_THAT(DerFromRawEcdsa({1, 1, 1, 1}, 2), ::testing::SizeIs(10));
  EXPECT_THAT(DerFromRawEcdsa({1, 1, 1}, 2), IsEmpty());
  EXPECT_THAT(DerFromRawEcdsa({1, 1, 1, 1, 1}, 2), IsEmpty());
  EXPECT_THAT(DerFromRawEcdsa({}, 2), IsEmpty());
}

TEST(EcdsaValue, MayNotHoldAZero) {
  EXPECT_THAT(DerFromRawEcdsa({0, 0, 0, 1}, 2), IsEmpty());
  EXPECT_THAT(DerFromRawEcdsa({0, 1, 0, 0}, 2), IsEmpty());
}

}  // namespace
}  // namespace Tarnik::Crypto
