#include "crypto/certificate_cache.h"

#include <gtest/gtest.h>

#include "support/test_certificates.h"

namespace Tarnik::Crypto {
namespace {

Ref<const Certificate> Make(const char* name) {
  return Tests::MakeCertificate({.commonName = name});
}

std::string_view BytesOf(const Ref<const Certificate>& certificate) {
  return {reinterpret_cast<const char*>(certificate->DerBytes()), certificate->DerLength()};
}

TEST(CertificateCache, FindsByEqualBytes) {
  CertificateCache cache(2);
  const auto one = Make("one");
  EXPECT_EQ(cache.Find(BytesOf(one)), nullptr);
  cache.Add(one);
  EXPECT_EQ(cache.Find(std::string(BytesOf(one))), one);
}

TEST(CertificateCache, DropsTheOneNotUsedForTheLongestTime) {
  CertificateCache cache(2);
  const auto one = Make("one");
  const auto two = Make("two");
  const auto three = Make("three");
  cache.Add(one);
  cache.Add(two);
  cache.Find(BytesOf(one));
  cache.Add(three);
  EXPECT_EQ(cache.Size(), 2U);
  EXPECT_EQ(cache.Find(BytesOf(one)), one);
  EXPECT_EQ(cache.Find(BytesOf(two)), nullptr);
  EXPECT_EQ(cache.Find(BytesOf(three)), three);
}

TEST(CertificateCache, KeepsOneOfEqualCertificates) {
  CertificateCache cache(2);
  const auto one = Make("one");
  cache.Add(one);
  cache.Add(one);
  EXPECT_EQ(cache.Size(), 1U);
}

TEST(CertificateCache, OfTheProcessIsBounded) {
  for (int i = 0; i < 300; ++i) {
    Make(std::to_string(i).c_str());
  }
  EXPECT_EQ(ProcessCertificateCache().Size(), 256U);
}

}  // namespace
}  // namespace Tarnik::Crypto
