#include "endpoint_set.h"

#include <gtest/gtest.h>

#include "support/scripted_endpoint.h"

namespace SsoClient::Access {

namespace {

using std::chrono::milliseconds;
using std::chrono::seconds;

using Urls = std::vector<std::string>;

class EndpointSetTest : public ::testing::Test {
 protected:
  static std::vector<std::unique_ptr<EndpointClient>> Clients() {
    std::vector<std::unique_ptr<EndpointClient>> clients;
    for (const char* url : {"https://a", "https://b", "https://c"}) {
      clients.push_back(std::make_unique<Testing::ScriptedEndpoint>(
          Endpoint{url, ""}, std::make_shared<Testing::Script>()));
    }
    return clients;
  }
  static RetryConfig Config() {
    RetryConfig config;
    config.failuresToOpen = 2;
    config.firstDelay = seconds(1);
    config.attemptsAtOnce = 6;
    return config;
  }
  // The order in which the endpoints are asked in one round.
  std::vector<std::string> Order() {
    std::vector<std::string> order;
    EndpointSet::Asked asked(set.Size());
    while (const auto index = set.TakePlace(asked, now)) {
      set.ReturnPlace(*index);
      asked[*index] = true;
      order.push_back(set.Url(*index));
    }
    return order;
  }
  EndpointSet::Change FailOnce(EndpointSet::Index index) {
    return FailOnce(index, milliseconds(0));
  }
  EndpointSet::Change FailOnce(EndpointSet::Index index, milliseconds retryAfter) {
    const Reason reason = MakeReason(FailureKind::kUnreachable, "refused");
    return set.OnFailure(index, reason, retryAfter, now, 0.5);
  }

