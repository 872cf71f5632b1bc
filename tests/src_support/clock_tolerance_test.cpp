#include "support/clock_tolerance.h"

#include <limits>

#include <gtest/gtest.h>

#include <tarnik/system/date_time.h>

namespace SsoClient::Testing {
namespace {

using Tarnik::System::DateTime;

constexpr long kLongest = std::numeric_limits<long>::max();
constexpr long kShortest = std::numeric_limits<long>::min();

TEST(ClockToleranceTest, AddsSecondsInBothDirections) {
  const DateTime time = DateTime::Parse("2024-03-05T07:08:09.010Z");
  EXPECT_EQ(AddSeconds(time, 600), DateTime::Parse("2024-03-05T07:18:09.010Z"));
  EXPECT_EQ(AddSeconds(time, -600), DateTime::Parse("2024-03-05T06:58:09.010Z"));
  EXPECT_EQ(AddSeconds(time, 0), time);
}

TEST(ClockToleranceTest, ReturnsUtc) {
  EXPECT_EQ(AddSeconds(DateTime::Parse("2024-03-05T09:08:09+02:00"), 1).ToString(),
            DateTime::Parse("2024-03-05T07:08:10Z").ToString());
}

TEST(ToleranceMicrosecondsTest, StopsAtTheEndsOf64Bits) {
  EXPECT_EQ(ToleranceMicroseconds(600), 600'000'000);
  EXPECT_EQ(ToleranceMicroseconds(-1), -1'000'000);
  EXPECT_EQ(ToleranceMicroseconds(kLongest), kLongest);
  EXPECT_EQ(ToleranceMicroseconds(kShortest), kShortest);
}

TEST(ClockToleranceTest, IsLimitedInsteadOfOverflowing) {
  const DateTime time = DateTime::Parse("2024-03-05T07:08:09Z");
  EXPECT_EQ(AddSeconds(time, kLongest), Tarnik::System::DateTimeFromUtc(kLongest, false));
  EXPECT_EQ(AddSeconds(time, kShortest), Tarnik::System::DateTimeFromUtc(kShortest, false));
}

}  // namespace
}  // namespace SsoClient::Testing
