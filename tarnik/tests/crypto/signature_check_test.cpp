#include "crypto/signature_check.h"

#include <cstddef>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "support/openssl.h"
#include "support/test_certificates.h"

namespace Tarnik::Testing {
namespace {

using Bytes = std::vector<unsigned char>;

Bytes Number(const Bytes& content) {
  Bytes value{0x02, static_cast<unsigned char>(content.size())};
  value.insert(value.end(), content.begin(), content.end());
  return value;
}

Bytes Sequence(const Bytes& r, const Bytes& s) {
  Bytes value{0x30};
  const std::size_t length = r.size() + s.size();
  if (length > 127) {
    value.push_back(0x81);
  }
  value.push_back(static_cast<unsigned char>(length));
  value.insert(value.end(), r.begin(), r.end());
  value.insert(value.end(), s.begin(), s.end());
  return value;
}

bool IsAccepted(const Bytes& r, const Bytes& s, std::size_t orderLength = 32) {
  const bool isAccepted = Crypto::IsEcdsaDer(Sequence(Number(r), Number(s)), orderLength);
  EXPECT_EQ(Crypto::IsEcdsaDer(Sequence(Number(s), Number(r)), orderLength), isAccepted);
  return isAccepted;
}

TEST(EcdsaDerTest, HasTwoPositiveNumbersInTheirShortestForm) {
  const Bytes one{1};
  EXPECT_TRUE(IsAccepted(one, one));
  EXPECT_TRUE(IsAccepted({0, 0x80}, one));
  EXPECT_TRUE(IsAccepted({0x7F}, one));
  EXPECT_FALSE(IsAccepted({}, one));
  EXPECT_FALSE(IsAccepted({0}, one));
  EXPECT_FALSE(IsAccepted({0, 0}, one));
  EXPECT_FALSE(IsAccepted({0, 1}, one));
  EXPECT_FALSE(IsAccepted({0, 0x7F}, one));
  EXPECT_FALSE(IsAccepted({0, 0, 0x80}, one));
  EXPECT_FALSE(IsAccepted({0x80}, one));
  EXPECT_FALSE(IsAccepted({0xFF}, one));
}

TEST(EcdsaDerTest, HasNumbersNoLongerThanTheOrder) {
  const Bytes one{1};
  for (const std::size_t order : {std::size_t{32}, std::size_t{48}, std::size_t{66}}) {
    EXPECT_TRUE(IsAccepted(Bytes(order, 0x7F), one, order));
    EXPECT_FALSE(IsAccepted(Bytes(order + 1, 0x7F), one, order));
    Bytes high(order + 1, 0xFF);
    high[0] = 0;
    EXPECT_TRUE(IsAccepted(high, high, order));
    high.insert(high.begin() + 1, 0xFF);
    EXPECT_FALSE(IsAccepted(high, one, order));
  }
}

TEST(EcdsaDerTest, HasLengthsInTheirShortestForm) {
  const Bytes longForm{0x30, 0x81, 6, 2, 1, 1, 2, 1, 1};
  const Bytes longNumber{0x30, 7, 2, 0x81, 1, 1, 2, 1, 1};
  const Bytes indefinite{0x30, 0x80, 2, 1, 1, 2, 1, 1, 0, 0};
  const Bytes twoBytes{0x30, 0x82, 0, 6, 2, 1, 1, 2, 1, 1};
  EXPECT_TRUE(Crypto::IsEcdsaDer({0x30, 6, 2, 1, 1, 2, 1, 1}, 32));
  for (const Bytes& other : {longForm, longNumber, indefinite, twoBytes}) {
    EXPECT_FALSE(Crypto::IsEcdsaDer(other, 32));
  }
}

TEST(EcdsaDerTest, HasNothingElse) {
  const Bytes good{0x30, 6, 2, 1, 1, 2, 1, 1};
  for (std::size_t i = 0; i < good.size(); ++i) {
    EXPECT_FALSE(Crypto::IsEcdsaDer({good.begin(), good.begin() + static_cast<long>(i)}, 32)) << i;
  }
  EXPECT_FALSE(Crypto::IsEcdsaDer({0x30, 6, 2, 1, 1, 2, 1, 1, 0}, 32));
  EXPECT_FALSE(Crypto::IsEcdsaDer({0x30, 7, 2, 1, 1, 2, 1, 1, 0}, 32));
  EXPECT_FALSE(Crypto::IsEcdsaDer({0x30, 9, 2, 1, 1, 2, 1, 1, 2, 1, 1}, 32));
  EXPECT_FALSE(Crypto::IsEcdsaDer({0x30, 3, 2, 1, 1}, 32));
  EXPECT_FALSE(Crypto::IsEcdsaDer({0x31, 6, 2, 1, 1, 2, 1, 1}, 32));
  EXPECT_FALSE(Crypto::IsEcdsaDer({0x30, 6, 4, 1, 1, 2, 1, 1}, 32));
  EXPECT_FALSE(Crypto::IsEcdsaDer({0x30, 0}, 32));
}

// The order of P-256 (SEC 2, section 2.4.2), one less, which is in range, and one more.
TEST(EcdsaDerTest, OfNumbersOutOfRangeIsNoSignature) {
  Bytes order{0,    0xFF, 0xFF, 0xFF, 0xFF, 0,    0,    0,    0,    0xFF, 0xFF,
              0xFF, 0xFF, 0xFF, 0xFF, 0xFF, 0xFF, 0xBC, 0xE6, 0xFA, 0xAD, 0xA7,
              0x17, 0x9E, 0x84, 0xF3, 0xB9, 0xCA, 0xC2, 0xFC, 0x63, 0x25, 0x50};
  const Crypto::PublicKeyImpl key(MakeEcKey("P-256"));
  const Bytes digest(32, 7);
  for (int i = 0; i < 3; ++i, ++order.back()) {
    for (const Bytes& signature :
         {Sequence(Number(order), Number({1})), Sequence(Number({1}), Number(order))}) {
      ASSERT_TRUE(Crypto::IsEcdsaDer(signature, 32));
      EXPECT_FALSE(Crypto::IsSignatureOf(key, Crypto::SignatureScheme::kEcdsa,
                                         Crypto::Hash::kSha256, digest.data(), signature));
    }
  }
}

}  // namespace
}  // namespace Tarnik::Testing
