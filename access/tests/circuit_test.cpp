#include "circuit.h"

#include <gtest/gtest.h>

namespace SsoClient::Access {

namespace {

using std::chrono::milliseconds;
using std::chrono::seconds;

class CircuitTest : public ::testing::Test {
 protected:
  static RetryConfig Config() {
    RetryConfig config;
    config.failuresToOpen = 3;
    config.firstDelay = seconds(1);
    config.longestDelay = seconds(8);
    return config;
  }

  void FailTimes(int times) {
    for (int i = 0; i < times; ++i) {
      ASSERT_TRUE(circuit.Admit(now));
      circuit.OnFailure(now, milliseconds(0), 0.0);
    }
  }

  Circuit circuit{Config()};
  Instant::Steady now{std::chrono::hours(1)};
};

TEST_F(CircuitTest, OpensOnConsecutiveFailures) {
  FailTimes(2);
  EXPECT_EQ(circuit.State(), CircuitState::kClosed);
  circuit.OnAnswer();
  FailTimes(2);
  EXPECT_TRUE(circuit.CanAdmit(now));
  FailTimes(1);
  EXPECT_EQ(circuit.State(), CircuitState::kOpen);
  EXPECT_EQ(circuit.RetryAt(), now + seconds(2));
  EXPECT_FALSE(circuit.Admit(now + milliseconds(1999)));
}

TEST_F(CircuitTest, AdmitsOneProbe) {
  FailTimes(3);
  now += seconds(2);
  EXPECT_TRUE(circuit.CanAdmit(now));
  EXPECT_EQ(circuit.State(), CircuitState::kOpen);
  EXPECT_TRUE(circuit.Admit(now));
  EXPECT_EQ(circuit.State(), CircuitState::kHalfOpen);
  EXPECT_FALSE(circuit.CanAdmit(now + seconds(100)));
  EXPECT_FALSE(circuit.Admit(now + seconds(100)));
}

TEST_F(CircuitTest, ProbeThatSucceedsClosesIt) {
  FailTimes(3);
  now += seconds(2);
  ASSERT_TRUE(circuit.Admit(now));
  circuit.OnAnswer();
  EXPECT_EQ(circuit.State(), CircuitState::kClosed);
  FailTimes(2);
  EXPECT_EQ(circuit.State(), CircuitState::kClosed);
}

TEST_F(CircuitTest, ProbeThatFailsOpensItForLonger) {
  FailTimes(3);
  now += seconds(2);
  ASSERT_TRUE(circuit.Admit(now));
  circuit.OnFailure(now, milliseconds(0), 0.0);
  EXPECT_EQ(circuit.State(), CircuitState::kOpen);
  EXPECT_EQ(circuit.RetryAt(), now + seconds(4));
}

TEST_F(CircuitTest, AbandonedProbeLetsAnotherOneProbeAtOnce) {
  FailTimes(3);
  now += seconds(2);
  ASSERT_TRUE(circuit.Admit(now));
  circuit.OnAbandoned();
  EXPECT_EQ(circuit.State(), CircuitState::kOpen);
  EXPECT_TRUE(circuit.Admit(now));
}

TEST_F(CircuitTest, AbandonedAttemptDoesNotCount) {
  FailTimes(2);
  circuit.OnAbandoned();
  EXPECT_EQ(circuit.State(), CircuitState::kClosed);
  FailTimes(1);
  EXPECT_EQ(circuit.State(), CircuitState::kOpen);
}

TEST_F(CircuitTest, AttemptsFromBeforeItOpenedDoNotPutOffTheProbe) {
  for (int i = 0; i < 50; ++i) {
    ASSERT_TRUE(circuit.Admit(now));
  }
  for (int i = 0; i < 50; ++i) {
    circuit.OnFailure(now, milliseconds(0), 0.0);
  }
  EXPECT_EQ(circuit.RetryAt(), now + seconds(2));
}

TEST_F(CircuitTest, RetryAfterHoldsAClosedCircuit) {
  circuit.OnFailure(now, seconds(10), 0.0);
  EXPECT_EQ(circuit.State(), CircuitState::kClosed);
  EXPECT_FALSE(circuit.Admit(now + milliseconds(10499)));
  EXPECT_TRUE(circuit.Admit(now + milliseconds(10500)));
}

TEST_F(CircuitTest, LaterFailuresDoNotShortenARetryAfter) {
  for (int i = 0; i < 5; ++i) {
    ASSERT_TRUE(circuit.Admit(now));
  }
  circuit.OnFailure(now, seconds(100), 0.0);
  for (int i = 0; i < 2; ++i) {
    circuit.OnFailure(now + seconds(1), milliseconds(0), 0.0);
    EXPECT_FALSE(circuit.CanAdmit(now + seconds(100))) << i;
  }
  EXPECT_EQ(circuit.State(), CircuitState::kOpen);
  circuit.OnUnclear(now + seconds(1), seconds(10), 0.0);
  EXPECT_FALSE(circuit.CanAdmit(now + seconds(100)));
  EXPECT_TRUE(circuit.CanAdmit(now + milliseconds(100500)));
}

TEST_F(CircuitTest, RetryAfterOfAnAttemptFromBeforeItOpenedCounts) {
  for (int i = 0; i < 4; ++i) {
    ASSERT_TRUE(circuit.Admit(now));
  }
  for (int i = 0; i < 3; ++i) {
    circuit.OnFailure(now, milliseconds(0), 0.0);
  }
  circuit.OnFailure(now, seconds(100), 0.0);
  EXPECT_EQ(circuit.State(), CircuitState::kOpen);
  EXPECT_FALSE(circuit.CanAdmit(now + seconds(100)));
}

TEST_F(CircuitTest, UnclearProbeLetsAnotherOneProbeAtOnce) {
  FailTimes(3);
  now += seconds(2);
  ASSERT_TRUE(circuit.Admit(now));
  circuit.OnUnclear(now, milliseconds(0), 0.0);
  EXPECT_EQ(circuit.State(), CircuitState::kOpen);
  EXPECT_TRUE(circuit.Admit(now));
}

TEST_F(CircuitTest, UnclearAttemptDoesNotCount) {
  FailTimes(2);
  circuit.OnUnclear(now, milliseconds(0), 0.0);
  EXPECT_EQ(circuit.State(), CircuitState::kClosed);
  EXPECT_TRUE(circuit.CanAdmit(now));
  FailTimes(1);
  EXPECT_EQ(circuit.RetryAt(), now + seconds(2));
  // An attempt from before the circuit opened.
  circuit.OnUnclear(now + seconds(1), milliseconds(0), 0.0);
  EXPECT_EQ(circuit.State(), CircuitState::kOpen);
  EXPECT_EQ(circuit.RetryAt(), now + seconds(2));
}

TEST_F(CircuitTest, RetryAfterOfAnUnclearAttemptHoldsAsThatOfAFailure) {
  FailTimes(1);
  circuit.OnUnclear(now, seconds(10), 0.0);
  EXPECT_EQ(circuit.State(), CircuitState::kClosed);
  EXPECT_FALSE(circuit.Admit(now + milliseconds(10999)));
  EXPECT_TRUE(circuit.Admit(now + seconds(11)));
  Circuit other{Config()};
  other.OnFailure(now, milliseconds(0), 0.0);
  other.OnFailure(now, seconds(10), 0.0);
  EXPECT_EQ(other.RetryAt(), circuit.RetryAt());
}

}  // namespace

}  // namespace SsoClient::Access
