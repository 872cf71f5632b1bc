#include "login_gate.h"

#include <gtest/gtest.h>

#include <ssoclient/exceptions.h>

#include "request.h"

namespace SsoClient::Access {

namespace {

using std::chrono::milliseconds;
using std::chrono::minutes;
using std::chrono::seconds;

using Turns = std::vector<RequestPtr>;

RequestPtr MakeRequest() {
  return std::make_shared<Request>(MakeKey(TokenSpec()), false, 1);
}

class LoginGateTest : public ::testing::Test {
 protected:
  LoginGateTest() = default;
  explicit LoginGateTest(const RetryConfig& config) : gate(config, true) {}

  Turns Leave(const RequestPtr& request, LoginVerdict verdict) {
    Turns turns;
    LoginOutcome outcome;
    outcome.verdict = verdict;
    outcome.refusal = verdict == LoginVerdict::kRefused ? refusal : Failure();
    gate.Begin(1);
    gate.Leave(1, request, outcome, now,
               [&turns](const RequestPtr& next) { turns.push_back(next); });
    return turns;
  }
  Turns Withdraw(const RequestPtr& request) {
    Turns turns;
    gate.Withdraw(request, now, [&turns](const RequestPtr& next) { turns.push_back(next); });
    return turns;
  }

  LoginGate gate{RetryConfig(), true};
  Instant::Steady now{std::chrono::hours(1)};
  const RequestPtr a = MakeRequest();
  const RequestPtr b = MakeRequest();
  const RequestPtr c = MakeRequest();
  const RequestPtr d = MakeRequest();
  const Failure refusal = Failure::Of(InvalidCredentialsException("Wrong."));
};

TEST_F(LoginGateTest, OneEntersAndTheOthersQueue) {
  EXPECT_TRUE(gate.Enter(1, a, now));
  EXPECT_FALSE(gate.Enter(1, b, now));
  EXPECT_FALSE(gate.Enter(1, c, now));
  EXPECT_TRUE(gate.Enter(1, a, now));
}

TEST_F(LoginGateTest, SecretsDoNotWaitForEachOther) {
  EXPECT_TRUE(gate.Enter(1, a, now));
  EXPECT_TRUE(gate.Enter(2, b, now));
}

TEST_F(LoginGateTest, AcceptedLoginReleasesAll) {
  gate.Enter(1, a, now);
  gate.Enter(1, b, now);
  gate.Enter(1, c, now);
  EXPECT_EQ(Leave(a, LoginVerdict::kAccepted), (Turns{b, c}));
  EXPECT_TRUE(gate.Enter(1, b, now));
  EXPECT_TRUE(gate.Enter(1, c, now));
}

TEST_F(LoginGateTest, TwoPasswordsAreUnderWayWhileTheSecretCountsAsAccepted) {
  gate.Enter(1, a, now);
  Leave(a, LoginVerdict::kAccepted);
  EXPECT_TRUE(gate.Enter(1, a, now));
  EXPECT_TRUE(gate.Enter(1, b, now));
  EXPECT_FALSE(gate.Enter(1, c, now));
  EXPECT_FALSE(gate.Enter(1, d, now));
  EXPECT_EQ(Leave(b, LoginVerdict::kAccepted), Turns{c});
  EXPECT_EQ(Withdraw(a), Turns{d});
}

TEST_F(LoginGateTest, LoginsWithoutPasswordAreNotBoundedThen) {
  LoginGate open(RetryConfig(), false);
  EXPECT_TRUE(open.Enter(1, a, now));
  EXPECT_FALSE(open.Enter(1, b, now));
  open.Begin(1);
  open.Leave(1, a, {LoginVerdict::kAccepted}, now, [](const RequestPtr&) {});
  for (int i = 0; i < 100; ++i) {
    EXPECT_TRUE(open.Enter(1, MakeRequest(), now));
  }
}

TEST_F(LoginGateTest, UnknownVerdictClosesTheGateForAGrowingPause) {
  gate.Enter(1, a, now);
  gate.Enter(1, b, now);
  gate.Enter(1, c, now);
  EXPECT_LT(gate.ClosedUntil(1), now);
  EXPECT_EQ(Leave(a, LoginVerdict::kUnknown), (Turns{b, c}));
  EXPECT_EQ(gate.ClosedUntil(1) - now, milliseconds(250));
  EXPECT_LT(gate.ClosedUntil(2), now);
  for (const auto pause : {milliseconds(500), milliseconds(1000), milliseconds(2000)}) {
    now = gate.ClosedUntil(1);
    gate.Enter(2, c, now);  // which forgets what is idle
    gate.Enter(1, b, now);
    Leave(b, LoginVerdict::kUnknown);
    EXPECT_EQ(gate.ClosedUntil(1) - now, pause);
  }
  now = gate.ClosedUntil(1);
  gate.Enter(1, b, now);
  Leave(b, LoginVerdict::kAccepted);
  EXPECT_LT(gate.ClosedUntil(1), now);
  now += minutes(1);
  gate.Enter(1, b, now);
  Leave(b, LoginVerdict::kUnknown);
  EXPECT_EQ(gate.ClosedUntil(1) - now, milliseconds(250));
}

TEST_F(LoginGateTest, PausesNoLongerGrowAfterTwiceTheLongestOne) {
  gate.Enter(1, a, now);
  Leave(a, LoginVerdict::kUnknown);
  const auto longest = RetryConfig().longestDelay;
  for (const auto& [passed, pause] : {std::pair(2 * longest - milliseconds(1), milliseconds(500)),
                                      std::pair(2 * longest, milliseconds(250))}) {
    now = gate.ClosedUntil(1) + passed;
    gate.Enter(2, c, now);  // which forgets what is idle
    Withdraw(c);
    gate.Enter(1, a, now);
    Leave(a, LoginVerdict::kUnknown);
    EXPECT_EQ(gate.ClosedUntil(1) - now, pause);
  }
}

// Refusals are forgotten at once.
class ForgetfulGateTest : public LoginGateTest {
 protected:
  ForgetfulGateTest() : LoginGateTest(Forgetful()) {}

