#include <cstdint>
#include <functional>
#include <limits>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "activity.h"
#include "config_check.h"
#include "support/source_fixture.h"

namespace SsoClient::Access::Testing {

namespace {

constexpr double kNaN = std::numeric_limits<double>::quiet_NaN();
constexpr double kInfinity = std::numeric_limits<double>::infinity();

/// One extreme value of one field of the configuration.
struct Extreme {
  std::string name;
  std::function<void(TokenSourceConfig&)> set;
  bool isAccepted;
};

/// The extremes of a field from `least` on.
template <class Field>
void AddExtremes(std::vector<Extreme>& extremes, const std::string& name, Field least,
                 Field& (*field)(TokenSourceConfig&)) {
  const auto add = [&](const char* value, Field to) {
    const auto set = [field, to](TokenSourceConfig& config) { field(config) = to; };
    extremes.push_back({name + " = " + value, set, to >= least});
  };
  add("smallest", std::numeric_limits<Field>::min());
  add("-1", Field(-1));
  add("0", Field(0));
  add("1", Field(1));
  add("largest", std::numeric_limits<Field>::max());
}

template <class Rep, class Period>
void AddExtremes(std::vector<Extreme>& extremes, const std::string& name,
                 std::chrono::duration<Rep, Period>& (*field)(TokenSourceConfig&),
                 std::int64_t least = 0) {
  using Duration = std::chrono::duration<Rep, Period>;
  const auto add = [&](const char* value, Duration to) {
    const auto set = [field, to](TokenSourceConfig& config) { field(config) = to; };
    extremes.push_back({name + " = " + value, set, to >= Duration(least)});
  };
  add("smallest", Duration::min());
  add("-1", Duration(-1));
  add("0", Duration(0));
  add("1", Duration(1));
  add("300 years", std::chrono::hours(24L * 365 * 300));
  add("largest", Duration::max());
}

void AddFraction(std::vector<Extreme>& extremes, const std::string& name, double closedEnd,
                 double& (*field)(TokenSourceConfig&)) {
  for (const double value : {kNaN, kInfinity, -kInfinity, -1.0, 1.5, closedEnd}) {
    const auto set = [field, value](TokenSourceConfig& config) { field(config) = value; };
    extremes.push_back({name + " = " + std::to_string(value), set, value == closedEnd});
  }
}

std::vector<Extreme> AllExtremes() {
  using Config = TokenSourceConfig;
  std::vector<Extreme> all;
  AddExtremes<>(
      all, "longestMargin", +[](Config& c) -> seconds& { return c.refresh.longestMargin; });
  AddExtremes<>(
      all, "firstDelay", +[](Config& c) -> milliseconds& { return c.retry.firstDelay; }, 1);
  AddExtremes<>(
      all, "longestDelay", +[](Config& c) -> milliseconds& { return c.retry.longestDelay; }, 1);
  AddExtremes<>(
      all, "longestRetryAfter",
      +[](Config& c) -> milliseconds& { return c.retry.longestRetryAfter; });
  AddExtremes<>(
      all, "refusalMemory", +[](Config& c) -> seconds& { return c.retry.refusalMemory; });
  AddExtremes<int>(
      all, "attempts", 1, +[](Config& c) -> int& { return c.retry.attempts; });
  AddExtremes<int>(
      all, "attemptsAtOnce", 1, +[](Config& c) -> int& { return c.retry.attemptsAtOnce; });
  AddExtremes<int>(
      all, "failuresToOpen", 1, +[](Config& c) -> int& { return c.retry.failuresToOpen; });
  AddExtremes<std::size_t>(
      all, "capacity", 1, +[](Config& c) -> std::size_t& { return c.cache.capacity; });
  AddFraction(
      all, "fraction", 0.999999, +[](Config& c) -> double& { return c.refresh.fraction; });
  AddFraction(
      all, "jitter", 1, +[](Config& c) -> double& { return c.refresh.jitter; });
  for (const auto& [value, isAccepted] :
       {std::pair(milliseconds::min(), false), std::pair(milliseconds(0), false),
        std::pair(milliseconds(1), true), std::pair(milliseconds(seconds(240)), true),
        std::pair(milliseconds(240001), false), std::pair(milliseconds::max(), false)}) {
    all.push_back({"attemptTimeout = " + std::to_string(value.count()),
                   [value = value](Config& c) { c.retry.attemptTimeout = value; }, isAccepted});
  }
  return all;
}

class LimitsTest : public SourceFixture {
 protected:
  LimitsTest() { config.tokenFactory = CreateSamlTokenFactory(nullptr); }

