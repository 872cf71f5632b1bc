#include <atomic>
#include <stdexcept>
#include <thread>

#include <gtest/gtest.h>

#include <ssoclient/exceptions.h>

#include "support/source_fixture.h"

namespace SsoClient::Access::Testing {

namespace {

using Limit = Tarnik::Http::CallLimit;

// ---- the functions of the login

class LoginFunctionTest : public SourceFixture {};

TEST_F(LoginFunctionTest, ItsExceptionReachesTheCallersAndNothingIsSentOrKept) {
  bool isBroken = true;
  config.login = PasswordLogin{"alice", [&]() -> std::string {
                                 if (isBroken) {
                                   throw Tarnik::IOException("The vault does not answer.");
                                 }
                                 return "secret";
                               }};
  Make();
  const Reply reply = Get(spec);
  EXPECT_TRUE(reply.Is<Tarnik::IOException>());
  EXPECT_EQ(reply.Message(), "The vault does not answer.");
  EXPECT_EQ(Attempts(), 0U);
  isBroken = false;
  EXPECT_NE(Get(spec).token, nullptr);
}

TEST_F(LoginFunctionTest, ExceptionOfAnotherLibraryReachesBlockedCallersUnchanged) {
  config.login =
      PasswordLogin{"alice", []() -> std::string { throw std::out_of_range("no entry"); }};
  Make();
  const Reply reply = Get(spec);
  EXPECT_TRUE(reply.Is<SsoException>());
  EXPECT_EQ(reply.Message(), "no entry");
  std::atomic<bool> isDone{false};
  std::thread caller([&] {
    EXPECT_THROW(source->GetToken(spec, {}), std::out_of_range);
    isDone = true;
    runtime->Run([] {});
  });
  runtime->RunUntil([&] { return isDone.load(); });
  caller.join();
}

TEST_F(LoginFunctionTest, EmptyPasswordIsRefusedBeforeItIsSent) {
  password = "";
  Make();
  EXPECT_TRUE(Get(spec).Is<Tarnik::InvalidArgumentException>());
  EXPECT_EQ(Attempts(), 0U);
}

TEST_F(LoginFunctionTest, EveryAttemptAsksForThePassword) {
  scripts[0]->Set([&](const AttemptRequest&, Limit&) {
    password = "changed";
    return Unreachable();
  });
  Make();
  EXPECT_NE(Get(spec).token, nullptr);
  ASSERT_EQ(scripts[1]->Count(), 1U);
  EXPECT_EQ(scripts[1]->Seen()[0].secret, "changed");
}

TEST_F(LoginFunctionTest, NoRecordContainsThePassword) {
  ForAll(Fails(Refused()));
  Make();
  const Reply reply = Get(spec);
  EXPECT_EQ(reply.Message().find(password), std::string::npos);
  for (const AttemptRecord& record : listener->Ended()) {
    EXPECT_EQ((record.message + record.source + record.endpoint).find(password), std::string::npos);
  }
  EXPECT_EQ(listener->Ended().size(), 1U);
}

// ---- renewals

class RenewalTest : public SourceFixture {
 protected:
  RenewalTest() {
    own_ = Tarnik::MakeRef<NamedCertificate>("own");
    config.holderOfKey = HolderOfKeyConfig{own_, nullptr};
    config.refresh.jitter = 0;
    ForAll(IssuesBound(true, own_));
  }

  Script::Function IssuesBound(bool isRenewable,
                               const Tarnik::Ref<const Tarnik::Crypto::Certificate>& to) {
    return [this, isRenewable, to](const AttemptRequest&, Limit&) {
      const auto token = NewToken(hours(1));
      token->isRenewable = isRenewable;
      token->certificate = to;
      return Issued(token);
    };
  }
  // A token that callers have asked for, at the time of its refresh.
  std::string RefreshOne() {
    const Reply reply = Get(spec);
    EXPECT_NE(source->TryGetToken(spec), nullptr);
    runtime->Advance(minutes(45));
    return reply.token->Id();
  }