 private:
  static RetryConfig Forgetful() {
    RetryConfig config;
    config.refusalMemory = seconds(0);
    return config;
  }
};

TEST_F(ForgetfulGateTest, VerdictEndsTheGrowthOfThePauses) {
  gate.Enter(1, a, now);
  for (const LoginVerdict verdict : {LoginVerdict::kRefused, LoginVerdict::kAccepted}) {
    Leave(a, LoginVerdict::kUnknown);
    EXPECT_EQ(gate.ClosedUntil(1) - now, milliseconds(250));
    now = gate.ClosedUntil(1);
    Leave(a, verdict);
    now += seconds(10);
    gate.Enter(1, a, now);
  }
}

TEST_F(LoginGateTest, UnknownVerdictOfAnAcceptedSecretMakesTheNextLoginTheOnlyOne) {
  gate.Enter(1, a, now);
  Leave(a, LoginVerdict::kAccepted);
  gate.Enter(1, a, now);
  Leave(a, LoginVerdict::kUnknown);
  EXPECT_LT(gate.ClosedUntil(1), now);
  EXPECT_FALSE(gate.IsAccepted(1, now));
  EXPECT_TRUE(gate.Enter(1, b, now));
  EXPECT_FALSE(gate.Enter(1, c, now));
}

TEST_F(LoginGateTest, AcceptedSecretIsTriedAgainByOneAfterSomeSeconds) {
  gate.Enter(1, a, now);
  Leave(a, LoginVerdict::kAccepted);
  now += seconds(9);
  EXPECT_TRUE(gate.Enter(1, a, now));
  EXPECT_TRUE(gate.Enter(1, b, now));
  now += seconds(1);
  EXPECT_TRUE(gate.Enter(1, b, now));
  EXPECT_FALSE(gate.Enter(1, c, now));
}

TEST_F(LoginGateTest, RefusalIsRememberedAndReleasesAll) {
  gate.Enter(1, a, now);
  gate.Enter(1, b, now);
  EXPECT_FALSE(gate.RefusalOf(1, now).IsSet());
  EXPECT_EQ(Leave(a, LoginVerdict::kRefused), Turns{b});
  EXPECT_THROW(gate.RefusalOf(1, now).Throw(), InvalidCredentialsException);
  EXPECT_FALSE(gate.RefusalOf(2, now).IsSet());
  now += minutes(5);
  EXPECT_FALSE(gate.RefusalOf(1, now).IsSet());
}

TEST_F(LoginGateTest, SuccessEndsTheMemory) {
  gate.Enter(1, a, now);
  Leave(a, LoginVerdict::kRefused);
  Leave(b, LoginVerdict::kAccepted);
  EXPECT_FALSE(gate.RefusalOf(1, now).IsSet());
}

TEST_F(LoginGateTest, RefusalClosesTheGateOfASecretThatWasAccepted) {
  gate.Enter(1, a, now);
  Leave(a, LoginVerdict::kAccepted);
  Leave(b, LoginVerdict::kRefused);
  now += minutes(5);
  EXPECT_TRUE(gate.Enter(1, b, now));
  EXPECT_FALSE(gate.Enter(1, c, now));
}

TEST_F(LoginGateTest, UndecidedLoginGivesTheGateToTheNext) {
  gate.Enter(1, a, now);
  gate.Enter(1, b, now);
  gate.Enter(1, c, now);
  EXPECT_EQ(Leave(a, LoginVerdict::kUndecided), Turns{b});
  // The gate is kept for the one whose turn it is.
  EXPECT_FALSE(gate.Enter(1, a, now));
  EXPECT_TRUE(gate.Enter(1, b, now));
  EXPECT_EQ(Leave(b, LoginVerdict::kUndecided), Turns{c});
  EXPECT_EQ(Leave(c, LoginVerdict::kUndecided), Turns{a});
  EXPECT_EQ(Leave(a, LoginVerdict::kUndecided), Turns{});
}

TEST_F(LoginGateTest, WithdrawnRequestGetsNoTurn) {
  gate.Enter(1, a, now);
  gate.Enter(1, b, now);
  gate.Enter(1, c, now);
  EXPECT_EQ(Withdraw(b), Turns{});
  EXPECT_EQ(Withdraw(a), Turns{c});
  EXPECT_EQ(Withdraw(a), Turns{});
}

TEST_F(LoginGateTest, RefusalOfALongLoginIsRememberedAlthoughTheSecretWasAcceptedLongBefore) {
  gate.Enter(1, a, now);
  Leave(a, LoginVerdict::kAccepted);
  gate.Enter(1, a, now);
  gate.Begin(1);
  now += minutes(1);
  gate.Enter(2, b, now);  // which forgets what is idle
  gate.Leave(1, a, {LoginVerdict::kRefused, refusal}, now, [](const RequestPtr&) {});
  EXPECT_TRUE(gate.RefusalOf(1, now).IsSet());
}

TEST_F(LoginGateTest, RequestsThatAreGoneAreNotKept) {
  const std::weak_ptr<Request> weak = [this] {
    const auto gone = MakeRequest();
    gate.Enter(1, a, now);
    gate.Enter(1, gone, now);
    Withdraw(gone);
    return gone;
  }();
  EXPECT_TRUE(weak.expired());
}

}  // namespace

}  // namespace SsoClient::Access
