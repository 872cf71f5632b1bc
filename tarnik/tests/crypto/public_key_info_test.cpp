#include "crypto/public_key_info.h"

#include <string>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <openssl/core_names.h>

#include "crypto/certificate_impl.h"
#include "support/openssl.h"
#include "support/test_certificates.h"

namespace Tarnik::Testing {
namespace {

using Crypto::EcPublicKeyInfo;
using Crypto::IsUsualPublicKeyInfo;
using Crypto::PublicKeyImpl;
using Crypto::RsaPublicKeyInfo;
using Crypto::UsualPublicKeyInfo;
using testing::IsEmpty;

const std::vector<unsigned char>& EncodedIn(const Crypto::Certificate& certificate) {
  return dynamic_cast<const Crypto::CertificateImpl&>(certificate).SubjectPublicKeyInfo();
}

bool IsUsual(const Crypto::Certificate& certificate) {
  return IsUsualPublicKeyInfo(dynamic_cast<const PublicKeyImpl&>(*certificate.GetPublicKey()),
                              EncodedIn(certificate).size());
}

const PublicKeyImpl& KeyIn(const Crypto::Certificate& certificate) {
  return dynamic_cast<const PublicKeyImpl&>(*certificate.GetPublicKey());
}

std::string NumberOf(EVP_PKEY* key, const char* name) {
  BIGNUM* raw = nullptr;
  Require(EVP_PKEY_get_bn_param(key, name, &raw) == 1, "number");
  const OpenSsl::OwnedBigNumber number(raw);
  std::string bytes(static_cast<std::size_t>(BN_num_bytes(raw)), '\0');
  BN_bn2bin(raw, reinterpret_cast<unsigned char*>(bytes.data()));
  return bytes;
}

std::string PointOf(EVP_PKEY* key, const char* format) {
  Require(
      EVP_PKEY_set_utf8_string_param(key, OSSL_PKEY_PARAM_EC_POINT_CONVERSION_FORMAT, format) == 1,
      "point format");
  std::vector<unsigned char> point(200);
  std::size_t length = 0;
  Require(EVP_PKEY_get_octet_string_param(key, OSSL_PKEY_PARAM_PUB_KEY, point.data(), point.size(),
                                          &length) == 1,
          "point");
  return {point.begin(), point.begin() + static_cast<std::ptrdiff_t>(length)};
}

TEST(PublicKeyInfoTest, OfAnRsaKeyIsThatOfItsCertificate) {
  EVP_PKEY* const key = SharedRsaKey();
  const auto certificate = MakeCertificate();
  const std::string modulus = NumberOf(key, OSSL_PKEY_PARAM_RSA_N);
  const std::string exponent = NumberOf(key, OSSL_PKEY_PARAM_RSA_E);
  const auto& expected = EncodedIn(*certificate);
  EXPECT_EQ(RsaPublicKeyInfo(modulus, exponent), expected);
  EXPECT_EQ(RsaPublicKeyInfo(std::string(3, '\0') + modulus, '\0' + exponent), expected);
  EXPECT_NE(RsaPublicKeyInfo(modulus + '\0', exponent), expected);
  EXPECT_NE(RsaPublicKeyInfo(modulus, exponent + exponent), expected);
  EXPECT_EQ(UsualPublicKeyInfo(KeyIn(*certificate)), expected);
  EXPECT_TRUE(IsUsual(*certificate));
}

TEST(PublicKeyInfoTest, NeedsNumbersThatAreNot0) {
  EXPECT_THAT(RsaPublicKeyInfo("", "\x03"), IsEmpty());
  EXPECT_THAT(RsaPublicKeyInfo(std::string(8, '\0'), "\x03"), IsEmpty());
  EXPECT_THAT(RsaPublicKeyInfo("\x03", ""), IsEmpty());
  EXPECT_THAT(RsaPublicKeyInfo("\x03", std::string(1, '\0')), IsEmpty());
}

struct CurveCase {
  const char* name;
  const char* identifier;
};

class EcPublicKeyInfoTest : public testing::TestWithParam<CurveCase> {};

TEST_P(EcPublicKeyInfoTest, IsThatOfTheCertificate) {
  const auto key = MakeEcKey(GetParam().name);
  const std::string point = PointOf(key.get(), "uncompressed");
  const auto certificate = MakeCertificate({.key = key.get()});
  EXPECT_EQ(EcPublicKeyInfo(GetParam().identifier, point), EncodedIn(*certificate));
  EXPECT_EQ(UsualPublicKeyInfo(KeyIn(*certificate)), EncodedIn(*certificate));
  EXPECT_TRUE(IsUsual(*certificate));
}

TEST_P(EcPublicKeyInfoTest, HasAnUncompressedPoint) {
  const auto key = MakeEcKey(GetParam().name);
  const auto expected = EcPublicKeyInfo(GetParam().identifier, PointOf(key.get(), "uncompressed"));
  const std::string compressed = PointOf(key.get(), "compressed");
  EXPECT_THAT(EcPublicKeyInfo(GetParam().identifier, compressed), IsEmpty());
  const auto certificate = MakeCertificate({.key = key.get()});
  EXPECT_NE(EncodedIn(*certificate), expected);
  EXPECT_EQ(UsualPublicKeyInfo(KeyIn(*certificate)), expected);
  EXPECT_FALSE(IsUsual(*certificate));
}

TEST_P(EcPublicKeyInfoTest, IsUsualWithoutTheParametersOfTheCurve) {
  const auto key = MakeEcKey(GetParam().name);
  const auto expected = EcPublicKeyInfo(GetParam().identifier, PointOf(key.get(), "uncompressed"));
  Require(EVP_PKEY_set_utf8_string_param(key.get(), OSSL_PKEY_PARAM_EC_ENCODING, "explicit") == 1,
          "encoding");
  const auto certificate = MakeCertificate({.key = key.get()});
  EXPECT_NE(EncodedIn(*certificate), expected);
  EXPECT_FALSE(IsUsual(*certificate));
}

INSTANTIATE_TEST_SUITE_P(Curves, EcPublicKeyInfoTest,
                         testing::Values(CurveCase{"P-256", "1.2.840.10045.3.1.7"},
                                         CurveCase{"P-384", "1.3.132.0.34"},
                                         CurveCase{"P-521", "1.3.132.0.35"}),
                         [](const auto& tested) {
                           return std::string(tested.param.name).erase(1, 1);
                         });

TEST(PublicKeyInfoTest, NeedsACurveAndAPoint) {
  EXPECT_THAT(EcPublicKeyInfo("P-256", "\x04xy"), IsEmpty());
  EXPECT_THAT(EcPublicKeyInfo("", "\x04xy"), IsEmpty());
  EXPECT_THAT(EcPublicKeyInfo("1.2.840.10045.3.1.7", ""), IsEmpty());
  EXPECT_THAT(EcPublicKeyInfo("1.2.840.10045.3.1.7", "\x04xy"), testing::SizeIs(29));
}

TEST(PublicKeyInfoTest, OfAnRsaPssKeyHasTheUsualAlgorithm) {
  const OpenSsl::OwnedKeyContext context(EVP_PKEY_CTX_new_from_name(nullptr, "RSA-PSS", nullptr));
  Require(EVP_PKEY_keygen_init(context.get()) == 1, "key");
  EVP_PKEY* made = nullptr;
  Require(EVP_PKEY_generate(context.get(), &made) == 1, "key");
  const OpenSsl::OwnedKey key(made);
  const auto certificate = MakeCertificate({.key = made});
  const auto usual = RsaPublicKeyInfo(NumberOf(made, OSSL_PKEY_PARAM_RSA_N),
                                      NumberOf(made, OSSL_PKEY_PARAM_RSA_E));
  EXPECT_EQ(UsualPublicKeyInfo(KeyIn(*certificate)), usual);
  EXPECT_NE(EncodedIn(*certificate), usual);
  EXPECT_FALSE(IsUsual(*certificate));
}

TEST(PublicKeyInfoTest, IsEmptyForOtherKeys) {
  for (const auto& key : {MakeKey("ED25519"), MakeEcKey("secp256k1")}) {
    EXPECT_THAT(UsualPublicKeyInfo(KeyIn(*MakeCertificate({.key = key.get()}))), IsEmpty());
  }
}

}  // namespace
}  // namespace Tarnik::Testing
