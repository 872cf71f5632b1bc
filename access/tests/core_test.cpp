#include "core.h"

#include <cstdint>
#include <set>

#include <gtest/gtest.h>

#include <ssoclient/exceptions.h>

#include "support/source_fixture.h"

namespace SsoClient::Access::Testing {

namespace {

using Limit = Tarnik::Http::CallLimit;

class CoreTest : public SourceFixture {};

TEST_F(CoreTest, TenThousandCallersOfOneKeyShareOneExchange) {
  Make();
  std::vector<std::shared_ptr<Reply>> replies;
  for (int i = 0; i < 10000; ++i) {
    replies.push_back(Ask(spec));
  }
  EXPECT_EQ(source->Metrics().callersWaiting, 10000U);
  runtime->Settle();
  EXPECT_EQ(Attempts(), 1U);
  for (const auto& reply : replies) {
    ASSERT_TRUE(reply->Has());
    ASSERT_EQ(reply->token, replies[0]->token);
  }
  ASSERT_NE(replies[0]->token, nullptr);
  const TokenSourceMetrics metrics = source->Metrics();
  EXPECT_EQ(metrics.misses, 1U);
  EXPECT_EQ(metrics.shared, 9999U);
  EXPECT_EQ(metrics.callersWaiting, 0U);
  EXPECT_EQ(metrics.logins, 1U);
}

TEST_F(CoreTest, TenThousandCallersOfOneKeyShareOneException) {
  ForAll(Fails(Fault()));
  Make();
  std::vector<std::shared_ptr<Reply>> replies;
  for (int i = 0; i < 10000; ++i) {
    replies.push_back(Ask(spec));
  }
  runtime->Settle();
  EXPECT_EQ(Attempts(), 1U);
  for (const auto& reply : replies) {
    ASSERT_TRUE(reply->Has());
    ASSERT_TRUE(reply->Is<SsoException>());
    ASSERT_EQ(reply->Message(), "The request was refused.");
  }
  // The failure is not kept.
  ForAll(Issues(hours(1)));
  EXPECT_NE(Get(spec).token, nullptr);
}

TEST_F(CoreTest, TenThousandCallersHaveTheirOwnDeadlinesAndCancellations) {
  Make();
  const CancellationSource cancellation;
  scripts[0]->Set([&](const AttemptRequest&, Limit& limit) {
    runtime->Pass(milliseconds(2500));
    cancellation.Cancel();
    runtime->Pass(milliseconds(2500));
    EXPECT_FALSE(limit.IsCancelled());
    return Issued(NewToken(hours(1)));
  });
  std::vector<std::shared_ptr<Reply>> replies;
  for (int i = 0; i < 10000; ++i) {
    CallContext context = Within(milliseconds(1000) * (1 + i % 10));
    if (i % 3 == 0) {
      context.cancellation = cancellation.Token();
    }
    replies.push_back(Ask(spec, context));
  }
  runtime->Settle();
  EXPECT_EQ(Attempts(), 1U);
  for (int i = 0; i < 10000; ++i) {
    const Reply& reply = *replies[static_cast<std::size_t>(i)];
    ASSERT_EQ(reply.calls, 1);
    const int deadline = 1 + i % 10;
    if (i % 3 == 0 && deadline > 2) {
      ASSERT_TRUE(reply.Is<Tarnik::CancelledException>()) << i;
    } else if (deadline <= 5) {
      ASSERT_TRUE(reply.Is<CommunicationException>()) << i;
    } else {
      ASSERT_NE(reply.token, nullptr) << i;
    }
  }
  EXPECT_EQ(runtime->TimersArmed(), 1U);  // that of the refresh
}

TEST_F(CoreTest, DifferentSpecsAreDifferentTokens) {
  Make();
  const Reply first = Get(spec);
  const Reply other = Get(SpecFor("https://stock.example.com"));
  EXPECT_NE(first.token, other.token);
  EXPECT_EQ(Get(spec).token, first.token);
  EXPECT_EQ(Attempts(), 2U);
  EXPECT_EQ(source->Metrics().hits, 1U);
  EXPECT_EQ(source->Metrics().keys, 2U);
}

TEST_F(CoreTest, CallerThatLeavesAtItsDeadlineDoesNotEndTheExchangeOfOthers) {
  Make();
  std::shared_ptr<Reply> hasty;
  bool wasCancelled = true;
  scripts[0]->Set([&](const AttemptRequest&, Limit& limit) {
    runtime->Pass(seconds(2));
    wasCancelled = limit.IsCancelled();
    return Issued(NewToken(hours(1)));
  });
  hasty = Ask(spec, Within(seconds(1)));
  const auto patient = Ask(spec, Within(seconds(10)));
  runtime->Settle();
  EXPECT_FALSE(wasCancelled);
  ASSERT_TRUE(hasty->Has());
  EXPECT_TRUE(hasty->Is<CommunicationException>());
  EXPECT_EQ(hasty->Message(),
            "The deadline passed while the call was waiting for the attempt at "
            "https://a.example.com/sts.");
  ASSERT_TRUE(patient->Has());
  EXPECT_NE(patient->token, nullptr);
  EXPECT_EQ(Attempts(), 1U);
}

TEST_F(CoreTest, LastCallerThatLeavesEndsTheExchange) {
  UseCertificate();
  Make();
  std::vector<bool> cancelled;
  scripts[0]->Set([&](const AttemptRequest&, Limit& limit) {
    cancelled.push_back(limit.IsCancelled());
    runtime->Pass(milliseconds(1500));
    cancelled.push_back(limit.IsCancelled());
    runtime->Pass(milliseconds(1000));
    cancelled.push_back(limit.IsCancelled());
    return Failed<CommunicationException>(FailureKind::kAbandoned, "Cancelled.");
  });
  const auto first = Ask(spec, Within(seconds(1)));
  const auto last = Ask(spec, Within(seconds(2)));
  runtime->Settle();
  EXPECT_EQ(cancelled, (std::vector<bool>{false, false, true}));
  EXPECT_TRUE(first->Is<CommunicationException>());
  EXPECT_TRUE(last->Is<CommunicationException>());
  ASSERT_EQ(listener->Ended().size(), 1U);
  EXPECT_EQ(listener->Ended()[0].failure, FailureKind::kAbandoned);
}

TEST_F(CoreTest, TokenThatArrivesAfterAllHaveLeftIsCached) {
  Make();
  scripts[0]->Set([&](const AttemptRequest&, Limit&) {
    runtime->Pass(seconds(2));
    return Issued(NewToken(hours(1)));
  });
  const auto reply = Ask(spec, Within(seconds(1)));
  runtime->Settle();
  EXPECT_TRUE(reply->Is<CommunicationException>());
  EXPECT_NE(source->TryGetToken(spec), nullptr);
}

TEST_F(CoreTest, SpecWithATextThatCannotBeSentIsRefused) {
  Make();
  TokenSpec bad = spec;
  bad.audienceRestriction = {"\x01"};
  EXPECT_THROW(source->TryGetToken(bad), Tarnik::InvalidArgumentException);
  EXPECT_TRUE(Get(bad).Is<Tarnik::InvalidArgumentException>());
  EXPECT_EQ(passwordCalls, 0);
}

TEST_F(CoreTest, CancellationEndsOneCall) {
  Make();
  const CancellationSource cancellation;
  CallContext context;
  context.cancellation = cancellation.Token();
  const auto cancelled = Ask(spec, context);
  const auto other = Ask(spec);
  cancellation.Cancel();
  runtime->Settle();
  ASSERT_TRUE(cancelled->Has());
  EXPECT_TRUE(cancelled->Is<Tarnik::CancelledException>());
  ASSERT_TRUE(other->Has());
  EXPECT_NE(other->token, nullptr);
}

TEST_F(CoreTest, CancellationOfTheOnlyCallSendsNothing) {
  Make();
  const CancellationSource cancellation;
  CallContext context;
  context.cancellation = cancellation.Token();
  const auto reply = Ask(spec, context);
  cancellation.Cancel();
  cancellation.Cancel();
  runtime->Settle();
  EXPECT_TRUE(reply->Has());
  EXPECT_EQ(Attempts(), 0U);
  EXPECT_EQ(passwordCalls, 0);
}

TEST_F(CoreTest, CancelledTokenIsRefusedAlsoForATokenInTheCache) {
  Make();
  ASSERT_NE(Get(spec).token, nullptr);
  const CancellationSource cancellation;
  cancellation.Cancel();
  CallContext context;
  context.cancellation = cancellation.Token();
  EXPECT_THROW(source->GetToken(spec, context), Tarnik::CancelledException);
  EXPECT_TRUE(Get(spec, context).Is<Tarnik::CancelledException>());
}

TEST_F(CoreTest, DeadlineSaysThatTheCallWaitedForThePassword) {
  config.login = PasswordLogin{"alice", [this] {
                                 runtime->Pass(seconds(5));
                                 return password;
                               }};
  Make();
  const Reply reply = Get(spec, Within(seconds(1)));
  EXPECT_EQ(reply.Message(),
            "The deadline passed while the call was waiting for the login's function.");
  EXPECT_EQ(Attempts(), 0U);
}

TEST_F(CoreTest, DeadlineInAPauseSaysWhatHadFailed) {
  ForAll(Fails(Unreachable()));
  config.retry.firstDelay = minutes(1);
  Make();
  const auto reply = Ask(spec, Within(seconds(1)));
  runtime->Advance(seconds(1));
  EXPECT_EQ(reply->Message(),
            "The deadline passed while the call was waiting for the next attempt. The last attempt "
            "had failed: Connection refused.");
  const std::size_t attempts = Attempts();
  runtime->Advance(hours(1));
  EXPECT_EQ(Attempts(), attempts);
}

TEST_F(CoreTest, TwoThousandAbandonedCallsLeaveNothing) {
  UseCertificate();
  Make();
  scripts[0]->Set([&](const AttemptRequest&, Limit& limit) {
    runtime->Settle();
    runtime->Pass(seconds(1));
    EXPECT_TRUE(limit.IsCancelled());
    return Failed<CommunicationException>(FailureKind::kAbandoned, "Cancelled.");
  });
  std::vector<std::shared_ptr<Reply>> replies;
  for (int i = 0; i < 2000; ++i) {
    replies.push_back(Ask(SpecFor(std::to_string(i)), Within(seconds(1))));
  }
  runtime->Settle();
  for (const auto& reply : replies) {
    ASSERT_TRUE(reply->Has());
    ASSERT_TRUE(reply->Is<CommunicationException>());
  }
  EXPECT_EQ(Attempts(), 1U);
  EXPECT_EQ(runtime->TimersArmed(), 0U);
  EXPECT_EQ(runtime->WorkQueued(), 0U);
  EXPECT_EQ(source->Metrics().callersWaiting, 0U);
  scripts[0]->Set(Issues(hours(1)));
  EXPECT_NE(Get(spec).token, nullptr);
}

TEST_F(CoreTest, LateAnswerOfAnAbandonedCallDoesNotReplaceALongerToken) {
  UseCertificate();
  Make();
  Get(SpecFor("accepted"));
  std::shared_ptr<const SamlToken> late;
  scripts[0]->Set([&](const AttemptRequest&, Limit&) {
    late = NewToken(minutes(2));
    runtime->Pass(seconds(2));  // the caller leaves, and another one gets a token meanwhile
    ForAll(Issues(hours(1)));
    EXPECT_NE(Get(spec).token, nullptr);
    return Issued(late);
  });
  Get(spec, Within(seconds(1)));
  const auto kept = source->TryGetToken(spec);
  ASSERT_NE(kept, nullptr);
  EXPECT_NE(kept, late);
  // After `Invalidate`, any token is better.
  source->Invalidate(*kept);
  ForAll(Issues(minutes(1)));
  EXPECT_NE(Get(spec).token, nullptr);
}

TEST_F(CoreTest, RefreshThatGrantsLessDoesNotReplaceALongerToken) {
  Make();
  const auto first = Get(spec).token;
  source->TryGetToken(spec);
  ForAll(Issues(seconds(1)));
  runtime->Advance(minutes(55));
  const std::size_t attempts = Attempts();
  EXPECT_GE(attempts, 2U);
  EXPECT_EQ(source->TryGetToken(spec), first);
  runtime->Advance(minutes(4));
  // Each in the middle of what is left.
  EXPECT_LE(Attempts(), attempts + 5);
  EXPECT_EQ(source->TryGetToken(spec), first);
  // A longer one is welcome.
  ForAll(Issues(hours(1)));
  runtime->Advance(seconds(29));
  EXPECT_NE(source->TryGetToken(spec), nullptr);
  EXPECT_NE(source->TryGetToken(spec), first);
}

TEST_F(CoreTest, ShorterTokenReplacesOneThatIsNotHandedOutAnyLonger) {
  Make();
  Get(spec);
  runtime->Advance(minutes(59) + seconds(31));
  ForAll(Issues(seconds(10)));
  EXPECT_NE(Get(spec).token, nullptr);
}

TEST_F(CoreTest, MinimumLifeIsKept) {
  ForAll(Issues(hours(1)));
  Make();
  const Reply first = Get(spec);
  runtime->Advance(minutes(30));
  CallContext context;
  context.minimumLife = minutes(30);
  EXPECT_EQ(source->GetToken(spec, context), first.token);
  context.minimumLife = minutes(30) + seconds(1);
  const Reply second = Get(spec, context);
  ASSERT_NE(second.token, nullptr);
  EXPECT_NE(second.token, first.token);
}

TEST_F(CoreTest, MinimumLifeThatTheServiceDoesNotGrantCostsOneExchange) {
  Make();
  CallContext context;
  context.minimumLife = hours(2);
  for (int i = 0; i < 5; ++i) {
    const Reply reply = Get(spec, context);
    EXPECT_TRUE(reply.Is<SsoException>());
    EXPECT_EQ(reply.Message(),
              "The service grants 3600 s, but the caller needs a token for 7200 s.");
  }
  EXPECT_EQ(Attempts(), 1U);
  EXPECT_NE(Get(spec).token, nullptr);
}

TEST_F(CoreTest, InvalidateCausesOneRequestForAllCallersWithTheToken) {
  Make();
  const Reply first = Get(spec);
  for (int i = 0; i < 100; ++i) {
    source->Invalidate(*first.token);
  }
  const Reply second = Get(spec);
  EXPECT_NE(second.token, first.token);
  source->Invalidate(*first.token);
  EXPECT_EQ(Get(spec).token, second.token);
  EXPECT_EQ(Attempts(), 2U);
}

TEST_F(CoreTest, TryGetTokenSendsNothing) {
  Make();
  EXPECT_EQ(source->TryGetToken(spec), nullptr);
  runtime->Settle();
  EXPECT_EQ(Attempts(), 0U);
  const Reply reply = Get(spec);
  EXPECT_EQ(source->TryGetToken(spec), reply.token);
}

TEST_F(CoreTest, CallThatFindsNoWorkerThrowsAndLeavesNothing) {
  Make();
  runtime->RefuseWork(true);
  int calls = 0;
  EXPECT_THROW(source->GetTokenAsync(spec, {}, [&](const auto&, const auto*) { ++calls; }),
               Tarnik::ResourceException);
  EXPECT_THROW(source->GetToken(spec, Within(seconds(1))), Tarnik::ResourceException);
  runtime->RefuseWork(false);
  EXPECT_NE(Get(spec).token, nullptr);
  EXPECT_THROW(
      {
        runtime->RefuseWork(true);
        source->GetTokenAsync(spec, {}, [&](const auto&, const auto*) { ++calls; });
      },
      Tarnik::ResourceException);
  runtime->RefuseWork(false);
  runtime->Advance(seconds(2));
  EXPECT_EQ(calls, 0);
}

TEST_F(CoreTest, CallbackRunsHereWhenNoWorkerIsLeftForIt) {
  Make();
  scripts[0]->Set([&](const AttemptRequest&, Limit&) {
    runtime->RefuseWork(true);
    return Issued(NewToken(hours(1)));
  });
  const Reply reply = Get(spec);
  EXPECT_EQ(reply.calls, 1);
  EXPECT_NE(reply.token, nullptr);
}

TEST_F(CoreTest, RequestsThatFindNoWorkerFailOneAfterTheOther) {
  UseCertificate();
  Make();
  scripts[0]->Set([&](const AttemptRequest&, Limit&) {
    runtime->Settle();
    runtime->RefuseWork(true);
    return Fault();
  });
  // Each has waited at the gate for the one before. Their callbacks run on this thread.
  std::set<std::uintptr_t> frames;
  int calls = 0;
  for (int i = 0; i < 500; ++i) {
    source->GetTokenAsync(SpecFor(std::to_string(i)), {}, [&](const auto&, const auto*) {
      ++calls;
      frames.insert(reinterpret_cast<std::uintptr_t>(__builtin_frame_address(0)));
    });
  }
  runtime->Settle();
  runtime->RefuseWork(false);
  EXPECT_EQ(calls, 500);
  EXPECT_LT(*frames.rbegin() - *frames.begin(), 16384U);
}

TEST_F(CoreTest, BadCallsAreRefusedBeforeAnythingIsSent) {
  Make();
  EXPECT_THROW(source->GetToken(spec, Within(milliseconds(0))), Tarnik::InvalidArgumentException);
  EXPECT_THROW(source->GetToken(spec, Within(milliseconds(-1))), Tarnik::InvalidArgumentException);
  EXPECT_TRUE(Get(spec, Within(milliseconds(-1))).Is<Tarnik::InvalidArgumentException>());
  CallContext negative;
  negative.minimumLife = seconds(-1);
  EXPECT_THROW(source->GetToken(spec, negative), Tarnik::InvalidArgumentException);
  TokenSpec noLife = spec;
  noLife.tokenLifetimeSec = 0;
  EXPECT_THROW(source->GetToken(noLife, {}), Tarnik::InvalidArgumentException);
  TokenSpec nullActAs = spec;
  nullActAs.actAsToken = std::shared_ptr<const SamlToken>();
  EXPECT_TRUE(Get(nullActAs).Is<Tarnik::InvalidArgumentException>());
  EXPECT_THROW(source->GetTokenAsync(spec, {}, nullptr), Tarnik::InvalidArgumentException);
  runtime->Advance(hours(1));
  EXPECT_EQ(Attempts(), 0U);
  EXPECT_EQ(passwordCalls, 0);
}

}  // namespace

}  // namespace SsoClient::Access::Testing
