// How many attempts, and calls of the login's function, are under way at once.
#include <algorithm>

#include <gtest/gtest.h>

#include <ssoclient/exceptions.h>

#include "support/source_fixture.h"

namespace SsoClient::Access::Testing {

namespace {

using Limit = Tarnik::Http::CallLimit;

class AttemptsAtOnceTest : public SourceFixture {
 protected:
  AttemptsAtOnceTest() {
    config.login = CertificateLogin{};
    config.holderOfKey = HolderOfKeyConfig{Tarnik::MakeRef<NamedCertificate>("own"), nullptr};
  }

  // Logins then need not wait for each other.
  void MakeAccepted() {
    Make();
    ASSERT_NE(Get(SpecFor("accepted")).token, nullptr);
  }
  // While an attempt is under way, all else that can happen does.
  Script::Function Holds() {
    return [this](const AttemptRequest& request, Limit&) {
      order.push_back(*request.spec.audienceRestriction.begin());
      most = std::max(most, ++underWay);
      runtime->Settle();
      --underWay;
      return Issued(NewToken(hours(1)));
    };
  }
  // Is silent until nobody waits for the attempt.
  Script::Function Silent() {
    return [this](const AttemptRequest&, Limit& limit) {
      most = std::max(most, ++underWay);
      runtime->Settle();
      while (!limit.IsCancelled() && runtime->TimersArmed() > 0) {
        runtime->Pass(milliseconds(100));
      }
      --underWay;
      return Failed<CommunicationException>(FailureKind::kTimedOut, "It is silent.");
    };
  }
  std::vector<std::shared_ptr<Reply>> AskMany(int keys, const CallContext& context = {}) {
    std::vector<std::shared_ptr<Reply>> replies;
    for (int i = 0; i < keys; ++i) {
      replies.push_back(Ask(SpecFor(std::to_string(1000 + i)), context));
    }
    return replies;
  }
  static long Answered(const std::vector<std::shared_ptr<Reply>>& replies) {
    return std::count_if(replies.begin(), replies.end(),
                         [](const auto& reply) { return reply->Has(); });
  }

