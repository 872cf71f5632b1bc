#include "refresh_schedule.h"

#include <gtest/gtest.h>

namespace SsoClient::Access {

namespace {

KeyPtr KeyOf(int number) {
  TokenSpec spec;
  spec.tokenLifetimeSec = number;
  return MakeKey(spec);
}

Instant::Steady At(int seconds) {
  return Instant::Steady(std::chrono::seconds(seconds));
}

TEST(RefreshScheduleTest, EmptyAtFirst) {
  RefreshSchedule schedule;
  EXPECT_FALSE(schedule.Earliest());
  EXPECT_TRUE(schedule.Due(At(1000), 10).empty());
  EXPECT_EQ(schedule.Find(KeyOf(1)), nullptr);
  schedule.Remove(KeyOf(1));
}

TEST(RefreshScheduleTest, EarliestComesFirst) {
  RefreshSchedule schedule;
  for (const int number : {5, 3, 9, 1}) {
    schedule.Set(KeyOf(number), At(number));
  }
  EXPECT_EQ(*schedule.Earliest(), At(1));
  std::vector<std::int64_t> due;
  for (const KeyPtr& key : schedule.Due(At(5), 10)) {
    due.push_back(key->spec.tokenLifetimeSec);
  }
  EXPECT_EQ(due, (std::vector<std::int64_t>{1, 3, 5}));
  EXPECT_EQ(schedule.Due(At(5), 2).size(), 2U);
}

TEST(RefreshScheduleTest, KeyHasOneTime) {
  RefreshSchedule schedule;
  schedule.Set(KeyOf(1), At(10)).isPinned = true;
  schedule.Set(KeyOf(1), At(20));
  schedule.Set(KeyOf(1), At(20));
  EXPECT_EQ(*schedule.Earliest(), At(20));
  EXPECT_EQ(schedule.Due(At(100), 10).size(), 1U);
  EXPECT_TRUE(schedule.Find(KeyOf(1))->isPinned);
  schedule.Remove(KeyOf(1));
  EXPECT_FALSE(schedule.Earliest());
}

TEST(RefreshScheduleTest, KeysInAnOutage) {
  RefreshSchedule schedule;
  schedule.Set(KeyOf(1), At(1)).failures = 3;
  RefreshSchedule::Item& outage = schedule.Set(KeyOf(2), At(2));
  outage.failures = 2;
  outage.isOutage = true;
  schedule.Set(KeyOf(3), At(3));
  std::vector<KeyPtr> keys;
  const auto move = [&](const KeyPtr& key, const RefreshSchedule::Item&) {
    keys.push_back(key);
    schedule.Set(key, At(5));
  };
  schedule.ForEachInOutage(move);
  ASSERT_EQ(keys.size(), 1U);
  EXPECT_EQ(keys[0]->spec.tokenLifetimeSec, 2);
  EXPECT_EQ(schedule.Find(KeyOf(2))->at, At(5));
}

TEST(RefreshScheduleTest, ClearRemovesAll) {
  RefreshSchedule schedule;
  schedule.Set(KeyOf(1), At(1));
  schedule.Clear();
  EXPECT_FALSE(schedule.Earliest());
  EXPECT_EQ(schedule.Find(KeyOf(1)), nullptr);
}

}  // namespace

}  // namespace SsoClient::Access
