// The system's clock is set while tokens are in the cache.
#include <gtest/gtest.h>

#include <ssoclient/exceptions.h>

#include "support/source_fixture.h"

namespace SsoClient::Access::Testing {

namespace {

using Limit = Tarnik::Http::CallLimit;

class ClockStepsTest : public SourceFixture {
 protected:
  ClockStepsTest() {
    config.refresh.jitter = 0;
    // A service whose clock is right, and whose answers have a Date.
    ForAll([this](const AttemptRequest&, Limit&) {
      const auto start = std::chrono::duration_cast<std::chrono::microseconds>(
          (runtime->Now().wall - step_).time_since_epoch());
      AttemptOutcome outcome = Issued(
          std::make_shared<IssuedToken>("_" + std::to_string(++issued_), start.count(),
                                        (start + std::chrono::microseconds(hours(1))).count()));
      outcome.clockOffset = -step_;
      return outcome;
    });
  }

  void SetClock(milliseconds step) {
    runtime->MoveWallClock(step);
    step_ += step;
  }
  // Callers ask all the time, for five hours. Returns how many waited for a token.
  std::uint64_t AskForHours() {
    const std::uint64_t before = source->Metrics().misses;
    for (int minute = 0; minute < 300; ++minute) {
      const Reply reply = Get(spec);
      EXPECT_NE(reply.token, nullptr) << reply.Message();
      runtime->Advance(minutes(1));
    }
    return source->Metrics().misses - before;
  }

 private:
  milliseconds step_{0};
  int issued_ = 0;
};

TEST_F(ClockStepsTest, SetBackByHoursTokensAreRefreshedAndEndAsBefore) {
  Make();
  Get(spec);
  SetClock(hours(-7));
  EXPECT_EQ(AskForHours(), 0U);
  EXPECT_GE(Attempts(), 6U);
  EXPECT_LE(Attempts(), 8U);
  // Without a service, a token ends after an hour on the steady clock.
  ForAll(Fails(Fault()));
  runtime->Advance(hours(1));
  EXPECT_EQ(source->TryGetToken(spec), nullptr);
}

TEST_F(ClockStepsTest, SetForwardByHoursTokensAreReplacedOnce) {
  Make();
  Get(spec);
  SetClock(hours(7));
  EXPECT_EQ(source->TryGetToken(spec), nullptr);
  EXPECT_EQ(AskForHours(), 1U);
  EXPECT_LE(Attempts(), 9U);
}

TEST_F(ClockStepsTest, SetForwardAndBackTheTokenIsServedAgain) {
  Make();
  const Reply reply = Get(spec);
  SetClock(hours(3));
  EXPECT_EQ(source->TryGetToken(spec), nullptr);
  SetClock(hours(-3));
  EXPECT_EQ(source->TryGetToken(spec), reply.token);
  EXPECT_EQ(Attempts(), 1U);
}

TEST_F(ClockStepsTest, SetForwardWithinTheLifeOfATokenItEndsEarlier) {
  Make();
  Get(spec);
  SetClock(minutes(30));
  EXPECT_NE(source->TryGetToken(spec), nullptr);
  runtime->Advance(minutes(29) + seconds(29));
  EXPECT_NE(source->TryGetToken(spec), nullptr);
  runtime->Advance(seconds(1));
  EXPECT_EQ(source->TryGetToken(spec), nullptr);
}

TEST_F(ClockStepsTest, WrongFromTheBeginningLifetimesAreThoseOfTheService) {
  for (const hours step : {hours(-30), hours(30)}) {
    SetClock(step);
    Make();
    EXPECT_EQ(AskForHours(), 1U);
    source->Stop(milliseconds(0));
  }
}

TEST_F(ClockStepsTest, DeadlinesAndPausesAreNotMoved) {
  Make();
  ForAll(Fails(Unreachable()));
  config.retry.firstDelay = minutes(2);
  const auto reply = Ask(spec, Within(minutes(1)));
  runtime->Settle();
  SetClock(hours(5));
  runtime->Settle();
  EXPECT_FALSE(reply->Has());
  SetClock(hours(-10));
  runtime->Advance(minutes(1));
  EXPECT_TRUE(reply->Has());
}

TEST_F(ClockStepsTest, RefusalsAreRememberedByTheSteadyClock) {
  config.login = PasswordLogin{"alice", [] { return std::string("wrong"); }};
  ForAll(Fails(Refused()));
  Make();
  Get(spec);
  SetClock(hours(5));
  EXPECT_TRUE(Get(spec).Is<InvalidCredentialsException>());
  EXPECT_EQ(Attempts(), 1U);
  runtime->Advance(minutes(5));
  SetClock(hours(-5));
  Get(spec);
  EXPECT_EQ(Attempts(), 2U);
}

}  // namespace

}  // namespace SsoClient::Access::Testing