  bool IsAccepted() const {
    TokenSourceConfig checked = config;
    checked.endpoints = {{"http://a.example.com/sts", ""}};
    try {
      return CreateTokenSource(checked) != nullptr;
    } catch (const Tarnik::InvalidArgumentException&) {
      return false;
    }
  }

  // A token is kept fresh, is handed out, and is not handed out after its end.
  void ExpectThatTokensEnd() {
    ForAll(Issues(hours(1)));
    Make();
    runtime->Settle();
    EXPECT_NE(Get(spec).token, nullptr);
    ForAll(Fails(Fault()));
    runtime->Advance(hours(1) - milliseconds(1));
    if (config.refresh.longestMargin > seconds(0)) {
      EXPECT_EQ(source->TryGetToken(spec), nullptr);
    }
    runtime->MoveWallClock(milliseconds(1));
    EXPECT_EQ(source->TryGetToken(spec), nullptr);
    source->Stop(milliseconds(0));
  }

  void ExpectThatRefusalIsRemembered() {
    ForAll(Fails(Refused()));
    Make();
    const std::size_t before = Attempts();
    Get(spec);
    Get(spec);
    runtime->Advance(milliseconds(900));
    Get(spec);
    EXPECT_EQ(Attempts(), before + (config.retry.refusalMemory == seconds(0) ? 3U : 1U));
    source->Stop(milliseconds(0));
  }

