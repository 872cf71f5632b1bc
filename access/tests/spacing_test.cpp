// How many requests an hour a service receives in an outage.
#include <algorithm>
#include <map>
#include <random>

#include <gtest/gtest.h>

#include <ssoclient/exceptions.h>

#include "support/source_fixture.h"

namespace SsoClient::Access::Testing {

namespace {

using Limit = Tarnik::Http::CallLimit;

/// The random numbers of a source: of all sizes, or always the worst.
enum class Chance { kRandom, kLowest };

class SpacingTest : public SourceFixture, public ::testing::WithParamInterface<Chance> {
 protected:
  SpacingTest() {
    config.refresh.jitter = 0;
    config.listener = nullptr;
    runtime->SetDraw([this] {
      return GetParam() == Chance::kLowest ? 0.0
                                           : std::uniform_real_distribution<double>(0, 1)(random_);
    });
    ForAll(Issues(hours(24 * 30)));
  }

  // Tokens of 30 days, of which a day remains until they are refreshed.
  void MakeWithKeys(int keys) {
    keys_ = keys;
    Make();
    for (int i = 0; i < keys; ++i) {
      ASSERT_NE(Get(SpecFor(std::to_string(i))).token, nullptr);
      ASSERT_NE(source->TryGetToken(SpecFor(std::to_string(i))), nullptr);
    }
    runtime->Advance(hours(24 * 30) * 3 / 4 - seconds(1));
  }
  // Each endpoint fails for a day, in which all tokens are served.
  void FailForADay(const AttemptOutcome& outcome) {
    for (std::size_t i = 0; i < scripts.size(); ++i) {
      scripts[i]->Set([this, i, outcome](const AttemptRequest&, Limit&) {
        times_[i].push_back(runtime->Now().steady);
        return outcome;
      });
    }
    begun_ = runtime->Now().steady + seconds(1);
    for (int hour = 0; hour < 24; ++hour) {
      runtime->Advance(hours(1));
      for (int i = 0; i < keys_; ++i) {
        ASSERT_NE(source->TryGetToken(SpecFor(std::to_string(i))), nullptr);
      }
    }
  }
  // The most that an endpoint has received in any hour after the first minute.
  std::size_t MostInAnHour(std::size_t endpoint) {
    const auto& times = times_[endpoint];
    std::size_t most = 0;
    for (auto first = times.begin(); first != times.end(); ++first) {
      if (*first >= begun_ + minutes(1)) {
        const auto end = std::lower_bound(first, times.end(), *first + hours(1));
        most = std::max(most, static_cast<std::size_t>(end - first));
      }
    }
    return most;
  }
  std::size_t InTheFirstMinute(std::size_t endpoint) {
    const auto& times = times_[endpoint];
    return static_cast<std::size_t>(
        std::lower_bound(times.begin(), times.end(), begun_ + minutes(1)) - times.begin());
  }
  std::size_t All(std::size_t endpoint) { return times_[endpoint].size(); }

 private:
  std::mt19937 random_{7};
  int keys_ = 0;
  Instant::Steady begun_;
  std::map<std::size_t, std::vector<Instant::Steady>> times_;
};

TEST_P(SpacingTest, EndpointThatIsDownForADayReceivesTheStatedNumber) {
  MakeWithKeys(10);
  FailForADay(Unreachable());
  for (const std::size_t endpoint : {0U, 1U}) {
    EXPECT_LE(MostInAnHour(endpoint), 120U);
    EXPECT_LE(InTheFirstMinute(endpoint), 20U);
    // The average that is stated is that of random pauses.
    EXPECT_GE(All(endpoint), 24U * 70);
    EXPECT_LE(All(endpoint), GetParam() == Chance::kLowest ? 24U * 121 : 24U * 90);
  }
}

TEST_P(SpacingTest, ServiceThatRefusesTheRefreshesOfAKeyReceivesTheStatedNumber) {
  MakeWithKeys(1);
  FailForADay(Fault());
  EXPECT_LE(MostInAnHour(0) + MostInAnHour(1), 120U);
  EXPECT_LE(InTheFirstMinute(0), 10U);
  EXPECT_GE(All(0) + All(1), 24U * 70);
}

TEST_P(SpacingTest, WrongPasswordIsSentOnceInTheStatedTime) {
  MakeWithKeys(5);
  FailForADay(Refused());
  EXPECT_LE(MostInAnHour(0) + MostInAnHour(1), 12U);
  EXPECT_GE(All(0) + All(1), 24U * 8);
}

TEST_P(SpacingTest, RetryAfterSpacesThemFurther) {
  MakeWithKeys(5);
  FailForADay(Unavailable(minutes(4)));
  EXPECT_LE(MostInAnHour(0), 15U);
  EXPECT_LE(MostInAnHour(1), 15U);
  EXPECT_GE(All(0), 24U * 10);
}

TEST_P(SpacingTest, FirstSuccessEndsAnOutageAtOnceForAllKeys) {
  MakeWithKeys(10);
  FailForADay(Unreachable());
  ForAll(Issues(hours(24 * 30)));
  // The longest pause, and the spread afterwards.
  runtime->Advance(minutes(1) + seconds(1));
  EXPECT_EQ(source->Metrics().logins, 20U);
}

INSTANTIATE_TEST_SUITE_P(Chances, SpacingTest, ::testing::Values(Chance::kRandom, Chance::kLowest));

// ---- the least pause between the background requests of one key

class LeastPauseTest : public SourceFixture {};

TEST_F(LeastPauseTest, TokensThatEndAtOnceCauseOneRefreshASecond) {
  ForAll(Issues(milliseconds(2)));
  config.keepFresh = {spec};
  Make();
  runtime->Settle();
  const std::size_t before = Attempts();
  runtime->Advance(seconds(20));
  EXPECT_GE(Attempts(), before + 15);
  EXPECT_LE(Attempts(), before + 20);
}

TEST_F(LeastPauseTest, RefreshesThatFailAtOnceAreASecondApart) {
  config.retry.firstDelay = milliseconds(1);
  config.retry.longestDelay = milliseconds(1);
  config.keepFresh = {spec};
  ForAll(Fails(Fault()));
  Make();
  runtime->Advance(milliseconds(9500));
  EXPECT_EQ(Attempts(), 10U);
  ASSERT_FALSE(listener->Refreshes().empty());
  EXPECT_EQ(listener->Refreshes()[0].nextAttempt, seconds(1));
}

}  // namespace

}  // namespace SsoClient::Access::Testing
