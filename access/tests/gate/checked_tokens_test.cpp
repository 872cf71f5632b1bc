#include "gate/checked_tokens.h"

#include <algorithm>
#include <cstdint>
#include <memory>
#include <thread>
#include <vector>

#include <gtest/gtest.h>

namespace SsoClient::Access::Testing {
namespace {

constexpr std::uint64_t kVersion = 7;

// As unlike as digests are.
CheckedTokens::Key KeyOf(std::uint64_t number) {
  CheckedTokens::Key key{};
  for (unsigned char& byte : key) {
    number = number * 6364136223846793005U + 1442695040888963407U;
    byte = static_cast<unsigned char>(number >> 56U);
  }
  return key;
}

CheckedTokens::Token NewToken() {
  return std::make_shared<const CheckedToken>();
}

GateMetrics MetricsOf(const CheckedTokens& tokens) {
  GateMetrics metrics;
  tokens.AddTo(metrics);
  return metrics;
}

TEST(CheckedTokensTest, MemoryIsCountedByLengthAndMarks) {
  EXPECT_EQ(MemoryOf(""), 1024U);
  EXPECT_EQ(MemoryOf("text"), 1036U);
  EXPECT_EQ(MemoryOf("<a></a>"), 1024U + 3 * 7 + 2 * 72);
  EXPECT_EQ(MemoryOf("<!---->"), 1024U + 3 * 7 + 72);
  EXPECT_EQ(MemoryOf("<a/>b"), 1024U + 3 * 5 + 72 + 56);
  EXPECT_EQ(MemoryOf("<a b=''/>"), 1024U + 3 * 9 + 72 + 32);
  EXPECT_EQ(MemoryOf(">"), 1024U + 3);
}

TEST(CheckedTokensTest, FindsWhatWasInserted) {
  CheckedTokens tokens({100, 1'000'000});
  const auto token = NewToken();
  EXPECT_EQ(tokens.Find(KeyOf(1), kVersion), nullptr);
  tokens.Insert(KeyOf(1), kVersion, token, 10);
  EXPECT_EQ(tokens.Find(KeyOf(1), kVersion), token);
  EXPECT_EQ(tokens.Find(KeyOf(2), kVersion), nullptr);
  EXPECT_EQ(MetricsOf(tokens).cachedTokens, 1U);
  EXPECT_EQ(MetricsOf(tokens).cachedBytes, 10U);
}

TEST(CheckedTokensTest, WholeKeyCounts) {
  CheckedTokens tokens({100, 1'000'000});
  tokens.Insert(KeyOf(1), kVersion, NewToken(), 10);
  for (std::size_t i = 0; i < KeyOf(1).size(); ++i) {
    auto key = KeyOf(1);
    key[i] ^= 1U;
    EXPECT_EQ(tokens.Find(key, kVersion), nullptr) << i;
  }
}

TEST(CheckedTokensTest, NothingIsKeptWithoutCapacity) {
  EXPECT_FALSE(CheckedTokens({0, 1000}).IsUsed());
  EXPECT_FALSE(CheckedTokens({1000, 0}).IsUsed());
  EXPECT_TRUE(CheckedTokens({1, 1}).IsUsed());
  EXPECT_TRUE(CheckedTokens({SIZE_MAX, SIZE_MAX}).IsUsed());
}

TEST(CheckedTokensTest, InsertReplaces) {
  CheckedTokens tokens({1, 100});
  tokens.Insert(KeyOf(1), kVersion, NewToken(), 60);
  const auto second = NewToken();
  tokens.Insert(KeyOf(1), kVersion, second, 70);
  EXPECT_EQ(tokens.Find(KeyOf(1), kVersion), second);
  EXPECT_EQ(MetricsOf(tokens).cachedTokens, 1U);
  EXPECT_EQ(MetricsOf(tokens).cachedBytes, 70U);
  EXPECT_EQ(MetricsOf(tokens).evictions, 0U);
}

TEST(CheckedTokensTest, OtherVersionsAreRemoved) {
  CheckedTokens tokens({100, 1'000'000});
  auto token = NewToken();
  const std::weak_ptr<const CheckedToken> weak = token;
  tokens.Insert(KeyOf(1), kVersion, std::move(token), 10);
  EXPECT_EQ(tokens.Find(KeyOf(1), kVersion - 1), nullptr);
  EXPECT_TRUE(weak.expired());
  EXPECT_EQ(tokens.Find(KeyOf(1), kVersion), nullptr);
  EXPECT_EQ(MetricsOf(tokens).cachedTokens, 0U);
  EXPECT_EQ(MetricsOf(tokens).cachedBytes, 0U);
  EXPECT_EQ(MetricsOf(tokens).evictions, 0U);
  tokens.Insert(KeyOf(2), kVersion, NewToken(), 10);
  tokens.Insert(KeyOf(3), kVersion + 1, NewToken(), 10);
  EXPECT_EQ(MetricsOf(tokens).cachedTokens, 1U);
}

TEST(CheckedTokensTest, RemovesOnlyTheTokenThatIsMeant) {
  CheckedTokens tokens({100, 1'000'000});
  const auto first = NewToken();
  const auto second = NewToken();
  tokens.Insert(KeyOf(1), kVersion, second, 10);
  tokens.Remove(KeyOf(1), *first);
  tokens.Remove(KeyOf(2), *second);
  EXPECT_EQ(tokens.Find(KeyOf(1), kVersion), second);
  tokens.Remove(KeyOf(1), *second);
  EXPECT_EQ(tokens.Find(KeyOf(1), kVersion), nullptr);
  EXPECT_EQ(MetricsOf(tokens).cachedBytes, 0U);
}

TEST(CheckedTokensTest, EvictsTheLeastRecentlyFound) {
  CheckedTokens tokens({3, 1'000'000});
  for (std::uint64_t i = 0; i < 3; ++i) {
    tokens.Insert(KeyOf(i), kVersion, NewToken(), 10);
  }
  tokens.Find(KeyOf(0), kVersion);
  tokens.Insert(KeyOf(3), kVersion, NewToken(), 10);
  EXPECT_NE(tokens.Find(KeyOf(0), kVersion), nullptr);
  EXPECT_EQ(tokens.Find(KeyOf(1), kVersion), nullptr);
  EXPECT_NE(tokens.Find(KeyOf(2), kVersion), nullptr);
  EXPECT_EQ(MetricsOf(tokens).evictions, 1U);
}

TEST(CheckedTokensTest, LargeTokenEvictsSeveral) {
  CheckedTokens tokens({100, 100});
  for (std::uint64_t i = 0; i < 10; ++i) {
    tokens.Insert(KeyOf(i), kVersion, NewToken(), 10);
  }
  EXPECT_EQ(MetricsOf(tokens).cachedTokens, 10U);
  tokens.Insert(KeyOf(10), kVersion, NewToken(), 55);
  EXPECT_EQ(MetricsOf(tokens).cachedTokens, 5U);
  EXPECT_EQ(MetricsOf(tokens).cachedBytes, 95U);
  EXPECT_EQ(MetricsOf(tokens).evictions, 6U);
}

TEST(CheckedTokensTest, TokenLargerThanTheCacheIsNotKept) {
  CheckedTokens tokens({100, 100});
  tokens.Insert(KeyOf(0), kVersion, NewToken(), 100);
  tokens.Insert(KeyOf(1), kVersion, NewToken(), 101);
  EXPECT_NE(tokens.Find(KeyOf(0), kVersion), nullptr);
  EXPECT_EQ(tokens.Find(KeyOf(1), kVersion), nullptr);
}

// Every capacity is used nearly whole: shards of a large cache are not filled quite evenly.
TEST(CheckedTokensTest, CapacityInEntries) {
  const auto token = NewToken();
  for (const std::size_t capacity : {1U, 2U, 63U, 64U, 65U, 127U, 128U, 1000U, 10007U}) {
    CheckedTokens tokens({capacity, std::size_t{1} << 40U});
    for (std::uint64_t i = 0; i < capacity * 3 + 100; ++i) {
      tokens.Insert(KeyOf(i), kVersion, token, 10);
    }
    EXPECT_EQ(MetricsOf(tokens).cachedTokens, capacity);
  }
}

TEST(CheckedTokensTest, AMillionTokens) {
  constexpr std::size_t kTokens = 10'000;
  constexpr std::size_t kBytes = std::size_t{64} * 1024 * 1024;
  CheckedTokens tokens({kTokens, kBytes});
  const auto token = NewToken();
  std::size_t mostTokens = 0;
  std::size_t mostBytes = 0;
  for (std::uint64_t i = 0; i < 1'000'000; ++i) {
    // From 1 to 16 KB.
    tokens.Insert(KeyOf(i), kVersion, token, 1024 + i % 15 * 1024);
    if (i % 1000 == 999) {
      const GateMetrics metrics = MetricsOf(tokens);
      mostTokens = std::max(mostTokens, metrics.cachedTokens);
      mostBytes = std::max(mostBytes, metrics.cachedBytes);
    }
  }
  EXPECT_LE(mostTokens, kTokens);
  EXPECT_LE(mostBytes, kBytes);
  EXPECT_GT(mostBytes, kBytes / 10 * 9);
  EXPECT_EQ(MetricsOf(tokens).evictions, 1'000'000 - MetricsOf(tokens).cachedTokens);
}

TEST(CheckedTokensTest, ConcurrentUse) {
  CheckedTokens tokens({50, 1000});
  std::vector<std::thread> threads;
  for (std::uint64_t thread = 0; thread < 4; ++thread) {
    threads.emplace_back([&tokens, thread] {
      for (std::uint64_t i = 0; i < 2000; ++i) {
        const auto key = KeyOf(i % 97);
        const std::uint64_t version = kVersion + i / 500;
        const auto found = tokens.Find(key, version);
        if (found == nullptr) {
          tokens.Insert(key, version, NewToken(), 10 + thread);
        } else if (i % 7 == 0) {
          tokens.Remove(key, *found);
        }
      }
    });
  }
  for (std::thread& thread : threads) {
    thread.join();
  }
  EXPECT_LE(MetricsOf(tokens).cachedTokens, 50U);
  EXPECT_LE(MetricsOf(tokens).cachedBytes, 1000U);
}

}  // namespace
}  // namespace SsoClient::Access::Testing
