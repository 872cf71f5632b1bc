#include <gtest/gtest.h>

#include <ssoclient/exceptions.h>

#include "support/source_fixture.h"

namespace SsoClient::Access::Testing {

namespace {

using Limit = Tarnik::Http::CallLimit;

// ---- failover

class FailoverTest : public SourceFixture {};

class FailoverKindTest : public SourceFixture, public ::testing::WithParamInterface<FailureKind> {};

TEST_P(FailoverKindTest, NextEndpointIsAskedAtOnce) {
  scripts[0]->Set(Fails(Failed<CommunicationException>(GetParam(), "It did not answer.")));
  Make();
  EXPECT_NE(Get(spec).token, nullptr);
  EXPECT_EQ(scripts[0]->Count(), 1U);
  EXPECT_EQ(scripts[1]->Count(), 1U);
}

INSTANTIATE_TEST_SUITE_P(Undecided, FailoverKindTest,
                         ::testing::Values(FailureKind::kUnreachable, FailureKind::kTlsTrust,
                                           FailureKind::kTlsName, FailureKind::kTls,
                                           FailureKind::kTimedOut, FailureKind::kCutOff,
                                           FailureKind::kHttpStatus));

class DecisionKindTest : public SourceFixture, public ::testing::WithParamInterface<FailureKind> {};

TEST_P(DecisionKindTest, NoOtherEndpointIsAsked) {
  ForAll(Fails(Failed<SsoException>(GetParam(), "It is decided.")));
  Make();
  const Reply reply = Get(spec);
  EXPECT_TRUE(reply.Is<SsoException>());
  EXPECT_EQ(reply.Message(), "It is decided.");
  EXPECT_EQ(scripts[0]->Count(), 1U);
  EXPECT_EQ(scripts[1]->Count(), 0U);
}

INSTANTIATE_TEST_SUITE_P(Decided, DecisionKindTest,
                         ::testing::Values(FailureKind::kFault, FailureKind::kBadToken,
                                           FailureKind::kBadAnswer, FailureKind::kRefusedLogin,
                                           FailureKind::kExpiredPassword, FailureKind::kLocal,
                                           FailureKind::kSecretFailed));

TEST_F(FailoverTest, LastGoodEndpointIsAskedFirst) {
  scripts[0]->Set(Fails(Unreachable()));
  Make();
  for (int i = 0; i < 20; ++i) {
    EXPECT_NE(Get(SpecFor("https://" + std::to_string(i))).token, nullptr);
  }
  EXPECT_EQ(scripts[0]->Count(), 1U);
  EXPECT_EQ(scripts[1]->Count(), 20U);
}

TEST_F(FailoverTest, AttemptsAreLimitedAndEveryReasonIsInTheMessage) {
  scripts[0]->Set(Fails(Unreachable()));
  scripts[1]->Set(Fails(Unavailable(seconds(0))));
  Make();
  const auto reply = Ask(spec);
  runtime->Advance(minutes(5));
  ASSERT_TRUE(reply->Has());
  EXPECT_TRUE(reply->Is<CommunicationException>());
  EXPECT_EQ(reply->Message(),
            "No endpoint has given a token. https://a.example.com/sts: unreachable: Connection "
            "refused. https://b.example.com/sts: http-status: HTTP status 503.");
  EXPECT_EQ(Attempts(), 4U);
  const auto ended = listener->Ended();
  ASSERT_EQ(ended.size(), 4U);
  for (int i = 0; i < 4; ++i) {
    EXPECT_EQ(ended[static_cast<std::size_t>(i)].number, i + 1);
  }
}

TEST_F(FailoverTest, ExceptionOfASingleEndpointIsUnchanged) {
  config.endpoints.resize(1);
  config.retry.attempts = 1;
  ForAll(Fails(Failed<SsoException>(FailureKind::kHttpStatus, "No fault.")));
  Make();
  const Reply reply = Get(spec);
  EXPECT_TRUE(reply.Is<SsoException>());
  EXPECT_EQ(reply.Message(), "No fault.");
}

TEST_F(FailoverTest, PauseBetweenRoundsIsRandomAndGrows) {
  config.endpoints.resize(1);
  config.retry.failuresToOpen = 100;
  config.retry.attempts = 5;
  config.retry.firstDelay = milliseconds(1000);
  config.retry.longestDelay = milliseconds(3000);
  ForAll(Fails(Unreachable()));
  runtime->SetDraw([] { return 0.999999; });
  Make();
  const auto begun = runtime->Now().steady;
  std::vector<long> times;
  scripts[0]->Set([&](const AttemptRequest&, Limit&) {
    times.push_back(
        std::chrono::duration_cast<milliseconds>(runtime->Now().steady - begun).count());
    return Unreachable();
  });
  Ask(spec);
  runtime->Advance(minutes(1));
  EXPECT_EQ(times, (std::vector<long>{0, 999, 2998, 5997, 8996}));
}

TEST_F(FailoverTest, RetryAfterIsHonouredUpToTheLimit) {
  config.endpoints.resize(1);
  config.retry.longestRetryAfter = seconds(20);
  config.retry.firstDelay = milliseconds(0);
  std::vector<Instant::Steady> times;
  scripts[0]->Set([&](const AttemptRequest&, Limit&) {
    times.push_back(runtime->Now().steady);
    return Unavailable(times.size() == 1 ? seconds(7) : hours(1));
  });
  Make();
  Ask(spec);
  runtime->Advance(hours(1));
  ASSERT_EQ(times.size(), 3U);
  EXPECT_EQ(times[1] - times[0], seconds(7));
  EXPECT_EQ(times[2] - times[1], seconds(20));
}

TEST_F(FailoverTest, RetryAfterOfOneEndpointDoesNotDelayTheOther) {
  scripts[0]->Set([&](const AttemptRequest&, Limit&) {
    return scripts[0]->Count() == 1 ? Unreachable() : Issued(NewToken(hours(1)));
  });
  scripts[1]->Set(Fails(Unavailable(minutes(5))));
  Make();
  const auto reply = Ask(spec);
  runtime->Advance(seconds(2));
  ASSERT_TRUE(reply->Has());
  EXPECT_NE(reply->token, nullptr);
  EXPECT_EQ(scripts[1]->Count(), 1U);
}

TEST_F(FailoverTest, PauseIsNotShorterThanTheEndpointIsLeftOut) {
  config.endpoints.resize(1);
  config.retry.attempts = 2;
  // Each failure draws once for the endpoint, and then once for the call.
  scripts[0]->Set([&](const AttemptRequest&, Limit&) {
    runtime->SetDraw([draw = 1.8]() mutable { return draw -= 0.9; });
    const bool isFirst = scripts[0]->Count() == 1;
    return isFirst ? Unavailable(seconds(5)) : Issued(NewToken(hours(1)));
  });
  Make();
  const auto reply = Ask(spec);
  runtime->Advance(seconds(10));
  ASSERT_TRUE(reply->Has());
  EXPECT_NE(reply->token, nullptr);
}

TEST_F(FailoverTest, AttemptThatFailsAfterAllHaveLeftDoesNotCount) {
  UseCertificate();
  config.endpoints.resize(1);
  config.retry.failuresToOpen = 1;
  scripts[0]->Set([&](const AttemptRequest&, Limit&) {
    runtime->Pass(seconds(2));
    return Unreachable();
  });
  Make();
  Get(spec, Within(seconds(1)));
  ASSERT_EQ(listener->Ended().size(), 1U);
  EXPECT_EQ(listener->Ended()[0].failure, FailureKind::kAbandoned);
  EXPECT_TRUE(listener->Circuits().empty());
}

TEST_F(FailoverTest, CallWhileTheOnlyEndpointAsksToWaitFailsAtOnce) {
  config.endpoints.resize(1);
  config.retry.attempts = 1;
  ForAll(Fails(Unavailable(seconds(30))));
  runtime->SetDraw([] { return 0.0; });
  Make();
  Get(spec);
  const Reply reply = Get(spec);
  EXPECT_TRUE(reply.Is<CommunicationException>());
  EXPECT_EQ(reply.Message(),
            "No endpoint has given a token. https://a.example.com/sts: left out for another 31 s; "
            "it failed before: http-status: HTTP status 503.");
  EXPECT_EQ(Attempts(), 1U);
}

TEST_F(FailoverTest, CircuitOpensProbesAndCloses) {
  config.endpoints.resize(1);
  config.retry.attempts = 1;
  config.retry.failuresToOpen = 3;
  config.retry.firstDelay = seconds(1);
  runtime->SetDraw([] { return 0.0; });
  ForAll(Fails(Unreachable()));
  Make();
  for (int i = 0; i < 3; ++i) {
    Get(spec);
  }
  ASSERT_EQ(listener->Circuits().size(), 1U);
  EXPECT_EQ(listener->Circuits()[0].state, CircuitState::kOpen);
  EXPECT_EQ(listener->Circuits()[0].retryAfter, seconds(2));
  EXPECT_EQ(listener->Circuits()[0].endpoint, "https://a.example.com/sts");
  EXPECT_EQ(listener->Circuits()[0].source, "orders");
  // Left out: nothing is sent.
  for (int i = 0; i < 10; ++i) {
    EXPECT_TRUE(Get(spec).Is<CommunicationException>());
  }
  EXPECT_EQ(Attempts(), 3U);
  // A probe that fails opens it for longer.
  runtime->Advance(seconds(2));
  Get(spec);
  Get(spec);
  EXPECT_EQ(Attempts(), 4U);
  runtime->Advance(seconds(4));
  ForAll(Issues(hours(1)));
  EXPECT_NE(Get(spec).token, nullptr);
  std::vector<CircuitState> states;
  for (const CircuitRecord& record : listener->Circuits()) {
    states.push_back(record.state);
  }
  EXPECT_EQ(states, (std::vector<CircuitState>{CircuitState::kOpen, CircuitState::kHalfOpen,
                                               CircuitState::kOpen, CircuitState::kHalfOpen,
                                               CircuitState::kClosed}));
}

TEST_F(FailoverTest, OnlyOneCallerProbes) {
  config.endpoints.resize(1);
  config.retry.attempts = 1;
  config.retry.failuresToOpen = 1;
  Make();
  Get(SpecFor("https://first.example.com"));  // after which logins need not wait for each other
  scripts[0]->Set(Fails(Unreachable()));
  Get(spec);
  runtime->Advance(seconds(1));
  std::shared_ptr<Reply> other;
  scripts[0]->Set([&](const AttemptRequest&, Limit&) {
    other = Ask(SpecFor("https://other.example.com"));
    runtime->Settle();
    return Issued(NewToken(hours(1)));
  });
  EXPECT_NE(Get(spec).token, nullptr);
  EXPECT_EQ(scripts[0]->Count(), 3U);
  ASSERT_TRUE(other->Has());
  EXPECT_EQ(other->Message(),
            "No endpoint has given a token. https://a.example.com/sts: left out while another call "
            "probes it; it failed before: unreachable: Connection refused.");
}

TEST_F(FailoverTest, DeadEndpointCostsOneAttemptABackOff) {
  config.retry.firstDelay = seconds(10);
  runtime->SetDraw([] { return 0.5; });
  scripts[0]->Set(Fails(Unreachable()));
  // The other endpoint fails often enough that the dead one is looked for, but is not left out.
  int answers = 0;
  scripts[1]->Set([&](const AttemptRequest&, Limit&) {
    return ++answers % 2 == 0 ? Unreachable() : Issued(NewToken(milliseconds(100)));
  });
  Make();
  for (int calls = 0; calls < 3000; ++calls) {
    const auto reply = Ask(spec, Within(milliseconds(150)));
    runtime->Advance(milliseconds(200));
    ASSERT_TRUE(reply->Has());
  }
  // In 600 seconds: three until the circuit opens, then after 20, 30, 30 ... seconds.
  EXPECT_GE(scripts[0]->Count(), 15U);
  EXPECT_LE(scripts[0]->Count(), 25U);
  EXPECT_GE(scripts[1]->Count(), 2900U);
}

TEST_F(FailoverTest, EndpointThatIsSilentLongerThanAllDeadlinesIsAskedLast) {
  UseCertificate();
  scripts[0]->Set([&](const AttemptRequest&, Limit&) {
    runtime->Pass(seconds(3));
    return Failed<CommunicationException>(FailureKind::kAbandoned, "Cancelled.");
  });
  Make();
  EXPECT_TRUE(Get(spec, Within(seconds(2))).Is<CommunicationException>());
  EXPECT_NE(Get(spec, Within(seconds(2))).token, nullptr);
  // Nobody knows whether it is dead.
  EXPECT_TRUE(listener->Circuits().empty());
}

// A silent endpoint must not delay each key in turn.
TEST_F(FailoverTest, TimeOutOfOneKeyMovesTheOthersToTheNextEndpoint) {
  config.keepFresh = {SpecFor("a"), SpecFor("b"), SpecFor("c")};
  scripts[0]->Set([&](const AttemptRequest&, Limit& limit) {
    runtime->Settle();
    runtime->Pass(
        std::chrono::duration_cast<milliseconds>(limit.Deadline() - runtime->Now().steady));
    return Failed<CommunicationException>(FailureKind::kTimedOut, "It is silent.");
  });
  Make();
  runtime->Advance(config.retry.attemptTimeout + seconds(2));
  for (const TokenSpec& kept : config.keepFresh) {
    EXPECT_NE(source->TryGetToken(kept), nullptr);
  }
  EXPECT_EQ(scripts[0]->Count(), 1U);
}

TEST_F(FailoverTest, SuccessEndsThePausesOfOthers) {
  config.endpoints.resize(1);
  config.retry.failuresToOpen = 2;
  config.retry.firstDelay = minutes(10);
  config.retry.longestDelay = minutes(10);
  ForAll(Fails(Unreachable()));
  Make();
  runtime->SetDraw([] { return 0.9; });
  const auto pausing = Ask(spec);
  runtime->Settle();
  ASSERT_EQ(Attempts(), 1U);
  // Another failure opens the circuit for five and a half minutes.
  runtime->SetDraw([] { return 0.1; });
  EXPECT_TRUE(Get(SpecFor("https://other.example.com")).Is<CommunicationException>());
  ASSERT_EQ(Attempts(), 2U);
  runtime->Advance(seconds(330));
  ForAll(Issues(hours(1)));
  EXPECT_FALSE(pausing->Has());
  EXPECT_NE(Get(SpecFor("https://other.example.com")).token, nullptr);
  ASSERT_TRUE(pausing->Has());
  EXPECT_NE(pausing->token, nullptr);
}

// ---- what the listener sees

class OutcomeReportTest : public SourceFixture {};

TEST_F(OutcomeReportTest, AttemptsAreReportedAndCounted) {
  scripts[0]->Set([&](const AttemptRequest&, Limit&) {
    runtime->Pass(milliseconds(250));
    return Unavailable(seconds(0));
  });
  Make();
  Get(spec);
  const auto begun = listener->Begun();
  const auto ended = listener->Ended();
  ASSERT_EQ(begun.size(), 2U);
  ASSERT_EQ(ended.size(), 2U);
  EXPECT_EQ(begun[0].id, ended[0].id);
  EXPECT_NE(begun[0].id, begun[1].id);
  EXPECT_EQ(begun[0].source, "orders");
  EXPECT_EQ(begun[0].endpoint, "https://a.example.com/sts");
  EXPECT_EQ(begun[0].operation, AttemptOperation::kLogin);
  EXPECT_FALSE(begun[0].isRefresh);
  EXPECT_EQ(ended[0].duration, milliseconds(250));
  EXPECT_EQ(ended[0].failure, FailureKind::kHttpStatus);
  EXPECT_EQ(ended[0].httpStatus, 503);
  EXPECT_EQ(ended[0].message, "HTTP status 503.");
  EXPECT_EQ(ended[1].failure, FailureKind::kNone);
  EXPECT_EQ(ended[1].endpoint, "https://b.example.com/sts");
  const TokenSourceMetrics metrics = source->Metrics();
  ASSERT_EQ(metrics.attempts.size(), static_cast<std::size_t>(FailureKind::kLocal) + 1);
  EXPECT_EQ(metrics.attempts[0], 1U);
  EXPECT_EQ(metrics.attempts[static_cast<std::size_t>(FailureKind::kHttpStatus)], 1U);
  ASSERT_TRUE(metrics.earliestExpiration.has_value());
  EXPECT_EQ(*metrics.earliestExpiration, source->TryGetToken(spec)->ExpirationTime());
}

TEST_F(OutcomeReportTest, WrongClockIsReportedWhenItBeginsAndCeases) {
  milliseconds offset = seconds(90);
  scripts[0]->Set([&](const AttemptRequest&, Limit&) {
    AttemptOutcome outcome = Issued(NewToken(hours(1)));
    outcome.clockOffset = offset;
    return outcome;
  });
  Make();
  for (int i = 0; i < 3; ++i) {
    Get(SpecFor(std::to_string(i)));
  }
  offset = seconds(-30);
  Get(SpecFor("3"));
  offset = seconds(-31);
  Get(SpecFor("4"));
  ASSERT_EQ(listener->Clocks().size(), 3U);
  EXPECT_EQ(listener->Clocks()[0].offset, seconds(90));
  EXPECT_EQ(listener->Clocks()[0].endpoint, "https://a.example.com/sts");
  EXPECT_EQ(listener->Clocks()[1].offset, seconds(-30));
  EXPECT_EQ(listener->Clocks()[2].offset, seconds(-31));
}

TEST_F(OutcomeReportTest, LifetimeCountsByTheClockOfTheService) {
  // The service is 20 minutes ahead, so that its token of 30 minutes seems to have 50.
  scripts[0]->Set([&](const AttemptRequest&, Limit&) {
    const auto start = std::chrono::duration_cast<std::chrono::microseconds>(
        (runtime->Now().wall + minutes(20)).time_since_epoch());
    AttemptOutcome outcome = Issued(std::make_shared<IssuedToken>(
        "_ahead", start.count(), (start + std::chrono::microseconds(minutes(30))).count()));
    outcome.clockOffset = minutes(20);
    return outcome;
  });
  Make();
  Get(spec);
  ForAll(Fails(Fault()));
  runtime->Advance(minutes(30) - seconds(31));
  EXPECT_NE(source->TryGetToken(spec), nullptr);
  runtime->Advance(seconds(1));
  EXPECT_EQ(source->TryGetToken(spec), nullptr);
}

TEST_F(OutcomeReportTest, DeviationsAreReportedAndTheTokenIsHandedOut) {
  scripts[0]->Set([&](const AttemptRequest&, Limit&) {
    AttemptOutcome outcome = Issued(NewToken(hours(1)));
    outcome.deviations.push_back({"", "", "subject", "alice", "bob"});
    return outcome;
  });
  Make();
  EXPECT_NE(Get(spec).token, nullptr);
  ASSERT_EQ(listener->Deviations().size(), 1U);
  EXPECT_EQ(listener->Deviations()[0].source, "orders");
  EXPECT_EQ(listener->Deviations()[0].endpoint, "https://a.example.com/sts");
  EXPECT_EQ(listener->Deviations()[0].issued, "bob");
  EXPECT_EQ(source->Metrics().deviations, 1U);
}

TEST_F(OutcomeReportTest, TokenThatHasEndedIsAFailure) {
  ForAll(Issues(seconds(-1)));
  Make();
  const Reply reply = Get(spec);
  EXPECT_TRUE(reply.Is<SsoException>());
  EXPECT_EQ(reply.Message(), "The service issued a token that has ended already.");
}

TEST_F(OutcomeReportTest, EmptyTokenIsAFailure) {
  ForAll(Fails(AttemptOutcome()));
  Make();
  EXPECT_TRUE(Get(spec).Is<SsoException>());
  EXPECT_EQ(listener->Ended()[0].failure, FailureKind::kBadToken);
}

TEST_F(OutcomeReportTest, ShortageOfMemoryInAnAttemptEndsIt) {
  ForAll([](const AttemptRequest&, Limit&) -> AttemptOutcome { throw std::bad_alloc(); });
  Make();
  EXPECT_TRUE(Get(spec).Is<Tarnik::ResourceException>());
  ForAll(Issues(hours(1)));
  EXPECT_NE(Get(spec).token, nullptr);
}

}  // namespace

}  // namespace SsoClient::Access::Testing