  Tarnik::Ref<const Tarnik::Crypto::Certificate> own_;
};

TEST_F(RenewalTest, BoundRenewableTokenIsRenewed) {
  Make();
  const std::string id = RefreshOne();
  ASSERT_EQ(scripts[0]->Count(), 2U);
  EXPECT_EQ(scripts[0]->Seen()[1].operation, AttemptOperation::kRenewal);
  EXPECT_EQ(scripts[0]->Seen()[1].base, id);
  EXPECT_EQ(scripts[0]->Seen()[1].secret, "");
  EXPECT_NE(source->TryGetToken(spec)->Id(), id);
  EXPECT_EQ(source->Metrics().renewals, 1U);
  EXPECT_EQ(passwordCalls, 1);
}

TEST_F(RenewalTest, TokenThatIsNotRenewableIsNotAskedFor) {
  ForAll(IssuesBound(false, own_));
  Make();
  RefreshOne();
  ASSERT_EQ(scripts[0]->Count(), 2U);
  EXPECT_EQ(scripts[0]->Seen()[1].operation, AttemptOperation::kLogin);
}

TEST_F(RenewalTest, TokenOfAnotherKeyIsNotRenewed) {
  ForAll(IssuesBound(true, Tarnik::MakeRef<NamedCertificate>("other")));
  Make();
  RefreshOne();
  ASSERT_EQ(scripts[0]->Count(), 2U);
  EXPECT_EQ(scripts[0]->Seen()[1].operation, AttemptOperation::kLogin);
}

TEST_F(RenewalTest, BearerTokenIsNotRenewed) {
  ForAll(IssuesBound(true, nullptr));
  Make();
  RefreshOne();
  ASSERT_EQ(scripts[0]->Count(), 2U);
  EXPECT_EQ(scripts[0]->Seen()[1].operation, AttemptOperation::kLogin);
}

TEST_F(RenewalTest, FailedRenewalLogsInAlsoWithOneAttempt) {
  config.retry.attempts = 1;
  scripts[0]->Set(
      [&, issue = IssuesBound(true, own_)](const AttemptRequest& request, Limit& limit) {
        return request.operation == AttemptOperation::kRenewal ? Fault() : issue(request, limit);
      });
  Make();
  RefreshOne();
  ASSERT_EQ(scripts[0]->Count(), 3U);
  EXPECT_EQ(scripts[0]->Seen()[1].operation, AttemptOperation::kRenewal);
  EXPECT_EQ(scripts[0]->Seen()[2].operation, AttemptOperation::kLogin);
  EXPECT_EQ(scripts[1]->Count(), 0U);
  EXPECT_EQ(listener->Begun()[1].number, 1);
  EXPECT_EQ(listener->Begun()[2].number, 2);
}

TEST_F(RenewalTest, FailedRenewalLeavesAllAttemptsToTheLogin) {
  config.endpoints.resize(1);
  config.retry.attempts = 2;
  config.retry.firstDelay = milliseconds(0);
  Make();
  Get(spec);
  int logins = 0;
  scripts[0]->Set(
      [&, issue = IssuesBound(true, own_)](const AttemptRequest& request, Limit& limit) {
        if (request.operation == AttemptOperation::kRenewal) {
          return Fault();
        }
        return ++logins == 1 ? Unreachable() : issue(request, limit);
      });
  CallContext context;
  context.minimumLife = minutes(50);
  runtime->Advance(minutes(20));
  EXPECT_NE(Get(spec, context).token, nullptr);
  EXPECT_EQ(logins, 2);
}

TEST_F(RenewalTest, TimeThatAnEndpointAsksForInAnswerToARenewalIsHonoured) {
  for (const milliseconds asked : {milliseconds(0), milliseconds(minutes(2))}) {
    SCOPED_TRACE(asked.count());
    ForAll(IssuesBound(true, own_));
    Make();
    scripts[0]->Set(
        [&, issue = IssuesBound(true, own_)](const AttemptRequest& request, Limit& limit) {
          return request.operation == AttemptOperation::kRenewal ? Unavailable(asked)
                                                                 : issue(request, limit);
        });
    RefreshOne();
    scripts[1]->Set(Fails(Unreachable()));
    const auto reply = Ask(SpecFor("https://other.example.com"));
    runtime->Advance(minutes(1));
    ASSERT_TRUE(reply->Has());
    EXPECT_EQ(reply->token != nullptr, asked == milliseconds(0)) << reply->Message();
  }
}

TEST_F(RenewalTest, FailuresOtherThanAnHttpStatusOpenTheCircuit) {
  config.retry.failuresToOpen = 1;
  for (const FailureKind kind :
       {FailureKind::kHttpStatus, FailureKind::kUnreachable, FailureKind::kTimedOut}) {
    SCOPED_TRACE(NameOf(kind));
    const std::size_t before = listener->Circuits().size();
    ForAll(IssuesBound(true, own_));
    Make();
    Get(spec);
    source->TryGetToken(spec);
    scripts[0]->Set(Fails(Failed<CommunicationException>(kind, "It did not answer.")));
    runtime->Advance(minutes(45));
    EXPECT_EQ(scripts[1]->Seen().back().operation, AttemptOperation::kRenewal);
    EXPECT_EQ(listener->Circuits().size(), before + (kind == FailureKind::kHttpStatus ? 0U : 1U));
  }
}

TEST_F(RenewalTest, RenewalThatNoServiceDecidedIsRepeatedAtTheNextEndpoint) {
  Make();
  Get(spec);
  source->TryGetToken(spec);
  scripts[0]->Set(Fails(Unreachable()));
  runtime->Advance(minutes(45));
  ASSERT_EQ(scripts[1]->Count(), 1U);
  EXPECT_EQ(scripts[1]->Seen()[0].operation, AttemptOperation::kRenewal);
}

TEST_F(RenewalTest, RenewalThatEachEndpointFailsToAnswerIsFollowedByALogin) {
  for (const FailureKind kind :
       {FailureKind::kHttpStatus, FailureKind::kTimedOut, FailureKind::kCutOff}) {
    config.retry.failuresToOpen = kind == FailureKind::kHttpStatus ? 1 : 3;
    const std::size_t before = scripts[0]->Count();
    ForAll([&, issue = IssuesBound(true, own_)](const AttemptRequest& request, Limit& limit) {
      return request.operation == AttemptOperation::kRenewal
                 ? Failed<CommunicationException>(kind, "HTTP status 500.")
                 : issue(request, limit);
    });
    Make();
    const std::string id = RefreshOne();
    ASSERT_EQ(scripts[0]->Count(), before + 3);
    EXPECT_EQ(scripts[0]->Seen()[before + 1].operation, AttemptOperation::kRenewal);
    EXPECT_EQ(scripts[0]->Seen()[before + 2].operation, AttemptOperation::kLogin);
    EXPECT_EQ(scripts[1]->Seen().back().operation, AttemptOperation::kRenewal);
    EXPECT_NE(source->TryGetToken(spec)->Id(), id);
  }
  EXPECT_TRUE(listener->Circuits().empty());
}

TEST_F(RenewalTest, CallersNeverNoticeThatNoRenewalIsAnswered) {
  ForAll([&, issue = IssuesBound(true, own_)](const AttemptRequest& request, Limit& limit) {
    return request.operation == AttemptOperation::kRenewal ? Unavailable(seconds(0))
                                                           : issue(request, limit);
  });
  Make();
  for (int i = 0; i < 12 * 60; ++i) {
    ASSERT_NE(Get(spec, Within(seconds(4))).token, nullptr) << i;
    runtime->Advance(minutes(1));
  }
  EXPECT_EQ(source->Metrics().misses, 1U);
}

TEST_F(RenewalTest, LoginFollowsAtOnceOnlyIfAnEndpointWasReached) {
  Make();
  RefreshOne();
  runtime->Advance(seconds(1));
  ForAll(Fails(Unreachable()));
  const std::size_t before = Attempts();
  source->TryGetToken(spec);
  runtime->Advance(minutes(45));
  ASSERT_GE(Attempts(), before + 2);
  EXPECT_EQ(scripts[0]->Seen().back().operation, AttemptOperation::kRenewal);
  EXPECT_EQ(scripts[1]->Seen().back().operation, AttemptOperation::kRenewal);
}

TEST_F(RenewalTest, LoginWaitsAsLongAsTheAnswerToTheRenewalAskedFor) {
  config.endpoints.resize(1);
  Make();
  Get(spec);
  runtime->Advance(minutes(20));
  scripts[0]->Set(
      [&, issue = IssuesBound(true, own_)](const AttemptRequest& request, Limit& limit) {
        return request.operation == AttemptOperation::kRenewal ? Unavailable(seconds(2))
                                                               : issue(request, limit);
      });
  CallContext context;
  context.minimumLife = minutes(50);
  const auto reply = Ask(spec, context);
  runtime->Settle();
  EXPECT_EQ(reply->calls, 0) << reply->Message();
  runtime->Advance(seconds(4));
  EXPECT_NE(reply->token, nullptr) << reply->Message();
  EXPECT_EQ(scripts[0]->Count(), 3U);
}

TEST_F(RenewalTest, RefreshDoesNotWaitForWhatTheAnswerToTheRenewalAskedFor) {
  config.endpoints.resize(1);
  ForAll([&, issue = IssuesBound(true, own_)](const AttemptRequest& request, Limit& limit) {
    return request.operation == AttemptOperation::kRenewal ? Unavailable(seconds(100))
                                                           : issue(request, limit);
  });
  Make();
  RefreshOne();
  ASSERT_EQ(listener->Refreshes().size(), 1U);
  EXPECT_GE(listener->Refreshes()[0].nextAttempt, seconds(100));
}

TEST_F(RenewalTest, RefusedRenewalIsNotARefusedLogin) {
  scripts[0]->Set(
      [&, issue = IssuesBound(true, own_)](const AttemptRequest& request, Limit& limit) {
        return request.operation == AttemptOperation::kRenewal ? Refused() : issue(request, limit);
      });
  Make();
  RefreshOne();
  EXPECT_EQ(scripts[0]->Count(), 3U);
  EXPECT_NE(Get(SpecFor("https://other.example.com")).token, nullptr);
}

TEST_F(RenewalTest, TokenThatHasEndedIsNotRenewed) {
  Make();
  Get(spec);
  runtime->MoveWallClock(hours(2));
  EXPECT_NE(Get(spec).token, nullptr);
  ASSERT_EQ(scripts[0]->Count(), 2U);
  EXPECT_EQ(scripts[0]->Seen()[1].operation, AttemptOperation::kLogin);
}

TEST_F(RenewalTest, InvalidatedTokenIsNotRenewed) {
  Make();
  const Reply reply = Get(spec);
  source->Invalidate(*reply.token);
  Get(spec);
  ASSERT_EQ(scripts[0]->Count(), 2U);
  EXPECT_EQ(scripts[0]->Seen()[1].operation, AttemptOperation::kLogin);
}

}  // namespace

}  // namespace SsoClient::Access::Testing
