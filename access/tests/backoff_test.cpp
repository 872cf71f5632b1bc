#include "backoff.h"

#include <gtest/gtest.h>

namespace SsoClient::Access {

namespace {

using std::chrono::milliseconds;
using std::chrono::minutes;
using std::chrono::seconds;

RetryConfig Config() {
  RetryConfig config;
  config.firstDelay = milliseconds(500);
  config.longestDelay = minutes(1);
  config.longestRetryAfter = minutes(5);
  return config;
}

TEST(BackoffTest, GrowsByPowersOfTwoToTheLimit) {
  const long expected[] = {500, 1000, 2000, 4000, 8000, 16000, 32000, 60000, 60000};
  for (int failures = 1; failures <= 9; ++failures) {
    const auto pause = Backoff(Config(), failures, milliseconds(0), 0.9999999);
    EXPECT_EQ(pause.count(), expected[failures - 1] - 1) << failures;
  }
}

TEST(BackoffTest, IsRandomInItsUpperHalf) {
  EXPECT_EQ(Backoff(Config(), 5, milliseconds(0), 0.0), seconds(4));
  EXPECT_EQ(Backoff(Config(), 5, milliseconds(0), 0.5), seconds(6));
  RetryConfig config = Config();
  config.firstDelay = milliseconds(1);
  EXPECT_EQ(Backoff(config, 1, milliseconds(0), 0.0), milliseconds(1));
}

TEST(BackoffTest, ManyFailuresDoNotOverflow) {
  EXPECT_EQ(Backoff(Config(), 1000000000, milliseconds(0), 0.5), seconds(45));
  RetryConfig config = Config();
  config.firstDelay = milliseconds(0);
  EXPECT_EQ(Backoff(config, 10, milliseconds(0), 0.9), milliseconds(0));
  config.firstDelay = minutes(2);
  EXPECT_EQ(Backoff(config, 1, milliseconds(0), 0.5), seconds(45));
}

TEST(BackoffTest, RetryAfterIsTheLeast) {
  EXPECT_EQ(Backoff(Config(), 1, seconds(10), 0.0), seconds(10) + milliseconds(250));
  EXPECT_EQ(Backoff(Config(), 1, seconds(10), 0.5), seconds(10) + milliseconds(375));
}

TEST(BackoffTest, RetryAfterIsLimited) {
  EXPECT_EQ(Backoff(Config(), 1, minutes(60), 0.0), minutes(5) + milliseconds(250));
  EXPECT_EQ(Backoff(Config(), 1, minutes(-60), 0.0), milliseconds(250));
}

}  // namespace

}  // namespace SsoClient::Access