  // An outage ends, and then there are tokens again.
  void ExpectThatOutageEnds() {
    const TokenSpec kept = SpecFor("https://kept.example.com");
    config.keepFresh = {kept};
    ForAll(Fails(Unreachable()));
    Make();
    const auto during = Ask(spec, Within(minutes(1)));
    runtime->Advance(minutes(2));
    EXPECT_TRUE(during->Has());
    EXPECT_EQ(during->token, nullptr);
    ForAll(Issues(hours(1)));
    std::shared_ptr<Reply> after;
    for (int minute = 0; minute < 3 && (after == nullptr || after->token == nullptr); ++minute) {
      after = Ask(spec, Within(minutes(1)));
      runtime->Advance(minutes(1));
    }
    EXPECT_NE(after->token, nullptr) << after->Message();
    runtime->Advance(minutes(2));
    EXPECT_NE(source->TryGetToken(kept), nullptr);
    source->Stop(milliseconds(0));
  }
  // As many attempts as `expected`, whatever time passes.
  void ExpectNoMoreAttemptsThan(std::size_t expected) {
    const std::size_t before = Attempts();
    for (std::size_t i = 0; i < expected + 20; ++i) {
      EXPECT_EQ(Get(spec).token, nullptr);
      runtime->Advance(hours(24));
    }
    EXPECT_EQ(Attempts(), before + expected);
    source->Stop(milliseconds(0));
  }
};

TEST_F(LimitsTest, EveryExtremeIsRefusedOrWorks) {
  const TokenSourceConfig normal = config;
  for (const Extreme& extreme : AllExtremes()) {
    SCOPED_TRACE(extreme.name);
    config = normal;
    extreme.set(config);
    EXPECT_EQ(IsAccepted(), extreme.isAccepted);
    if (extreme.isAccepted) {
      ExpectThatTokensEnd();
      ExpectThatRefusalIsRemembered();
      ExpectThatOutageEnds();
    }
  }
}

TEST_F(LimitsTest, LongestRefusalMemoryDoesNotEnd) {
  config.retry.refusalMemory = seconds::max();
  ForAll(Fails(Refused()));
  Make();
  for (int i = 0; i < 10; ++i) {
    Get(spec);
    runtime->Advance(hours(24));
  }
  EXPECT_EQ(Attempts(), 1U);
}

TEST_F(LimitsTest, LongestDelaysDoNotEnd) {
  config.endpoints.resize(1);
  config.retry.attempts = 1;
  config.retry.firstDelay = milliseconds::max();
  config.retry.longestDelay = milliseconds::max();
  ForAll(Fails(Unreachable()));
  for (int failures = 1; failures <= 12; ++failures) {
    SCOPED_TRACE(failures);
    config.retry.failuresToOpen = failures;
    Make();
    ExpectNoMoreAttemptsThan(static_cast<std::size_t>(failures));
  }
}

TEST_F(LimitsTest, LongestRetryAfterDoesNotEnd) {
  config.endpoints.resize(1);
  config.retry.attempts = 1;
  config.retry.longestRetryAfter = milliseconds::max();
  for (const milliseconds asked :
       {milliseconds::max(), milliseconds(hours(24L * 365 * 300)), milliseconds(hours(1000))}) {
    SCOPED_TRACE(asked.count());
    ForAll(Fails(Unavailable(asked)));
    Make();
    ExpectNoMoreAttemptsThan(1);
  }
}

TEST_F(LimitsTest, LongestMarginIsATwentieth) {
  config.refresh.longestMargin = seconds::max();
  Make();
  Get(spec);
  ForAll(Fails(Unreachable()));
  runtime->Advance(minutes(57) - milliseconds(1));
  EXPECT_NE(source->TryGetToken(spec), nullptr);
  runtime->Advance(milliseconds(1));
  EXPECT_EQ(source->TryGetToken(spec), nullptr);
}

TEST_F(LimitsTest, MinimumLifeOfAnySizeIsHeld) {
  Make();
  Get(spec);
  ForAll(Fails(Unreachable()));
  runtime->Advance(minutes(59));
  for (const seconds minimum : {seconds::max(), seconds(hours(24L * 365 * 300)), seconds(61)}) {
    SCOPED_TRACE(minimum.count());
    CallContext context = Within(seconds(1));
    context.minimumLife = minimum;
    const auto reply = Ask(spec, context);
    runtime->Advance(seconds(1));
    EXPECT_TRUE(reply->Has());
    EXPECT_EQ(reply->token, nullptr);
  }
  for (const seconds minimum : {seconds::min(), seconds(-1)}) {
    CallContext context;
    context.minimumLife = minimum;
    EXPECT_TRUE(Get(spec, context).Is<Tarnik::InvalidArgumentException>());
  }
}

TEST_F(LimitsTest, MinimumLifeIsHeldAfterTheEndOfTheToken) {
  Make();
  Get(spec);
  ForAll(Fails(Unreachable()));
  runtime->MoveWallClock(hours(3));
  CallContext context = Within(seconds(1));
  context.minimumLife = hours(24L * 365 * 300);
  const auto reply = Ask(spec, context);
  runtime->Advance(seconds(1));
  EXPECT_TRUE(reply->Has());
  EXPECT_EQ(reply->token, nullptr);
}

TEST_F(LimitsTest, CapacityOfHalfTheRangeDoesNotSpin) {
  config.cache.capacity = std::numeric_limits<std::size_t>::max() / 2 + 1;
  config.keepFresh = {spec};
  Make();
  runtime->Settle();
  EXPECT_NE(source->TryGetToken(spec), nullptr);
}

TEST_F(LimitsTest, ManyDueKeysAreAllRefreshed) {
  config.keepFresh.clear();
  for (int i = 0; i < 200; ++i) {
    config.keepFresh.push_back(SpecFor(std::to_string(i)));
  }
  Make();
  runtime->Settle();
  EXPECT_EQ(source->Metrics().keys, 200U);
}

TEST_F(LimitsTest, DeadlinesOfAnySizeWork) {
  Make();
  CallContext context;
  context.deadline = CallContext::Clock::time_point::max() - std::chrono::nanoseconds(1);
  EXPECT_NE(Get(spec, context).token, nullptr);
  context.deadline = CallContext::Clock::time_point::min();
  EXPECT_TRUE(Get(spec, context).Is<Tarnik::InvalidArgumentException>());
}

TEST(WaitLimitsTest, AnyLimitOfAWaitWorks) {
  Activity activity;
  EXPECT_TRUE(activity.WaitUntilIdle(milliseconds::max()));
  activity.Begin();
  for (const milliseconds limit : {milliseconds::min(), milliseconds(-1), milliseconds(0)}) {
    EXPECT_FALSE(activity.WaitUntilIdle(limit));
  }
  activity.End();
}

TEST(WaitLimitsTest, DurationThatIsNotANumberIsNow) {
  using Seconds = std::chrono::duration<double>;
  for (const double value : {kNaN, -kInfinity}) {
    const auto deadline = CallContext::Within(Seconds(value)).deadline;
    EXPECT_LE(deadline, CallContext::Clock::now());
  }
  EXPECT_EQ(CallContext::Within(Seconds(kInfinity)).deadline,
            CallContext::Clock::time_point::max());
}

}  // namespace

}  // namespace SsoClient::Access::Testing
