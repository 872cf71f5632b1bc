#include <algorithm>
#include <map>
#include <random>

#include <gtest/gtest.h>

#include <ssoclient/exceptions.h>

#include "support/source_fixture.h"

namespace SsoClient::Access::Testing {

namespace {

using Limit = Tarnik::Http::CallLimit;

class RefreshTest : public SourceFixture {
 protected:
  RefreshTest() {
    runtime->SetDraw([this] { return std::uniform_real_distribution<double>(0, 1)(random_); });
  }

  long SecondsSince(Instant::Steady begun) const {
    return std::chrono::duration_cast<seconds>(runtime->Now().steady - begun).count();
  }

 private:
  std::mt19937 random_{7};
};

class LifetimeTest : public RefreshTest, public ::testing::WithParamInterface<seconds> {};

// A caller that asks all the time.
TEST_P(LifetimeTest, IsRefreshedSensiblyAndNeverHandedOutTooLate) {
  const milliseconds lifetime = GetParam();
  const milliseconds margin = std::min<milliseconds>(lifetime / 20, seconds(30));
  std::map<const SamlToken*, Instant::Steady> ends;
  ForAll([&](const AttemptRequest&, Limit&) {
    const auto token = NewToken(lifetime);
    ends[token.get()] = runtime->Now().steady + lifetime;
    return Issued(token);
  });
  Make();
  ASSERT_NE(Get(spec).token, nullptr);
  constexpr int kLifetimes = 20;
  for (int i = 0; i < kLifetimes * 100; ++i) {
    const auto token = source->TryGetToken(spec);
    ASSERT_NE(token, nullptr) << i;
    ASSERT_GE(ends.at(token.get()) - runtime->Now().steady, margin);
    runtime->Advance(lifetime / 100);
  }
  // Refreshes at 0.65 to 0.85 of the lifetime, and none beside.
  EXPECT_GE(Attempts(), kLifetimes / 0.87);
  EXPECT_LE(Attempts(), kLifetimes / 0.65 + 2);
  EXPECT_EQ(source->Metrics().misses, 1U);
}

INSTANTIATE_TEST_SUITE_P(All, LifetimeTest,
                         ::testing::Values(seconds(5), minutes(5), hours(24), hours(24 * 30)));

TEST_F(RefreshTest, ThousandSourcesMadeInOneMomentSpreadTheirRefreshes) {
  std::vector<long> times;
  const auto begun = runtime->Now().steady;
  ForAll([&](const AttemptRequest&, Limit&) {
    times.push_back(SecondsSince(begun));
    return Issued(NewToken(hours(1)));
  });
  config.listener = nullptr;
  config.keepFresh = {spec};
  std::vector<std::shared_ptr<TokenSourceImpl>> sources;
  for (int i = 0; i < 1000; ++i) {
    Make();
    sources.push_back(source);
  }
  runtime->Settle();
  ASSERT_EQ(times.size(), 1000U);
  times.clear();
  runtime->Advance(minutes(55));
  ASSERT_EQ(times.size(), 1000U);
  std::map<long, int> perMinute;
  for (const long time : times) {
    ++perMinute[time / 60];
  }
  // 0.65 to 0.85 of an hour are 12 minutes, on average 83 a minute.
  EXPECT_GE(perMinute.size(), 12U);
  for (const auto& [minute, count] : perMinute) {
    EXPECT_LE(count, 125) << minute;
  }
  for (const auto& made : sources) {
    made->Stop(milliseconds(0));
  }
}

TEST_F(RefreshTest, TokenThatNobodyAskedForIsNotRefreshedAndLeavesTheCache) {
  Make();
  Get(spec);
  runtime->Advance(minutes(59) + seconds(59));
  EXPECT_EQ(Attempts(), 1U);
  EXPECT_EQ(source->Metrics().keys, 1U);
  runtime->Advance(seconds(1));
  EXPECT_EQ(source->Metrics().keys, 0U);
  EXPECT_EQ(runtime->TimersArmed(), 0U);
}

TEST_F(RefreshTest, TokenThatIsAskedForLateIsRefreshedThen) {
  Make();
  Get(spec);
  runtime->Advance(minutes(57));
  EXPECT_EQ(Attempts(), 1U);
  EXPECT_NE(source->TryGetToken(spec), nullptr);
  runtime->Settle();
  EXPECT_EQ(Attempts(), 2U);
  EXPECT_TRUE(listener->Begun()[1].isRefresh);
}

TEST_F(RefreshTest, RefreshIsSharedByCallersThatNeedANewToken) {
  Make();
  Get(spec);
  source->TryGetToken(spec);
  std::shared_ptr<Reply> reply;
  ForAll([&](const AttemptRequest&, Limit&) {
    CallContext context;
    context.minimumLife = minutes(50);
    reply = Ask(spec, context);
    return Issued(NewToken(hours(1)));
  });
  runtime->Advance(minutes(52));
  EXPECT_EQ(Attempts(), 2U);
  ASSERT_NE(reply, nullptr);
  EXPECT_TRUE(reply->Has());
  EXPECT_NE(reply->token, nullptr);
}

TEST_F(RefreshTest, CallersLeaveARefreshWithoutEndingIt) {
  Make();
  Get(spec);
  source->TryGetToken(spec);
  bool isCancelled = true;
  ForAll([&](const AttemptRequest&, Limit& limit) {
    CallContext context = Within(seconds(1));
    context.minimumLife = minutes(50);
    Ask(spec, context);
    runtime->Pass(seconds(2));
    isCancelled = limit.IsCancelled();
    return Issued(NewToken(hours(1)));
  });
  runtime->Advance(minutes(52));
  EXPECT_FALSE(isCancelled);
}

TEST_F(RefreshTest, WhileAllEndpointsAreDownTheTokenIsServedAndAttemptsAreSpaced) {
  config.refresh.jitter = 0;
  ForAll(Issues(hours(24)));
  Make();
  constexpr int kKeys = 20;
  for (int i = 0; i < kKeys; ++i) {
    Get(SpecFor(std::to_string(i)));
    source->TryGetToken(SpecFor(std::to_string(i)));
  }
  runtime->Advance(hours(18) - seconds(1));
  ForAll(Fails(Unreachable()));
  const std::size_t before = Attempts();
  std::vector<std::size_t> perHour;
  for (int hour = 0; hour < 5; ++hour) {
    const std::size_t begun = Attempts();
    runtime->Advance(hours(1));
    perHour.push_back(Attempts() - begun);
    for (int i = 0; i < kKeys; ++i) {
      ASSERT_NE(source->TryGetToken(SpecFor(std::to_string(i))), nullptr);
    }
  }
  EXPECT_GT(Attempts(), before);
  // The probes of two circuits, each after a pause of at most a minute and at least half of one,
  // whatever the number of keys.
  for (const std::size_t attempts : perHour) {
    EXPECT_LE(attempts, 2 * 120U);
    EXPECT_GE(attempts, 2 * 60U);
  }
  EXPECT_GT(listener->Refreshes().size(), 0U);
  const RefreshFailureRecord record = listener->Refreshes().back();
  EXPECT_EQ(record.source, "orders");
  EXPECT_EQ(record.failure, FailureKind::kUnreachable);
  EXPECT_TRUE(record.usableUntil.has_value());
}

TEST_F(RefreshTest, RetryAfterSpacesTheAttemptsOfARefresh) {
  config.endpoints.resize(1);
  Make();
  Get(spec);
  source->TryGetToken(spec);
  ForAll(Fails(Unavailable(minutes(2))));
  runtime->Advance(minutes(59));
  // From at least 39 minutes on.
  EXPECT_GE(Attempts(), 3U);
  EXPECT_LE(Attempts(), 1U + 11U);
  // Each refresh sends; none is tried while that is known to be useless.
  EXPECT_EQ(source->Metrics().refreshFailures, Attempts() - 1);
}

TEST_F(RefreshTest, RefreshFindsAChangedPassword) {
  config.retry.refusalMemory = hours(1);
  ForAll([this](const AttemptRequest& request, Limit&) {
    return request.secret == password ? Issued(NewToken(hours(1))) : Refused();
  });
  Make();
  Get(spec);
  source->TryGetToken(spec);
  ForAll([this](const AttemptRequest& request, Limit&) {
    return request.secret == "changed" ? Issued(NewToken(hours(1))) : Refused();
  });
  runtime->Advance(minutes(52));
  EXPECT_EQ(Attempts(), 2U);
  ASSERT_FALSE(listener->Refreshes().empty());
  EXPECT_EQ(listener->Refreshes()[0].failure, FailureKind::kRefusedLogin);
  password = "changed";
  runtime->Advance(minutes(1));
  EXPECT_EQ(Attempts(), 3U);
  EXPECT_EQ(source->Metrics().logins, 2U);
}

TEST_F(RefreshTest, SilentServiceOccupiesFewThreads) {
  // Renewals, since logins wait for each other.
  const auto own = Tarnik::MakeRef<NamedCertificate>("own");
  config.holderOfKey = HolderOfKeyConfig{own, nullptr};
  config.refresh.jitter = 0;
  config.retry.failuresToOpen = 1000;
  ForAll([&](const AttemptRequest&, Limit&) {
    const auto token = NewToken(hours(1));
    token->isRenewable = true;
    token->certificate = own;
    return Issued(token);
  });
  Make();
  for (int i = 0; i < 100; ++i) {
    Get(SpecFor(std::to_string(i)));
    source->TryGetToken(SpecFor(std::to_string(i)));
  }
  std::size_t underWay = 0;
  std::size_t most = 0;
  ForAll([&](const AttemptRequest&, Limit&) {
    most = std::max(most, ++underWay);
    runtime->Settle();
    --underWay;
    return Failed<CommunicationException>(FailureKind::kTimedOut, "It is silent.");
  });
  runtime->Advance(minutes(46));
  EXPECT_EQ(most, 8U);
  // All have had their turn, at both endpoints.
  EXPECT_GE(Attempts(), 300U);
}

// The first endpoint is down until the source has a token of the second one.
class ReturnTest : public RefreshTest {
 protected:
  void FailOver() {
    scripts[0]->Set(Fails(Unreachable()));
    Make();
    ASSERT_NE(Get(spec).token, nullptr);
    ASSERT_EQ(scripts[1]->Count(), 1U);
    source->TryGetToken(spec);
    scripts[0]->Set(Issues(hours(1)));
  }
  static TokenSpec Other() { return SpecFor("https://other"); }
};

TEST_F(ReturnTest, RefreshReturnsToTheFirstEndpointAndCallersFollow) {
  FailOver();
  Get(Other());
  EXPECT_EQ(scripts[1]->Count(), 2U);  // where the last answer came from
  runtime->Advance(minutes(52));
  EXPECT_EQ(scripts[0]->Count(), 2U);
  EXPECT_EQ(scripts[1]->Count(), 2U);
  Get(SpecFor("https://third"));
  EXPECT_EQ(scripts[0]->Count(), 3U);
}

TEST_F(ReturnTest, FirstEndpointThatIsStillDownCostsEachRefreshOneAttempt) {
  FailOver();
  scripts[0]->Set(Fails(Unreachable()));
  runtime->Advance(minutes(52));
  EXPECT_EQ(scripts[0]->Count(), 2U);
  EXPECT_EQ(scripts[1]->Count(), 2U);
  Get(Other());
  EXPECT_EQ(scripts[0]->Count(), 2U);
  EXPECT_EQ(scripts[1]->Count(), 3U);
}

TEST_F(ReturnTest, FirstEndpointThatIsBackButRefusesIsLeftAgain) {
  FailOver();
  scripts[0]->Set(Fails(Fault()));
  const auto before = source->TryGetToken(spec);
  runtime->Advance(minutes(52));
  EXPECT_EQ(scripts[0]->Count(), 2U);
  EXPECT_EQ(scripts[1]->Count(), 2U);
  EXPECT_NE(source->TryGetToken(spec), before);
  EXPECT_NE(Get(Other()).token, nullptr);
  EXPECT_EQ(scripts[0]->Count(), 2U);
}

TEST_F(ReturnTest, RefreshGoesOnAtTheLastEndpoint) {
  config.endpoints.push_back({"https://c.example.com/sts", ""});
  scripts[1]->Set(Fails(Unreachable()));
  scripts[0]->Set(Fails(Unreachable()));
  Make();
  Get(spec);
  source->TryGetToken(spec);
  runtime->Advance(minutes(52));
  EXPECT_EQ(scripts[0]->Count(), 2U);
  EXPECT_EQ(scripts[1]->Count(), 1U);
  EXPECT_EQ(scripts[2]->Count(), 2U);
}

TEST_F(ReturnTest, RefreshThatACallerWaitsForBeginsAtTheLastEndpoint) {
  config.refresh.jitter = 0;
  FailOver();
  runtime->Pass(minutes(46));
  CallContext context;
  context.minimumLife = minutes(30);
  EXPECT_NE(Get(spec, context).token, nullptr);
  EXPECT_EQ(scripts[0]->Count(), 1U);
  EXPECT_EQ(scripts[1]->Count(), 2U);
}

TEST_F(ReturnTest, RefreshOfATokenThatTheAttemptMayOutlastStaysWithTheLastEndpoint) {
  config.refresh.fraction = 0.9;  // three minutes before the margin
  config.refresh.jitter = 0;
  config.refresh.longestMargin = minutes(3);
  config.retry.attemptTimeout = minutes(4);
  FailOver();
  runtime->Advance(minutes(56));
  EXPECT_EQ(scripts[0]->Count(), 1U);
  EXPECT_EQ(scripts[1]->Count(), 2U);
}

TEST_F(RefreshTest, ManyKeysThatAreDueInOneMomentAreAllRefreshed) {
  config.login = CertificateLogin{};
  config.holderOfKey = HolderOfKeyConfig{Tarnik::MakeRef<NamedCertificate>("own"), nullptr};
  config.refresh.jitter = 0;
  Make();
  for (int i = 0; i < 100; ++i) {
    Get(SpecFor(std::to_string(i)));
    source->TryGetToken(SpecFor(std::to_string(i)));
  }
  runtime->Advance(minutes(46));
  EXPECT_EQ(Attempts(), 200U);
}

TEST_F(RefreshTest, KeepFreshRequestsAtOnceAndWithoutCallers) {
  config.keepFresh = {spec};
  Make();
  runtime->Settle();
  EXPECT_EQ(Attempts(), 1U);
  EXPECT_NE(source->TryGetToken(spec), nullptr);
  EXPECT_FALSE(listener->Begun()[0].isRefresh);
  runtime->Advance(hours(10));
  EXPECT_GE(Attempts(), 11U);
  EXPECT_LE(Attempts(), 17U);
  EXPECT_TRUE(listener->Begun()[1].isRefresh);
}

TEST_F(RefreshTest, KeepFreshIsRepeatedWhenItFails) {
  config.keepFresh = {spec};
  ForAll(Fails(Fault()));
  Make();
  runtime->Advance(minutes(1));
  ASSERT_FALSE(listener->Refreshes().empty());
  EXPECT_FALSE(listener->Refreshes()[0].usableUntil.has_value());
  ForAll(Issues(hours(1)));
  runtime->Advance(minutes(2));
  EXPECT_NE(source->TryGetToken(spec), nullptr);
}

TEST_F(RefreshTest, InvalidatedTokenOfKeepFreshIsReplaced) {
  config.keepFresh = {spec};
  Make();
  runtime->Settle();
  const auto token = source->TryGetToken(spec);
  source->Invalidate(*token);
  EXPECT_EQ(source->TryGetToken(spec), nullptr);
  runtime->Settle();
  EXPECT_NE(source->TryGetToken(spec), nullptr);
}

TEST_F(RefreshTest, LeastUsedTokenIsEvicted) {
  config.cache.capacity = 3;
  config.keepFresh = {SpecFor("kept")};
  Make();
  runtime->Settle();
  for (const char* audience : {"a", "b", "c", "b", "d"}) {
    runtime->Advance(seconds(1));
    ASSERT_NE(Get(SpecFor(audience)).token, nullptr);
  }
  EXPECT_EQ(source->Metrics().evictions, 2U);
  EXPECT_EQ(source->Metrics().keys, 3U);
  EXPECT_NE(source->TryGetToken(SpecFor("kept")), nullptr);
  EXPECT_NE(source->TryGetToken(SpecFor("b")), nullptr);
  EXPECT_NE(source->TryGetToken(SpecFor("d")), nullptr);
}

TEST_F(RefreshTest, TokenOnBehalfOfAnotherIsNotRefreshedPastItsEnd) {
  TokenSpec actAs = spec;
  actAs.actAsToken = NewToken(minutes(30));
  Make();
  Get(actAs);
  source->TryGetToken(actAs);
  runtime->Advance(hours(2));
  EXPECT_EQ(Attempts(), 1U);
  EXPECT_EQ(source->Metrics().keys, 0U);
}

TEST_F(RefreshTest, SuspendedMachineDoesNotServeATokenThatHasEnded) {
  Make();
  Get(spec);
  runtime->MoveWallClock(hours(2));
  EXPECT_EQ(source->TryGetToken(spec), nullptr);
  EXPECT_NE(Get(spec).token, nullptr);
  EXPECT_EQ(Attempts(), 2U);
}

TEST_F(RefreshTest, ClockThatIsSetBackDoesNotProlongALife) {
  Make();
  Get(spec);
  runtime->MoveWallClock(hours(-5));
  runtime->Advance(hours(1));
  EXPECT_EQ(source->TryGetToken(spec), nullptr);
}

}  // namespace

}  // namespace SsoClient::Access::Testing