  int underWay = 0;
  int most = 0;
  std::vector<std::string> order;
};

TEST_F(AttemptsAtOnceTest, AreBoundedAndServedInTheirOrder) {
  config.endpoints.resize(1);
  config.retry.attemptsAtOnce = 4;
  MakeAccepted();
  ForAll(Holds());
  const auto replies = AskMany(50);
  runtime->Settle();
  EXPECT_EQ(most, 4);
  for (const auto& reply : replies) {
    ASSERT_TRUE(reply->Has());
    EXPECT_NE(reply->token, nullptr);
  }
  ASSERT_EQ(order.size(), 50U);
  EXPECT_TRUE(std::is_sorted(order.begin(), order.end()));
}

TEST_F(AttemptsAtOnceTest, DefaultLeavesMostWorkersFree) {
  MakeAccepted();
  ForAll(Holds());
  const auto replies = AskMany(1000);
  runtime->Settle();
  EXPECT_EQ(most, 64);
  EXPECT_EQ(Answered(replies), 1000);
}

TEST_F(AttemptsAtOnceTest, NobodyOvertakesThoseWhoWait) {
  config.endpoints.resize(1);
  config.retry.attemptsAtOnce = 1;
  MakeAccepted();
  std::vector<std::shared_ptr<Reply>> replies;
  scripts[0]->Set([&](const AttemptRequest& request, Limit&) {
    order.push_back(*request.spec.audienceRestriction.begin());
    runtime->Settle();
    // Another one comes whenever a place is about to be free.
    if (replies.size() < 20) {
      replies.push_back(Ask(SpecFor(std::to_string(2000 + replies.size()))));
    }
    return Issued(NewToken(hours(1)));
  });
  const auto first = AskMany(10);
  runtime->Settle();
  ASSERT_EQ(order.size(), 30U);
  EXPECT_TRUE(std::is_sorted(order.begin(), order.end()));
}

TEST_F(AttemptsAtOnceTest, RequestThatMayNotLogInForAWhileKeepsNoPlace) {
  config.endpoints.resize(1);
  config.retry.attemptsAtOnce = 1;
  config.login = PasswordLogin{"alice", [this] { return password; }};
  MakeAccepted();
  std::shared_ptr<Reply> waiting;
  scripts[0]->Set([&](const AttemptRequest&, Limit&) {
    waiting = Ask(SpecFor("waiting"));
    runtime->Settle();
    // The caller leaves. When the attempt ends, nobody knows whether the password is accepted.
    runtime->Pass(seconds(11));
    ForAll(Issues(hours(1)));
    return Failed<CommunicationException>(FailureKind::kTimedOut, "It is silent.");
  });
  EXPECT_TRUE(Get(SpecFor("left"), Within(seconds(1))).Is<CommunicationException>());
  EXPECT_FALSE(waiting->Has());
  password = "another";
  EXPECT_NE(Get(SpecFor("other")).token, nullptr);
  password = "secret";
  runtime->Advance(seconds(1));
  EXPECT_NE(waiting->token, nullptr);
}

TEST_F(AttemptsAtOnceTest, SilentEndpointLeavesTheOtherOneItsShare) {
  config.retry.attemptsAtOnce = 4;
  MakeAccepted();
  long answeredMeanwhile = 0;
  std::vector<std::shared_ptr<Reply>> replies;
  scripts[0]->Set([&](const AttemptRequest&, Limit&) {
    most = std::max(most, ++underWay);
    runtime->Settle();
    answeredMeanwhile = Answered(replies);
    --underWay;
    return Failed<CommunicationException>(FailureKind::kTimedOut, "It is silent.");
  });
  scripts[1]->Set([&](const AttemptRequest&, Limit&) { return Issued(NewToken(hours(1))); });
  replies = AskMany(100);
  runtime->Settle();
  EXPECT_EQ(most, 2);
  EXPECT_GE(answeredMeanwhile, 98);
  for (const auto& reply : replies) {
    EXPECT_NE(reply->token, nullptr);
  }
}

TEST_F(AttemptsAtOnceTest, OpenCircuitSendsThoseWhoWaitToTheOtherEndpoint) {
  config.retry.attemptsAtOnce = 2;
  config.retry.failuresToOpen = 1;
  MakeAccepted();
  bool isSlow = true;
  scripts[0]->Set([&](const AttemptRequest&, Limit&) {
    runtime->Settle();
    return Unreachable();
  });
  scripts[1]->Set([&](const AttemptRequest&, Limit&) {
    if (std::exchange(isSlow, false)) {
      runtime->Settle();
    }
    return Issued(NewToken(hours(1)));
  });
  const auto replies = AskMany(20);
  runtime->Settle();
  for (const auto& reply : replies) {
    ASSERT_TRUE(reply->Has());
    EXPECT_NE(reply->token, nullptr);
  }
  EXPECT_EQ(scripts[0]->Count(), 2U);  // the first one was for the login that was accepted
}

TEST_F(AttemptsAtOnceTest, ThoseWhoWaitFailAtOnceWhenAllCircuitsAreOpen) {
  config.endpoints.resize(1);
  config.retry.attemptsAtOnce = 1;
  config.retry.failuresToOpen = 1;
  config.retry.attempts = 1;
  MakeAccepted();
  scripts[0]->Set([&](const AttemptRequest&, Limit&) {
    runtime->Settle();
    return Unreachable();
  });
  const auto replies = AskMany(20);
  runtime->Settle();
  EXPECT_EQ(scripts[0]->Count(), 2U);
  for (const auto& reply : replies) {
    ASSERT_TRUE(reply->Has());
    EXPECT_TRUE(reply->Is<CommunicationException>());
  }
  EXPECT_NE(replies[7]->Message().find("it failed before: unreachable: Connection refused."),
            std::string::npos);
}

TEST_F(AttemptsAtOnceTest, ThoseWhoWaitDoNotWaitForAnEndpointThatAsksARenewalToWait) {
  config.endpoints.resize(1);
  config.retry.attemptsAtOnce = 1;
  Make();
  scripts[0]->Set([&](const AttemptRequest&, Limit&) {
    const auto token = NewToken(hours(1));
    token->isRenewable = true;
    token->certificate = config.holderOfKey->certificate;
    return Issued(token);
  });
  ASSERT_NE(Get(spec).token, nullptr);
  std::shared_ptr<Reply> second;
  scripts[0]->Set([&](const AttemptRequest& request, Limit&) {
    EXPECT_EQ(request.operation, AttemptOperation::kRenewal);
    second = Ask(SpecFor("second"));
    runtime->Settle();
    return Unavailable(minutes(1));
  });
  runtime->Advance(minutes(20));
  CallContext context;
  context.minimumLife = minutes(50);
  const Reply first = Get(spec, context);
  EXPECT_EQ(scripts[0]->Count(), 2U);
  ASSERT_TRUE(second->Has());
  EXPECT_NE(second->Message().find("it failed before: http-status: HTTP status 503."),
            std::string::npos)
      << second->Message();
}

TEST_F(AttemptsAtOnceTest, WaitingForATurnEndsAtTheDeadline) {
  config.endpoints.resize(1);
  config.retry.attemptsAtOnce = 1;
  MakeAccepted();
  scripts[0]->Set([&](const AttemptRequest&, Limit&) {
    runtime->Settle();
    runtime->Pass(seconds(2));
    return Issued(NewToken(hours(1)));
  });
  const auto first = Ask(spec);
  const auto second = Ask(SpecFor("second"), Within(seconds(1)));
  const auto third = Ask(SpecFor("third"));
  runtime->Settle();
  EXPECT_NE(first->token, nullptr);
  EXPECT_EQ(second->Message(),
            "The deadline passed while the call was waiting for its turn, since as many attempts "
            "as may be are under way.");
  EXPECT_NE(third->token, nullptr);
  EXPECT_EQ(Attempts(), 3U);
}

TEST_F(AttemptsAtOnceTest, WaitingForATurnEndsWithCancellationAndStop) {
  config.endpoints.resize(1);
  config.retry.attemptsAtOnce = 1;
  MakeAccepted();
  const CancellationSource cancellation;
  std::shared_ptr<Reply> cancelled;
  scripts[0]->Set([&](const AttemptRequest&, Limit&) {
    runtime->Settle();
    cancellation.Cancel();
    runtime->Settle();
    EXPECT_TRUE(cancelled->Is<Tarnik::CancelledException>());
    source->Stop(milliseconds(0));
    return Issued(NewToken(hours(1)));
  });
  const auto first = Ask(spec);
  CallContext context;
  context.cancellation = cancellation.Token();
  cancelled = Ask(SpecFor("second"), context);
  const auto stopped = Ask(SpecFor("third"));
  runtime->Settle();
  EXPECT_TRUE(first->Is<Tarnik::InvalidStateException>());
  EXPECT_TRUE(stopped->Is<Tarnik::InvalidStateException>());
  EXPECT_EQ(Attempts(), 2U);
}

TEST_F(AttemptsAtOnceTest, AbandonedAttemptsGiveTheirPlacesBack) {
  config.endpoints.resize(1);
  config.retry.attemptsAtOnce = 8;
  MakeAccepted();
  ForAll(Silent());
  const auto abandoned = AskMany(2000, Within(seconds(1)));
  runtime->Settle();
  EXPECT_EQ(most, 8);
  EXPECT_EQ(Answered(abandoned), 2000);
  // The attempts of those who still waited for their turns were never made.
  EXPECT_EQ(Attempts(), 9U);
  EXPECT_EQ(runtime->WorkQueued(), 0U);
  most = 0;
  ForAll(Holds());
  const auto replies = AskMany(50);
  runtime->Settle();
  EXPECT_EQ(most, 8);
  for (const auto& reply : replies) {
    EXPECT_NE(reply->token, nullptr);
  }
}

TEST_F(AttemptsAtOnceTest, GateDoesNotHoldPlaces) {
  // The login was accepted too long ago, so that those with a turn wait for each other at the gate.
  config.endpoints.resize(1);
  config.retry.attemptsAtOnce = 2;
  MakeAccepted();
  bool isFirst = true;
  scripts[0]->Set([&](const AttemptRequest&, Limit&) {
    runtime->Settle();
    if (std::exchange(isFirst, false)) {
      runtime->Pass(seconds(11));
      return Fault();
    }
    return Issued(NewToken(hours(1)));
  });
  const auto replies = AskMany(20);
  runtime->Settle();
  EXPECT_EQ(Answered(replies), 20);
  EXPECT_EQ(std::count_if(replies.begin(), replies.end(),
                          [](const auto& reply) { return reply->token != nullptr; }),
            19);
}

TEST_F(AttemptsAtOnceTest, OneThatWaitsAtTheGateLeavesItsPlaceToTheOneThatHasTheGate) {
  config.endpoints.resize(1);
  config.retry.attemptsAtOnce = 1;
  MakeAccepted();
  std::shared_ptr<Reply> last;
  bool isFirst = true;
  scripts[0]->Set([&](const AttemptRequest&, Limit&) {
    if (std::exchange(isFirst, false)) {
      // The second request waits for the place only, since logins are accepted. When they no longer
      // are, the last one takes the gate, and waits for the place as well.
      runtime->Settle();
      runtime->Pass(seconds(11));
      last = Ask(SpecFor("last"));
      runtime->Settle();
      return Fault();
    }
    return Issued(NewToken(hours(1)));
  });
  const auto first = Ask(SpecFor("first"));
  const auto second = Ask(SpecFor("second"));
  runtime->Settle();
  EXPECT_TRUE(first->Is<SsoException>());
  EXPECT_NE(second->token, nullptr);
  EXPECT_NE(last->token, nullptr);
}

TEST_F(AttemptsAtOnceTest, PlaceOfOneThatLeavesBeforeItsAttemptIsGivenBack) {
  config.endpoints.resize(1);
  config.retry.attemptsAtOnce = 1;
  MakeAccepted();
  ForAll(Holds());
  const CancellationSource cancellation;
  // The second request has been given the place, and is about to run.
  source->GetTokenAsync(spec, {}, [&](const auto&, const auto*) { cancellation.Cancel(); });
  CallContext context;
  context.cancellation = cancellation.Token();
  const auto second = Ask(SpecFor("second"), context);
  runtime->Settle();
  EXPECT_TRUE(second->Is<Tarnik::CancelledException>());
  EXPECT_EQ(Attempts(), 2U);
  EXPECT_NE(Get(SpecFor("third")).token, nullptr);
}

TEST_F(AttemptsAtOnceTest, PlaceOfOneThatLeavesBeforeTheLoginsFunctionIsGivenBack) {
  config.retry.attemptsAtOnce = 1;
  bool isFirst = true;
  config.login = PasswordLogin{"alice", [&] {
                                 if (std::exchange(isFirst, false)) {
                                   runtime->Settle();
                                 }
                                 return password;
                               }};
  Make();
  const CancellationSource cancellation;
  scripts[0]->Set([&](const AttemptRequest&, Limit&) {
    cancellation.Cancel();
    return Issued(NewToken(hours(1)));
  });
  const auto first = Ask(spec);
  CallContext context;
  context.cancellation = cancellation.Token();
  const auto second = Ask(SpecFor("second"), context);
  runtime->Settle();
  EXPECT_NE(first->token, nullptr);
  EXPECT_TRUE(second->Is<Tarnik::CancelledException>());
  EXPECT_NE(Get(SpecFor("third")).token, nullptr);
}

TEST_F(AttemptsAtOnceTest, CallsOfTheLoginsFunctionAreBoundedToo) {
  config.retry.attemptsAtOnce = 4;
  bool isSlow = true;
  config.login = PasswordLogin{"alice", [&] {
                                 most = std::max(most, ++underWay);
                                 if (isSlow) {
                                   runtime->Settle();
                                 }
                                 --underWay;
                                 return password;
                               }};
  Make();
  const auto replies = AskMany(50);
  runtime->Settle();
  EXPECT_EQ(most, 4);
  EXPECT_EQ(Answered(replies), 50);
  isSlow = false;
  for (const auto& reply : replies) {
    EXPECT_NE(reply->token, nullptr);
  }
}

TEST_F(AttemptsAtOnceTest, WaitingForTheLoginsFunctionEndsAtTheDeadline) {
  config.retry.attemptsAtOnce = 1;
  bool isFirst = true;
  config.login = PasswordLogin{"alice", [&] {
                                 if (std::exchange(isFirst, false)) {
                                   runtime->Settle();
                                   runtime->Pass(seconds(2));
                                 }
                                 return password;
                               }};
  Make();
  const auto first = Ask(spec);
  const auto second = Ask(SpecFor("second"), Within(seconds(1)));
  const auto third = Ask(SpecFor("third"));
  runtime->Settle();
  EXPECT_NE(first->token, nullptr);
  EXPECT_EQ(second->Message(),
            "The deadline passed while the call was waiting for its turn to call the login's "
            "function.");
  EXPECT_NE(third->token, nullptr);
}

TEST_F(AttemptsAtOnceTest, LoginsFunctionThatFailsGivesItsPlaceBack) {
  config.retry.attemptsAtOnce = 1;
  config.login = PasswordLogin{"alice", []() -> std::string { throw SsoException("no"); }};
  Make();
  for (int i = 0; i < 5; ++i) {
    EXPECT_EQ(Get(spec).Message(), "no");
  }
}

}  // namespace

}  // namespace SsoClient::Access::Testing
