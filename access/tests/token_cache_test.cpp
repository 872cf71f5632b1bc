#include "token_cache.h"

#include <atomic>
#include <set>
#include <thread>

#include <gtest/gtest.h>

#include "support/issued_token.h"

namespace SsoClient::Access {

namespace {

using std::chrono::hours;
using std::chrono::minutes;
using std::chrono::seconds;

constexpr auto kNothingKept = [](const KeyPtr&) { return false; };

class TokenCacheTest : public ::testing::Test {
 protected:
  static TokenSpec SpecOf(int number) {
    TokenSpec spec;
    spec.tokenLifetimeSec = number;
    return spec;
  }
  EntryPtr MakeEntry(int number) {
    const TokenLife life{now.steady + minutes(45),
                         {now.steady + minutes(59), now.wall + minutes(59)},
                         {now.steady + hours(1), now.wall + hours(1)},
                         hours(1)};
    return std::make_shared<CacheEntry>(
        MakeKey(SpecOf(number)),
        std::make_shared<Testing::IssuedToken>(std::to_string(number), 0, 1), life, now);
  }
  TokenCache::Hit Find(int number, seconds minimumLife = seconds(0)) {
    const TokenSpec spec = SpecOf(number);
    return cache.Find(SpecView(spec), now, minimumLife);
  }
  void Pass(seconds duration) {
    now.steady += duration;
    now.wall += duration;
  }

  TokenCache cache{3};
  Instant now{Instant::Steady(hours(1)), Instant::Wall(hours(1000))};
};

TEST_F(TokenCacheTest, FindsWhatWasInserted) {
  EXPECT_EQ(Find(1).token, nullptr);
  EXPECT_EQ(cache.Hits(), 0U);
  const EntryPtr entry = MakeEntry(1);
  EXPECT_EQ(cache.Insert(entry, kNothingKept), nullptr);
  EXPECT_EQ(Find(1).token, entry->Token());
  EXPECT_EQ(Find(2).token, nullptr);
  EXPECT_EQ(cache.Hits(), 1U);
  EXPECT_EQ(cache.Size(), 1U);
}

TEST_F(TokenCacheTest, ReplicasHaveCountsOfTheirOwn) {
  const EntryPtr entry = MakeEntry(1);
  std::set<const SamlToken*> tokens;
  for (std::size_t i = 0; i < CacheEntry::kReplicas; ++i) {
    const auto copy = entry->Replica(i);
    EXPECT_EQ(copy.use_count(), 2);
    tokens.insert(copy.get());
  }
  EXPECT_EQ(tokens.size(), 1U);
}

TEST_F(TokenCacheTest, TokenOutlivesItsEntry) {
  cache.Insert(MakeEntry(1), kNothingKept);
  const auto token = Find(1).token;
  cache.Clear();
  EXPECT_EQ(cache.Size(), 0U);
  EXPECT_EQ(token->Id(), "1");
}

TEST_F(TokenCacheTest, UnusableTokenIsAMiss) {
  cache.Insert(MakeEntry(1), kNothingKept);
  EXPECT_NE(Find(1, minutes(60)).token, nullptr);
  EXPECT_EQ(Find(1, minutes(61)).token, nullptr);
  Pass(minutes(59));
  EXPECT_EQ(Find(1).token, nullptr);
  const TokenSpec spec = SpecOf(1);
  EXPECT_NE(cache.Peek(SpecView(spec)), nullptr);
}

TEST_F(TokenCacheTest, FirstCallerAfterTheRefreshWasDueWantsIt) {
  cache.Insert(MakeEntry(1), kNothingKept);
  cache.Insert(MakeEntry(2), kNothingKept);
  EXPECT_FALSE(Find(1).wantsRefresh);
  Pass(minutes(50));
  EXPECT_FALSE(Find(1).wantsRefresh);
  EXPECT_TRUE(Find(2).wantsRefresh);
  EXPECT_FALSE(Find(2).wantsRefresh);
}

TEST_F(TokenCacheTest, InsertReplaces) {
  cache.Insert(MakeEntry(1), kNothingKept);
  Find(1);
  const EntryPtr second = MakeEntry(1);
  EXPECT_FALSE(second->IsAsked());
  EXPECT_EQ(cache.Insert(second, kNothingKept), nullptr);
  EXPECT_EQ(Find(1).token, second->Token());
  EXPECT_EQ(cache.Size(), 1U);
}

TEST_F(TokenCacheTest, EvictsWhatWasNotUsedTheLongest) {
  for (const int number : {1, 2, 3}) {
    cache.Insert(MakeEntry(number), kNothingKept);
    Pass(seconds(1));
  }
  Find(1);
  const EntryPtr evicted = cache.Insert(MakeEntry(4), kNothingKept);
  ASSERT_NE(evicted, nullptr);
  EXPECT_EQ(evicted->Token()->Id(), "2");
  EXPECT_EQ(cache.Size(), 3U);
  // There is room for a replacement.
  EXPECT_EQ(cache.Insert(MakeEntry(4), kNothingKept), nullptr);
}

TEST_F(TokenCacheTest, EvictsWhatIsKeptOnlyIfAllAre) {
  const auto isKept = [](const KeyPtr& key) { return key->spec.tokenLifetimeSec != 3; };
  for (const int number : {1, 2, 3}) {
    cache.Insert(MakeEntry(number), isKept);
    Pass(seconds(1));
  }
  EXPECT_EQ(cache.Insert(MakeEntry(4), isKept)->Token()->Id(), "3");
  EXPECT_EQ(cache.Insert(MakeEntry(5), isKept), nullptr);
  EXPECT_EQ(cache.Size(), 4U);
  EXPECT_NE(Find(1).token, nullptr);
}

TEST_F(TokenCacheTest, RemoveOfAnUnknownKeyDoesNothing) {
  cache.Insert(MakeEntry(1), kNothingKept);
  const TokenSpec other = SpecOf(2);
  cache.Remove(SpecView(other));
  EXPECT_EQ(cache.Size(), 1U);
  const TokenSpec own = SpecOf(1);
  cache.Remove(SpecView(own));
  EXPECT_EQ(cache.Size(), 0U);
}

TEST_F(TokenCacheTest, ConcurrentReadersAndAWriterAgree) {
  std::atomic<bool> isDone{false};
  std::atomic<int> found{0};
  std::vector<std::thread> readers;
  for (int i = 0; i < 4; ++i) {
    readers.emplace_back([&] {
      while (!isDone) {
        for (int number = 1; number <= 4; ++number) {
          const auto token = Find(number).token;
          if (token != nullptr && token->Id() == std::to_string(number)) {
            ++found;
          }
        }
      }
    });
  }
  for (int i = 0; i < 300 || found == 0; ++i) {
    cache.Insert(MakeEntry(1 + i % 4), kNothingKept);
    const TokenSpec removed = SpecOf(1 + (i + 2) % 4);
    cache.Remove(SpecView(removed));
  }
  isDone = true;
  for (auto& reader : readers) {
    reader.join();
  }
  EXPECT_EQ(cache.Hits(), static_cast<std::uint64_t>(found));
}

}  // namespace

}  // namespace SsoClient::Access