  EndpointSet set{Config(), Clients()};
  Instant::Steady now{std::chrono::hours(1)};
};

TEST_F(EndpointSetTest, OrderIsAsConfiguredAtFirst) {
  EXPECT_EQ(Order(), (Urls{"https://a", "https://b", "https://c"}));
}

TEST_F(EndpointSetTest, LastGoodOneIsFirst) {
  set.OnAnswer(1);
  EXPECT_EQ(Order(), (Urls{"https://b", "https://a", "https://c"}));
  set.OnAnswer(2);
  EXPECT_EQ(Order(), (Urls{"https://c", "https://a", "https://b"}));
}

TEST_F(EndpointSetTest, FailedOneIsNotFirst) {
  FailOnce(1);
  EXPECT_EQ(Order(), (Urls{"https://a", "https://b", "https://c"}));
  FailOnce(0);
  EXPECT_EQ(Order(), (Urls{"https://b", "https://a", "https://c"}));
}

TEST_F(EndpointSetTest, AnswerThatIsNotPreferredChangesNoOrder) {
  set.OnAnswer(1);
  set.OnAnswer(2, false);
  EXPECT_EQ(Order(), (Urls{"https://b", "https://a", "https://c"}));
}

TEST_F(EndpointSetTest, ListedOrderBeginsAtTheFirstThatIsNotLeftOut) {
  constexpr auto kAsListed = EndpointSet::Order::kAsListed;
  const EndpointSet::Asked none(3);
  set.OnAnswer(2);
  EXPECT_EQ(set.TakePlace(none, now, kAsListed), 0U);
  FailOnce(0);
  FailOnce(0);
  EXPECT_EQ(set.TakePlace(none, now, kAsListed), 1U);
  EXPECT_EQ(set.TakePlace(none, now), 2U);
}

TEST_F(EndpointSetTest, OpenCircuitsAreLeftOut) {
  EXPECT_FALSE(FailOnce(0));
  const auto change = FailOnce(0);
  ASSERT_TRUE(change);
  EXPECT_EQ(change->state, CircuitState::kOpen);
  EXPECT_EQ(change->endpoint, 0U);
  EXPECT_EQ(change->retryAfter, milliseconds(1500));
  EXPECT_EQ(Order(), (Urls{"https://b", "https://c"}));
  EXPECT_FALSE(set.CanAdmit(0, now));
  EXPECT_EQ(set.WhyLeftOut(0, now),
            "left out for another 2 s; it failed before: unreachable: refused");
}

TEST_F(EndpointSetTest, ProbeChangesTheCircuit) {
  FailOnce(0);
  FailOnce(0);
  now += milliseconds(1500);
  EXPECT_EQ(set.TakePlace({false, true, true}, now), 0U);
  const auto begun = set.Begin(0, now);
  ASSERT_TRUE(begun);
  EXPECT_EQ(begun->state, CircuitState::kHalfOpen);
  EXPECT_EQ(set.WhyLeftOut(0, now),
            "left out while another call probes it; it failed before: unreachable: refused");
  const auto closed = set.OnAnswer(0);
  ASSERT_TRUE(closed);
  EXPECT_EQ(closed->state, CircuitState::kClosed);
  EXPECT_FALSE(set.OnAnswer(0));
}

TEST_F(EndpointSetTest, UnclearFailureChangesNoOrderAndIsTheReason) {
  const Reason reason = MakeReason(FailureKind::kHttpStatus, "503");
  EXPECT_FALSE(set.OnUnclear(0, reason, seconds(10), now, 0.5));
  EXPECT_EQ(Order(), (Urls{"https://b", "https://c"}));
  EXPECT_EQ(set.WhyLeftOut(0, now),
            "left out for another 11 s; it failed before: http-status: 503");
  now += milliseconds(10750);
  EXPECT_EQ(Order(), (Urls{"https://a", "https://b", "https://c"}));
}

TEST_F(EndpointSetTest, UnclearProbeOpensTheCircuit) {
  FailOnce(0);
  FailOnce(0);
  now += milliseconds(1500);
  set.Begin(0, now);
  const Reason reason = MakeReason(FailureKind::kHttpStatus, "503");
  const auto opened = set.OnUnclear(0, reason, milliseconds(0), now, 0.5);
  ASSERT_TRUE(opened);
  EXPECT_EQ(opened->endpoint, 0U);
  EXPECT_EQ(opened->state, CircuitState::kOpen);
  EXPECT_EQ(opened->retryAfter, milliseconds(0));
  EXPECT_TRUE(set.CanAdmit(0, now));
}

TEST_F(EndpointSetTest, AbandonedAfterTheDeadlinesOfAllPrefersTheNext) {
  set.OnAbandoned(0);
  EXPECT_EQ(Order()[0], "https://a");
  set.AskLast(0);
  EXPECT_EQ(Order()[0], "https://b");
  set.AskLast(0);
  EXPECT_EQ(Order()[0], "https://b");
  set.OnAnswer(2);
  set.AskLast(2);
  EXPECT_EQ(Order()[0], "https://a");
}

TEST_F(EndpointSetTest, AdmissionsAreTheEarliest) {
  ASSERT_TRUE(set.NextAdmission());
  EXPECT_LE(*set.NextAdmission(), now);
  FailOnce(0, seconds(10));
  FailOnce(1, seconds(20));
  FailOnce(2, seconds(30));
  EXPECT_EQ(*set.NextAdmission(), now + milliseconds(10750));
  set.OnAnswer(0);
  FailOnce(0);
  FailOnce(0);
  EXPECT_EQ(*set.NextAdmission(), now + milliseconds(1500));
  EXPECT_EQ(set.EarliestAdmission(), now + milliseconds(1500));
  // While it is probed, the next one counts.
  set.Begin(0, now + milliseconds(1500));
  EXPECT_EQ(*set.NextAdmission(), now + milliseconds(20750));
  set.OnAbandoned(0);
  FailOnce(1);
  FailOnce(2);
  EXPECT_FALSE(set.NextAdmission());
  EXPECT_FALSE(set.CanAdmit(EndpointSet::Asked(3), now));
  EXPECT_FALSE(set.TakePlace(EndpointSet::Asked(3), now));
}

TEST_F(EndpointSetTest, EachEndpointHasItsShareOfThePlaces) {
  const EndpointSet::Asked none(3);
  for (const EndpointSet::Index expected : {0U, 0U, 1U, 1U, 2U, 2U}) {
    EXPECT_TRUE(set.HasPlace(now));
    EXPECT_EQ(set.TakePlace(none, now), expected);
  }
  EXPECT_FALSE(set.HasPlace(now));
  EXPECT_FALSE(set.TakePlace(none, now));
  // It waits for a place only, and not for the circuit.
  EXPECT_TRUE(set.CanAdmit(none, now));
  set.ReturnPlace(1);
  EXPECT_FALSE(set.TakePlace({false, true, false}, now));
  EXPECT_EQ(set.TakePlace(none, now), 1U);
}

TEST_F(EndpointSetTest, PlaceOfAnEndpointThatIsLeftOutIsNotGiven) {
  FailOnce(0);
  FailOnce(0);
  EXPECT_FALSE(set.TakePlace({false, true, true}, now));
  EXPECT_EQ(set.TakePlace(EndpointSet::Asked(3), now), 1U);
}

TEST_F(EndpointSetTest, FewPlacesAreOneForEach) {
  RetryConfig config = Config();
  config.attemptsAtOnce = 1;
  EndpointSet few(config, Clients());
  for (const EndpointSet::Index expected : {0U, 1U, 2U}) {
    EXPECT_EQ(few.TakePlace(EndpointSet::Asked(3), now), expected);
  }
  EXPECT_FALSE(few.HasPlace(now));
}

TEST_F(EndpointSetTest, ClockIsWrongBeyondThirtySeconds) {
  EXPECT_FALSE(set.SetClockOffset(0, seconds(30)));
  EXPECT_FALSE(set.SetClockOffset(0, seconds(-30)));
  EXPECT_TRUE(set.SetClockOffset(0, seconds(30) + milliseconds(1)));
  EXPECT_FALSE(set.SetClockOffset(0, seconds(-40)));
  EXPECT_EQ(set.ClockOffset(0), seconds(-40));
  EXPECT_TRUE(set.SetClockOffset(0, seconds(0)));
  EXPECT_EQ(set.ClockOffset(1), seconds(0));
}

}  // namespace

}  // namespace SsoClient::Access
