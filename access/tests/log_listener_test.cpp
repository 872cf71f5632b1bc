#include <string>
#include <vector>

#include <gtest/gtest.h>

#include <ssoclient/access/listener.h>
#include <tarnik/service/log.h>

namespace SsoClient::Access {

namespace {

class LogListenerTest : public ::testing::Test {
 protected:
  LogListenerTest() {
    Tarnik::Service::SetLogLevel("TokenSource", 9);
    Tarnik::Service::SetLogSink([this](const Tarnik::Service::LogRecord& record) {
      EXPECT_EQ(record.logger, "TokenSource");
      lines.push_back(std::to_string(record.level) + " " + std::string(record.text));
    });
  }
  ~LogListenerTest() override {
    Tarnik::Service::SetLogSink({});
    Tarnik::Service::SetLogLevel("TokenSource", 4);
  }

  static AttemptRecord Attempt(FailureKind kind) {
    AttemptRecord record;
    record.source = "orders";
    record.id = 7;
    record.endpoint = "https://sts";
    record.operation = AttemptOperation::kRenewal;
    record.number = 2;
    record.duration = std::chrono::milliseconds(120);
    record.failure = kind;
    record.message = kind == FailureKind::kNone ? "" : "No.";
    record.httpStatus = 500;
    return record;
  }

  const std::shared_ptr<AccessListener> listener = CreateLogListener();
  std::vector<std::string> lines;
};

using Lines = std::vector<std::string>;

TEST_F(LogListenerTest, AttemptsThatSucceedAreAtLevelSix) {
  listener->OnAttemptBegun(Attempt(FailureKind::kNone));
  listener->OnAttemptEnded(Attempt(FailureKind::kNone));
  EXPECT_EQ(
      lines,
      (Lines{"6 Source 'orders': attempt 7 begun: renewal at https://sts, number 2",
             "6 Source 'orders': attempt 7 has succeeded: renewal at https://sts in 120 ms"}));
}

TEST_F(LogListenerTest, FailuresAreAtLevelThreeAndRefusalsAtLevelTwo) {
  listener->OnAttemptEnded(Attempt(FailureKind::kFault));
  listener->OnAttemptEnded(Attempt(FailureKind::kRefusedLogin));
  listener->OnAttemptEnded(Attempt(FailureKind::kExpiredPassword));
  listener->OnAttemptEnded(Attempt(FailureKind::kAbandoned));
  const std::string text =
      " Source 'orders': attempt 7 has failed: renewal at https://sts in 120 ms, HTTP status 500: ";
  EXPECT_EQ(lines, (Lines{"3" + text + "fault: No.", "2" + text + "refused-login: No.",
                          "2" + text + "expired-password: No.", "6" + text + "abandoned: No."}));
}

TEST_F(LogListenerTest, WhatAnAttemptDoesNotHaveIsNotWritten) {
  AttemptRecord attempt = Attempt(FailureKind::kSecretFailed);
  attempt.source.clear();
  attempt.endpoint.clear();
  attempt.httpStatus = 0;
  listener->OnAttemptBegun(attempt);
  listener->OnAttemptEnded(attempt);
  EXPECT_EQ(lines,
            (Lines{"6 Source: attempt 7 begun: renewal, number 2",
                   "3 Source: attempt 7 has failed: renewal in 120 ms: secret-failed: No."}));
}

TEST_F(LogListenerTest, RefreshesAndDeviationsAreWritten) {
  RefreshFailureRecord refresh;
  refresh.source = "orders";
  refresh.failure = FailureKind::kTimedOut;
  refresh.message = "Silent.";
  refresh.nextAttempt = std::chrono::milliseconds(1500);
  listener->OnRefreshFailed(refresh);
  refresh.usableUntil = Tarnik::System::DateTimeFromUtc(0, false);
  listener->OnRefreshFailed(refresh);
  listener->OnDeviation({"orders", "https://sts", "subject", "alice", "bob"});
  const std::string failed = "3 Source 'orders': refresh has failed, next one in 1500 ms, ";
  EXPECT_EQ(
      lines,
      (Lines{failed + "there is no token: timed-out: Silent.",
             failed + "the token is usable until 1970-01-01T00:00:00.000Z: timed-out: Silent.",
             "4 Source 'orders': https://sts has issued a token with another subject than asked: "
             "'bob' for 'alice'"}));
}

TEST_F(LogListenerTest, OnlyAnOpenCircuitHasATimeOfItsNextProbe) {
  listener->OnCircuit({"orders", "https://sts", CircuitState::kOpen, std::chrono::seconds(2)});
  listener->OnCircuit({"orders", "https://sts", CircuitState::kHalfOpen, {}});
  listener->OnCircuit({"orders", "https://sts", CircuitState::kClosed, {}});
  const std::string circuit = "4 Source 'orders': circuit of https://sts is ";
  EXPECT_EQ(lines, (Lines{circuit + "open, next probe in 2000 ms", circuit + "half-open",
                          circuit + "closed"}));
}

TEST_F(LogListenerTest, ClockIsFastOrSlowByWholeSeconds) {
  for (const int offset : {90'000, -90'000, -89'600, 400, -400}) {
    listener->OnClock({"orders", "https://sts", std::chrono::milliseconds(offset)});
  }
  const std::string clock = "4 Source 'orders': the clock of https://sts ";
  EXPECT_EQ(lines,
            (Lines{clock + "is fast by 90 s", clock + "is slow by 90 s", clock + "is slow by 90 s",
                   clock + "agrees with this system's", clock + "agrees with this system's"}));
}

TEST_F(LogListenerTest, ListenerDoesNothingByDefault) {
  AccessListener none;
  none.OnAttemptBegun({});
  none.OnAttemptEnded({});
  none.OnRefreshFailed({});
  none.OnCircuit({});
  none.OnClock({});
  none.OnDeviation({});
  EXPECT_TRUE(lines.empty());
}

}  // namespace

}  // namespace SsoClient::Access
