#include "crypto/certificate_cache.h"

#include <string>
#include <string_view>

#include <gtest/gtest.h>

#include "support/test_certificates.h"

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::Crypto;

Ref<const Certificate> Make(const char* name) {
  return MakeCertificate({.commonName = name});
}

std::string_view BytesOf(const Ref<const Certificate>& certificate) {
  return {reinterpret_cast<const char*>(certificate->DerBytes()), certificate->DerLength()};
}

TEST(CertificateCacheTest, FindsByEqualBytes) {
  CertificateCache cache(2);
  const auto one = Make("one");
  EXPECT_EQ(cache.Find(BytesOf(one)), nullptr);
  cache.Add(one);
  EXPECT_EQ(cache.Find(std::string(BytesOf(one))), one);
}

TEST(CertificateCacheTest, DropsTheLeastRecentlyUsedCertificate) {
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

TEST(CertificateCacheTest, KeepsOneOfEqualCertificates) {
  CertificateCache cache(2);
  const auto one = Make("one");
  cache.Add(one);
  cache.Add(one);
  EXPECT_EQ(cache.Size(), 1U);
}

TEST(CertificateCacheTest, KeepsNoCertificateThatIsUnusuallyLarge) {
  CertificateCache cache(2);
  cache.Add(MakeCertificate({.comment = std::string(14'000, 'c')}));
  EXPECT_EQ(cache.Size(), 1U);
  cache.Add(MakeCertificate({.comment = std::string(17'000, 'c')}));
  EXPECT_EQ(cache.Size(), 1U);
}

TEST(CertificateCacheTest, ProcessCacheIsBounded) {
  for (int i = 0; i < 300; ++i) {
    Make(std::to_string(i).c_str());
  }
  EXPECT_EQ(ProcessCertificateCache().Size(), 256U);
}

}  // namespace
}  // namespace Tarnik::Testing
