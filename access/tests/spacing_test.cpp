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
      for (int minute = 0; minute < 60; ++minute) {
        for (int caller = 0; caller < callersAMinute; ++caller) {
          replies_.push_back(Ask(SpecFor("of caller " + std::to_string(replies_.size() % 100))));
        }
        runtime->Advance(minutes(1));
      }
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
  bool HaveAllCallersFailed() const {
    return std::all_of(replies_.begin(), replies_.end(), [](const std::shared_ptr<Reply>& reply) {
      return reply->Is<CommunicationException>();
    });
  }

  /// That have no deadline, and no token.
  int callersAMinute = 0;

 private:
  std::mt19937 random_{7};
  int keys_ = 0;
  Instant::Steady begun_;
  std::vector<std::shared_ptr<Reply>> replies_;
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

TEST_P(SpacingTest, CallersDoNotIncreaseTheNumber) {
  callersAMinute = 3;
  MakeWithKeys(2);
  FailForADay(Unreachable());
  for (const std::size_t endpoint : {0U, 1U}) {
    EXPECT_LE(MostInAnHour(endpoint), 120U);
    EXPECT_LE(InTheFirstMinute(endpoint), 20U);
    EXPECT_GE(All(endpoint), 24U * 60);
  }
  EXPECT_TRUE(HaveAllCallersFailed());
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
  config.retry.longestDelay = hours(1);
  MakeWithKeys(10);
  FailForADay(Unreachable());
  ForAll(Issues(hours(24 * 30)));
  for (int i = 0; i < 3600 && source->Metrics().logins == 10; ++i) {
    runtime->Advance(seconds(1));
  }
  // The spread.
  runtime->Advance(config.retry.firstDelay);
  EXPECT_EQ(source->Metrics().logins, 20U);
}

INSTANTIATE_TEST_SUITE_P(Chances, SpacingTest, ::testing::Values(Chance::kRandom, Chance::kLowest));

// ---- answers while circuits stay closed

class AnswerTest : public SourceFixture {
 protected:
  AnswerTest() {
    UseCertificate();
    config.endpoints.resize(1);
    config.retry.failuresToOpen = 1000;
    config.retry.longestDelay = hours(2);
    config.refresh.jitter = 0;
    ForAll(Issues(hours(24 * 30)));
  }
  // The service fails for this key only.
  void FailFor(const TokenSpec& failing) {
    scripts[0]->Set([this, failing](const AttemptRequest& request, Limit&) {
      const bool fails = request.spec.audienceRestriction == failing.audienceRestriction;
      failed_ += fails ? 1 : 0;
      return fails ? Unavailable(milliseconds(0)) : Issued(NewToken(hours(24 * 30)));
    });
  }

  std::size_t failed_ = 0;
};

TEST_F(AnswerTest, EndsThePausesOfCallsAtOnce) {
  config.retry.firstDelay = hours(1);
  Make();
  ForAll(Fails(Unreachable()));
  const auto paused = Ask(spec);
  runtime->Settle();
  ASSERT_FALSE(paused->Has());
  ForAll(Issues(hours(1)));
  ASSERT_NE(Get(SpecFor("other")).token, nullptr);
  ASSERT_TRUE(paused->Has());
  EXPECT_NE(paused->token, nullptr);
}

TEST_F(AnswerTest, EndsThePostponementsOfRefreshesAtOnce) {
  config.retry.attempts = 1;
  Make();
  Get(spec);
  source->TryGetToken(spec);
  runtime->Advance(hours(24 * 30) * 3 / 4 - seconds(1));
  ForAll(Fails(Unreachable()));
  runtime->Advance(hours(20));
  ForAll(Issues(hours(24 * 30)));
  ASSERT_NE(Get(SpecFor("other")).token, nullptr);
  EXPECT_EQ(source->Metrics().logins, 2U);
  runtime->Advance(config.retry.firstDelay);
  EXPECT_EQ(source->Metrics().logins, 3U);
}

TEST_F(AnswerTest, ServiceThatAnswersOtherRequestsReceivesTheStatedNumber) {
  config.retry.attempts = 1;
  config.cache.capacity = 10000;
  Make();
  Get(spec);
  source->TryGetToken(spec);
  runtime->Advance(hours(24 * 30) * 3 / 4 - seconds(1));
  FailFor(spec);
  runtime->Advance(minutes(1));
  const std::size_t before = failed_;
  EXPECT_GT(before, 0U);
  for (int second = 0; second < 3600; ++second) {
    ASSERT_NE(Get(SpecFor(std::to_string(second))).token, nullptr);
    runtime->Advance(seconds(1));
  }
  EXPECT_LE(failed_ - before, 120U);
  EXPECT_GE(failed_ - before, 60U);
}

TEST_F(AnswerTest, PausedCallOfAFailingKeyIsNotRepeatedWithEachAnswer) {
  config.retry.firstDelay = hours(1);
  Make();
  FailFor(spec);
  const auto paused = Ask(spec);
  for (int second = 0; second < 25; ++second) {
    ASSERT_NE(Get(SpecFor(std::to_string(second))).token, nullptr);
    runtime->Advance(seconds(1));
  }
  EXPECT_EQ(failed_, 2U);
  EXPECT_FALSE(paused->Has());
}

// ---- several endpoints that may be asked at different times

class ProbeTest : public SourceFixture {
 protected:
  // The first endpoint asks to wait for an hour, which counts as five minutes; the second one is
  // down at first.
  ProbeTest() {
    UseCertificate();
    config.retry.failuresToOpen = 2;
    scripts[0]->Set(Fails(Unavailable(hours(1))));
    scripts[1]->Set(Fails(Unreachable()));
  }
};

TEST_F(ProbeTest, CallWaitsOnlyUntilAnyEndpointMayBeAsked) {
  Make();
  const auto reply = Ask(spec);
  runtime->Settle();
  runtime->Advance(milliseconds(500));
  ASSERT_EQ(scripts[1]->Count(), 2U);  // the circuit is open now
  ASSERT_FALSE(reply->Has());
  scripts[1]->Set(Issues(hours(1)));
  runtime->Advance(seconds(2));
  ASSERT_TRUE(reply->Has());
  EXPECT_NE(reply->token, nullptr) << reply->Message();
  EXPECT_EQ(scripts[0]->Count(), 1U);
}

TEST_F(ProbeTest, CallThatComesDuringTheProbeWaitsOn) {
  Make();
  const auto first = Ask(spec);
  const auto second = Ask(SpecFor("other"));
  runtime->Settle();
  runtime->Advance(milliseconds(500));
  ASSERT_FALSE(first->Has());
  ASSERT_FALSE(second->Has());
  scripts[1]->Set([this](const AttemptRequest&, Limit&) {
    scripts[1]->Set(Issues(hours(1)));
    runtime->Advance(seconds(2));  // the pauses of all others end
    return Issued(NewToken(hours(1)));
  });
  runtime->Advance(seconds(10));
  ASSERT_TRUE(first->Has());
  ASSERT_TRUE(second->Has());
  EXPECT_NE(first->token, nullptr) << first->Message();
  EXPECT_NE(second->token, nullptr) << second->Message();
}

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
