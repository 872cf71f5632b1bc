#include "activity.h"

#include <future>
#include <thread>

#include <gtest/gtest.h>

namespace SsoClient::Access {

namespace {

using std::chrono::hours;
using std::chrono::milliseconds;

TEST(ActivityTest, IdleAtFirst) {
  Activity activity;
  EXPECT_TRUE(activity.WaitUntilIdle(milliseconds(0)));
  EXPECT_TRUE(activity.WaitUntilIdle(milliseconds(-1)));
}

TEST(ActivityTest, WhatHasBegunIsWaitedFor) {
  Activity activity;
  activity.Begin();
  EXPECT_FALSE(activity.WaitUntilIdle(milliseconds(1)));
  activity.End();
  EXPECT_TRUE(activity.WaitUntilIdle(milliseconds(0)));
}

TEST(ActivityTest, WhatRunsOnTheSameThreadIsNot) {
  Activity activity;
  Activity other;
  const ActivityScope scope(activity);
  const ActivityScope inner(other);
  EXPECT_TRUE(activity.WaitUntilIdle(milliseconds(0)));
  activity.Begin();
  EXPECT_FALSE(activity.WaitUntilIdle(milliseconds(1)));
  activity.End();
}

TEST(ActivityTest, ScopesOfOneThreadNest) {
  Activity activity;
  const ActivityScope scope(activity);
  {
    const ActivityScope inner(activity);
    EXPECT_TRUE(activity.WaitUntilIdle(milliseconds(0)));
  }
  EXPECT_TRUE(activity.WaitUntilIdle(milliseconds(0)));
  EXPECT_FALSE(std::async(std::launch::async, [&] {
                 return activity.WaitUntilIdle(milliseconds(1));
               }).get());
}

TEST(ActivityTest, EndOnAnotherThreadEndsTheWait) {
  Activity activity;
  activity.Begin();
  std::thread other([&] { activity.End(); });
  EXPECT_TRUE(activity.WaitUntilIdle(milliseconds::max()));
  other.join();
}

}  // namespace

}  // namespace SsoClient::Access
