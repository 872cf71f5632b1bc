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
    return config;
  }
  // The order in which the endpoints are asked in one round.
  std::vector<std::string> Order() {
    std::vector<std::string> order;
    EndpointSet::Asked asked(set.Size());
    while (const auto index = set.Admit(asked, now).endpoint) {
      asked[*index] = true;
      order.push_back(set.Url(*index));
    }
    return order;
  }
  EndpointSet::Change FailOnce(EndpointSet::Index index) {
    return set.OnFailure(index, "unreachable: refused", milliseconds(0), now, 0.5);
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

TEST_F(EndpointSetTest, AnswerThatIsNotPreferredChangesNoOrder) {
  set.OnAnswer(1);
  set.OnAnswer(2, false);
  EXPECT_EQ(Order(), (Urls{"https://b", "https://a", "https://c"}));
}

TEST_F(EndpointSetTest, ListedOrderBeginsAtTheFirstThatIsNotLeftOut) {
  constexpr auto kAsListed = EndpointSet::Order::kAsListed;
  const EndpointSet::Asked none(3);
  set.OnAnswer(2);
  EXPECT_EQ(set.Admit(none, now, kAsListed).endpoint.value(), 0U);
  FailOnce(0);
  FailOnce(0);
  EXPECT_EQ(set.Admit(none, now, kAsListed).endpoint.value(), 1U);
  EXPECT_EQ(set.Admit(none, now).endpoint.value(), 2U);
}

TEST_F(EndpointSetTest, OpenCircuitsAreLeftOut) {
  EXPECT_FALSE(FailOnce(0));
  const auto change = FailOnce(0);
  ASSERT_TRUE(change);
  EXPECT_EQ(change->state, CircuitState::kOpen);
  EXPECT_EQ(change->retryAfter, seconds(1));
  EXPECT_EQ(Order(), (Urls{"https://b", "https://c"}));
  EXPECT_FALSE(set.CanAdmit(0, now));
  EXPECT_EQ(set.WhyLeftOut(0, now),
            "left out for another 1000 ms; it failed before: unreachable: refused");
}

TEST_F(EndpointSetTest, ProbeChangesTheCircuit) {
  FailOnce(0);
  FailOnce(0);
  now += seconds(1);
  const auto admission = set.Admit(EndpointSet::Asked(3), now);
  ASSERT_TRUE(admission.endpoint);
  EXPECT_EQ(*admission.endpoint, 0U);
  ASSERT_TRUE(admission.change);
  EXPECT_EQ(admission.change->state, CircuitState::kHalfOpen);
  EXPECT_EQ(set.WhyLeftOut(0, now),
            "left out while another call probes it; it failed before: unreachable: refused");
  const auto closed = set.OnAnswer(0);
  ASSERT_TRUE(closed);
  EXPECT_EQ(closed->state, CircuitState::kClosed);
  EXPECT_FALSE(set.OnAnswer(0));
}

TEST_F(EndpointSetTest, AbandonedAfterTheDeadlinesOfAllPrefersTheNext) {
  set.OnAbandoned(0, false);
  EXPECT_EQ(Order()[0], "https://a");
  set.OnAbandoned(0, true);
  EXPECT_EQ(Order()[0], "https://b");
  set.OnAbandoned(0, true);
  EXPECT_EQ(Order()[0], "https://b");
  set.OnAnswer(2);
  set.OnAbandoned(2, true);
  EXPECT_EQ(Order()[0], "https://a");
}

TEST_F(EndpointSetTest, AdmissionsAreTheEarliest) {
  ASSERT_TRUE(set.ClosedAdmission());
  EXPECT_LE(*set.ClosedAdmission(), now);
  set.OnFailure(0, "", seconds(10), now, 0.0);
  set.OnFailure(1, "", seconds(20), now, 0.0);
  set.OnFailure(2, "", seconds(30), now, 0.0);
  EXPECT_EQ(*set.ClosedAdmission(), now + seconds(10));
  FailOnce(0);
  EXPECT_EQ(*set.ClosedAdmission(), now + seconds(20));
  EXPECT_EQ(set.EarliestAdmission(), now + seconds(1));
  FailOnce(1);
  FailOnce(2);
  EXPECT_FALSE(set.ClosedAdmission());
  EXPECT_FALSE(set.CanAdmit(EndpointSet::Asked(3), now));
  EXPECT_FALSE(set.Admit(EndpointSet::Asked(3), now).endpoint);
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
