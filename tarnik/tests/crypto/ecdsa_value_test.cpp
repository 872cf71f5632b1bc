#include "crypto/ecdsa_value.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <tarnik/crypto/crypto_exception.h>

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::Crypto;
using testing::ElementsAre;
using testing::IsEmpty;

TEST(EcdsaValueTest, IsWrittenAsTwoIntegersOfMinimalLength) {
  EXPECT_THAT(DerFromRawEcdsa({0, 1, 0x80, 0}, 2),
              ElementsAre(0x30, 8, 0x02, 1, 1, 0x02, 3, 0, 0x80, 0));
}

TEST(EcdsaValueTest, HasTwoEqualHalvesThatAreNotLongerThanTheOrder) {
  EXPECT_THAT(DerFromRawEcdsa({1, 1, 1, 1}, 2), testing::SizeIs(10));
  EXPECT_THAT(DerFromRawEcdsa({1, 1, 1}, 2), IsEmpty());
  EXPECT_THAT(DerFromRawEcdsa({1, 1, 1, 1, 1}, 2), IsEmpty());
  EXPECT_THAT(DerFromRawEcdsa({0, 0, 1, 0, 0, 1}, 2), IsEmpty());
  EXPECT_THAT(DerFromRawEcdsa({1}, 2), IsEmpty());
  EXPECT_THAT(DerFromRawEcdsa({}, 2), IsEmpty());
}

TEST(EcdsaValueTest, MayOmitLeadingZerosOfBothHalves) {
  const auto whole = DerFromRawEcdsa({0, 0, 1, 2, 0, 0, 0, 3}, 4);
  EXPECT_THAT(whole, ElementsAre(0x30, 7, 0x02, 2, 1, 2, 0x02, 1, 3));
  EXPECT_EQ(DerFromRawEcdsa({0, 1, 2, 0, 0, 3}, 4), whole);
  EXPECT_EQ(DerFromRawEcdsa({1, 2, 0, 3}, 4), whole);
}

TEST(EcdsaValueTest, MustNotContainZero) {
  EXPECT_THAT(DerFromRawEcdsa({0, 0, 0, 1}, 2), IsEmpty());
  EXPECT_THAT(DerFromRawEcdsa({0, 1, 0, 0}, 2), IsEmpty());
  EXPECT_THAT(DerFromRawEcdsa({0, 1}, 2), IsEmpty());
  EXPECT_THAT(DerFromRawEcdsa({1, 0}, 2), IsEmpty());
}

TEST(EcdsaValueTest, IsReadAsTwoNumbersOfTheLengthOfTheOrder) {
  EXPECT_THAT(RawEcdsaFromDer({0x30, 8, 0x02, 1, 1, 0x02, 3, 0, 0x80, 0}, 2),
              ElementsAre(0, 1, 0x80, 0));
  EXPECT_THAT(RawEcdsaFromDer({0x30, 6, 0x02, 1, 1, 0x02, 1, 2}, 3), ElementsAre(0, 0, 1, 0, 0, 2));
}

TEST(EcdsaValueTest, IsRefusedWhenANumberIsTooLongOrTheEncodingIsBroken) {
  EXPECT_THROW(RawEcdsaFromDer({0x30, 8, 0x02, 1, 1, 0x02, 3, 0, 0x80, 0}, 1), CryptoException);
  EXPECT_THROW(RawEcdsaFromDer({0x30, 6, 0x02, 1, 1, 0x02, 1}, 2), CryptoException);
  EXPECT_THROW(RawEcdsaFromDer({0x30, 6, 0x02, 1, 1, 0x02, 1, 2, 0}, 2), CryptoException);
  EXPECT_THROW(RawEcdsaFromDer({}, 2), CryptoException);
}

}  // namespace
}  // namespace Tarnik::Testing
