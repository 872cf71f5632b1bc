#include <array>
#include <atomic>
#include <cstddef>
#include <string>
#include <string_view>
#include <thread>
#include <vector>

#include <gtest/gtest.h>
#include <openssl/err.h>
#include <openssl/evp.h>

#include <tarnik/crypto/digest.h>

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::Crypto;

std::string HexOf(const Sha256Digest& digest) {
  constexpr const char* kDigits = "0123456789abcdef";
  std::string text;
  for (const unsigned char byte : digest) {
    text += kDigits[byte >> 4];
    text += kDigits[byte & 0xF];
  }
  return text;
}

// By a one-shot function, which shares no context with the library.
Sha256Digest Expected(std::string_view bytes) {
  Sha256Digest digest{};
  EVP_Digest(bytes.data(), bytes.size(), digest.data(), nullptr, EVP_sha256(), nullptr);
  return digest;
}

// The examples of NIST's Cryptographic Standards and Guidelines for SHA-256.
TEST(DigestTest, IsTheOneOfTheStandardsExamples) {
  EXPECT_EQ(HexOf(Sha256("")), "e3b0c44298fc1c149afbf4c8996fb92427ae41e4649b934ca495991b7852b855");
  EXPECT_EQ(HexOf(Sha256("abc")),
            "ba7816bf8f01cfea414140de5dae2223b00361a396177a9cb410ff61f20015ad");
  EXPECT_EQ(HexOf(Sha256("abcdbcdecdefdefgefghfghighijhijkijkljklmklmnlmnomnopnopq")),
            "248d6a61d20638b8e5c026930c3e6039a33ce45964ff2167f6ecedd419db06c1");
  EXPECT_EQ(HexOf(Sha256(std::string(1'000'000, 'a'))),
            "cdc76e5c9914fb9281a1c7e284d73e67f1809a48a497200e046d39ccc7112cd0");
}

TEST(DigestTest, DoesNotDependOnWhatTheThreadDigestedBefore) {
  std::string bytes;
  for (int length = 0; length < 300; ++length) {
    ASSERT_EQ(Sha256(bytes), Expected(bytes)) << length;
    bytes += static_cast<char>(length * 37);
  }
}

TEST(DigestTest, CoversBytesAfterANul) {
  EXPECT_NE(Sha256(std::string_view("a\0b", 3)), Sha256(std::string_view("a\0c", 3)));
}

TEST(DigestTest, AcceptsTheEmptyViewOfNothing) {
  EXPECT_EQ(Sha256({}), Sha256(""));
}

TEST(DigestTest, LeavesTheErrorQueueUnchanged) {
  ERR_clear_error();
  ERR_raise(ERR_LIB_USER, 77);
  const unsigned long before = ERR_peek_error();
  Sha256("abc");
  EXPECT_EQ(ERR_peek_last_error(), before);
  ERR_clear_error();
}

// More threads than there are idle contexts.
TEST(DigestTest, MayBeComputedByManyThreadsAtOnce) {
  std::atomic<int> wrong{0};
  std::vector<std::thread> threads;
  for (int t = 0; t < 24; ++t) {
    threads.emplace_back([&wrong, t] {
      const std::string bytes(static_cast<std::size_t>(100 * t), static_cast<char>('a' + t));
      const Sha256Digest expected = Expected(bytes);
      for (int i = 0; i < 100; ++i) {
        wrong += Sha256(bytes) == expected ? 0 : 1;
      }
    });
  }
  for (std::thread& thread : threads) {
    thread.join();
  }
  EXPECT_EQ(wrong, 0);
}

TEST(ConstantTimeTest, EqualBytesAreEqual) {
  const std::string a = "fingerprint";
  const std::string b = a;
  EXPECT_TRUE(IsEqualInConstantTime(a.data(), b.data(), a.size()));
  EXPECT_TRUE(IsEqualInConstantTime(nullptr, nullptr, 0));
  EXPECT_TRUE(IsEqualInConstantTime("a", "b", 0));
}

TEST(ConstantTimeTest, EachFlippedBitMakesADifference) {
  const Sha256Digest a = Sha256("a");
  for (std::size_t bit = 0; bit < 8 * a.size(); ++bit) {
    Sha256Digest b = a;
    b[bit / 8] ^= static_cast<unsigned char>(1U << (bit % 8));
    ASSERT_FALSE(IsEqualInConstantTime(a.data(), b.data(), a.size())) << bit;
  }
}

}  // namespace
}  // namespace Tarnik::Testing
