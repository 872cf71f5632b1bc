#include "token_life.h"

#include <gtest/gtest.h>

namespace SsoClient::Access {

namespace {

using std::chrono::hours;
using std::chrono::microseconds;
using std::chrono::milliseconds;
using std::chrono::minutes;
using std::chrono::seconds;

class TokenLifeTest : public ::testing::Test {
 protected:
  GrantedPeriod From(microseconds start, microseconds end, milliseconds offset = {}) const {
    const auto wall = std::chrono::duration_cast<microseconds>(now.wall.time_since_epoch());
    return {wall + start, wall + end, offset};
  }
  Instant After(milliseconds duration) const {
    return {now.steady + duration, now.wall + duration};
  }

  const Instant now{Instant::Steady(hours(5)), Instant::Wall(hours(500000))};
  const RefreshConfig config;
};

TEST_F(TokenLifeTest, RefreshIsAtTheFractionWithJitter) {
  const auto at = [&](double draw) {
    return PlanTokenLife(config, From(seconds(0), hours(1)), now, draw).refreshAt - now.steady;
  };
  EXPECT_EQ(at(0.5), minutes(45));
  EXPECT_EQ(at(0.0), minutes(39));
  EXPECT_NEAR(static_cast<double>(std::chrono::duration_cast<seconds>(at(0.999999)).count()), 3060,
              1);
}

TEST_F(TokenLifeTest, MarginIsATwentiethAndAtMostTheLongest) {
  const auto usable = [&](microseconds lifetime) {
    return PlanTokenLife(config, From(seconds(0), lifetime), now, 0.5).usableUntil.steady -
           now.steady;
  };
  EXPECT_EQ(usable(seconds(5)), milliseconds(4750));
  EXPECT_EQ(usable(minutes(5)), seconds(285));
  EXPECT_EQ(usable(hours(24)), hours(24) - seconds(30));
  EXPECT_EQ(usable(hours(24 * 30)), hours(24 * 30) - seconds(30));
}

TEST_F(TokenLifeTest, UsableByBothClocks) {
  const TokenLife life = PlanTokenLife(config, From(seconds(0), minutes(5)), now, 0.5);
  EXPECT_TRUE(life.IsUsable(After(seconds(284)), seconds(0)));
  EXPECT_FALSE(life.IsUsable(After(seconds(285)), seconds(0)));
  EXPECT_FALSE(life.IsUsable({now.steady, now.wall + seconds(285)}, seconds(0)));
  EXPECT_FALSE(life.IsUsable({now.steady + seconds(285), now.wall}, seconds(0)));
  EXPECT_FALSE(life.HasEnded(After(seconds(299))));
  EXPECT_TRUE(life.HasEnded({now.steady + minutes(5), now.wall}));
  EXPECT_TRUE(life.HasEnded({now.steady, now.wall + minutes(5)}));
}

TEST_F(TokenLifeTest, StatedMinimumReplacesTheMargin) {
  const TokenLife life = PlanTokenLife(config, From(seconds(0), minutes(5)), now, 0.5);
  EXPECT_TRUE(life.IsUsable(After(minutes(4)), minutes(1)));
  EXPECT_FALSE(life.IsUsable(After(minutes(4) + milliseconds(1)), minutes(1)));
  EXPECT_TRUE(life.IsUsable(After(seconds(299)), seconds(1)));
}

TEST_F(TokenLifeTest, StartThatIsSetBackDoesNotCount) {
  const TokenLife life = PlanTokenLife(config, From(minutes(-10), hours(1)), now, 0.5);
  EXPECT_EQ(life.granted, hours(1));
  EXPECT_EQ(life.refreshAt - now.steady, minutes(45));
}

TEST_F(TokenLifeTest, ServiceClockCounts) {
  const TokenLife life = PlanTokenLife(config, From(minutes(9), minutes(69), minutes(9)), now, 0.5);
  EXPECT_EQ(life.granted, hours(1));
  EXPECT_EQ(life.end.steady - now.steady, hours(1));
  EXPECT_EQ(life.end.wall - now.wall, hours(1));
}

TEST_F(TokenLifeTest, OffsetWithWhichTheTokenIsNotValidIsIgnored) {
  EXPECT_EQ(PlanTokenLife(config, From(seconds(0), hours(1), hours(2)), now, 0.5).granted,
            hours(1));
  EXPECT_EQ(PlanTokenLife(config, From(seconds(0), hours(1), hours(-2)), now, 0.5).granted,
            hours(1));
}

TEST_F(TokenLifeTest, SlowServiceClockCountsAsFarAsTheTokenAgrees) {
  const auto granted = [&](microseconds start, microseconds end, milliseconds offset) {
    return PlanTokenLife(config, From(start, end, offset), now, 0.5).granted;
  };
  // The service is 90 s slow. Its token begins now, in the past, or in the future, by its clock.
  const seconds slow(-90);
  EXPECT_EQ(granted(slow, slow + minutes(5), slow), minutes(5));
  EXPECT_EQ(granted(slow - minutes(10), slow + minutes(5), slow), minutes(5));
  EXPECT_EQ(granted(slow + minutes(2), slow + minutes(7), slow), minutes(5));
  EXPECT_EQ(granted(slow, slow + seconds(60), slow), seconds(60));
  // A `Date` that the token contradicts does not count.
  EXPECT_EQ(granted(minutes(-5), minutes(5), minutes(-15)), minutes(5));
  EXPECT_EQ(granted(minutes(0), minutes(5), minutes(-9)), minutes(5));
  EXPECT_EQ(granted(minutes(-1), minutes(5), minutes(-4)), minutes(5));
  // The end is passed by no more than both say.
  EXPECT_EQ(granted(minutes(-1), minutes(5), minutes(-3)), minutes(6));
  EXPECT_EQ(granted(minutes(-30), minutes(5), minutes(-3)), minutes(8));
}

TEST_F(TokenLifeTest, TokenThatHasEndedGrantsNothing) {
  const TokenLife life = PlanTokenLife(config, From(hours(-2), hours(-1)), now, 0.5);
  EXPECT_EQ(life.granted, seconds(0));
  EXPECT_FALSE(life.IsUsable(now, seconds(0)));
}

TEST_F(TokenLifeTest, LargeJitterStaysWithinTheLifetime) {
  RefreshConfig wide;
  wide.jitter = 1;
  const auto at = [&](double draw) {
    return PlanTokenLife(wide, From(seconds(0), hours(1)), now, draw).refreshAt - now.steady;
  };
  EXPECT_EQ(at(0.0), minutes(6));
  EXPECT_EQ(at(0.999999), minutes(60) - seconds(30));
}

TEST_F(TokenLifeTest, LifetimeOfMillenniaFitsTheClocks) {
  const TokenLife life = PlanTokenLife(config, From(seconds(0), hours(24 * 365 * 7000L)), now, 0.5);
  EXPECT_GT(life.end.steady, now.steady + hours(24 * 365 * 29));
  EXPECT_GT(life.refreshAt, now.steady);
  EXPECT_LT(life.refreshAt, life.usableUntil.steady);
}

}  // namespace

}  // namespace SsoClient::Access
