#include <utility>

#include <gtest/gtest.h>

#include <ssoclient/exceptions.h>

#include "support/source_fixture.h"

namespace SsoClient::Access::Testing {

namespace {

using Limit = Tarnik::Http::CallLimit;

std::string AudienceNumber(int number) {
  return "https://service" + std::to_string(number) + ".example.com";
}

class AccountProtectionTest : public SourceFixture {
 protected:
  // A service that knows one password.
  void Know(const std::string& known, const AttemptOutcome& refusal) {
    ForAll([this, known, refusal](const AttemptRequest& request, Limit&) {
      return request.secret == known ? Issued(NewToken(hours(1))) : refusal;
    });
  }
};

TEST_F(AccountProtectionTest, WrongPasswordIsSentOnceWhateverTheNumberOfCallersAndKeys) {
  Know("right", Refused());
  Make();
  std::vector<std::shared_ptr<Reply>> replies;
  for (int i = 0; i < 1000; ++i) {
    replies.push_back(Ask(SpecFor(AudienceNumber(i % 100))));
  }
  runtime->Settle();
  for (int i = 0; i < 1000; ++i) {
    replies.push_back(Ask(SpecFor(AudienceNumber(i % 200))));
    runtime->Advance(milliseconds(100));
  }
  EXPECT_EQ(Attempts(), 1U);
  for (const auto& reply : replies) {
    ASSERT_TRUE(reply->Has());
    ASSERT_TRUE(reply->Is<InvalidCredentialsException>());
    ASSERT_EQ(reply->Message(), "Wrong password.");
  }
  EXPECT_EQ(source->Metrics().refusedFromMemory, 1990U);
}

TEST_F(AccountProtectionTest, WrongPasswordIsSentOnceWhateverTheNumberOfEndpointsAndAttempts) {
  config.endpoints.push_back({"https://c.example.com/sts", ""});
  config.retry.attempts = 10;
  config.keepFresh = {SpecFor("kept")};
  Know("right", Refused());
  // The first endpoint does not answer; the second one has decided.
  scripts[0]->Set(Fails(Unreachable()));
  Make();
  for (int i = 0; i < 100; ++i) {
    EXPECT_TRUE(Get(SpecFor(AudienceNumber(i))).Is<InvalidCredentialsException>());
    runtime->Advance(seconds(1));
  }
  EXPECT_EQ(scripts[1]->Count(), 1U);
  EXPECT_EQ(scripts[2]->Count(), 0U);
  EXPECT_EQ(scripts[0]->Count(), 1U);
}

TEST_F(AccountProtectionTest, ExpiredPasswordIsSentOnce) {
  Know("right", Expired());
  Make();
  for (int i = 0; i < 20; ++i) {
    EXPECT_TRUE(Get(SpecFor(AudienceNumber(i))).Is<PasswordExpiredException>());
  }
  EXPECT_EQ(Attempts(), 1U);
}

TEST_F(AccountProtectionTest, RefusalIsForgottenAfterTheStatedTime) {
  Know("right", Refused());
  Make();
  Get(spec);
  runtime->Advance(minutes(5) - milliseconds(1));
  EXPECT_TRUE(Get(spec).Is<InvalidCredentialsException>());
  EXPECT_EQ(Attempts(), 1U);
  runtime->Advance(milliseconds(1));
  EXPECT_TRUE(Get(spec).Is<InvalidCredentialsException>());
  EXPECT_EQ(Attempts(), 2U);
}

TEST_F(AccountProtectionTest, ChangedSecretIsUsedAtOnce) {
  Know("right", Refused());
  Make();
  EXPECT_TRUE(Get(spec).Is<InvalidCredentialsException>());
  password = "right";
  EXPECT_NE(Get(spec).token, nullptr);
  EXPECT_EQ(Attempts(), 2U);
  // The old one is still known.
  password = "secret";
  EXPECT_TRUE(Get(SpecFor("https://other.example.com")).Is<InvalidCredentialsException>());
  EXPECT_EQ(Attempts(), 2U);
}

TEST_F(AccountProtectionTest, OnlyOneLoginIsUnderWayUntilOneHasSucceeded) {
  Make();
  std::size_t whileFirst = 0;
  bool isFirst = true;
  ForAll([&](const AttemptRequest&, Limit&) {
    if (std::exchange(isFirst, false)) {
      runtime->Settle();
      whileFirst = Attempts();
    }
    return Issued(NewToken(hours(1)));
  });
  std::vector<std::shared_ptr<Reply>> replies;
  for (int i = 0; i < 50; ++i) {
    replies.push_back(Ask(SpecFor(AudienceNumber(i))));
  }
  runtime->Settle();
  EXPECT_EQ(whileFirst, 1U);
  EXPECT_EQ(Attempts(), 50U);
  for (const auto& reply : replies) {
    EXPECT_NE(reply->token, nullptr);
  }
}

TEST_F(AccountProtectionTest, PasswordThatIsChangedAtTheServiceIsRefusedOnce) {
  Know("secret", Refused());
  config.refresh.jitter = 0;
  Make();
  for (int i = 0; i < 20; ++i) {
    ASSERT_NE(Get(SpecFor(AudienceNumber(i))).token, nullptr);
    ASSERT_NE(source->TryGetToken(SpecFor(AudienceNumber(i))), nullptr);
  }
  const std::size_t before = Attempts();
  Know("changed", Refused());
  runtime->Advance(minutes(46));
  EXPECT_EQ(Attempts(), before + 1);
  EXPECT_GE(source->Metrics().refreshFailures, 20U);
  // The tokens are served, and the new password is found without a call.
  EXPECT_NE(source->TryGetToken(spec), source->TryGetToken(SpecFor(AudienceNumber(1))));
  password = "changed";
  runtime->Advance(minutes(5));
  EXPECT_EQ(Attempts(), before + 21);
}

TEST_F(AccountProtectionTest, WaitingForTheLoginOfAnotherCallEndsAtTheDeadline) {
  Make();
  scripts[0]->Set([&](const AttemptRequest&, Limit&) {
    runtime->Settle();
    runtime->Pass(seconds(3));
    return Issued(NewToken(hours(1)));
  });
  const auto first = Ask(spec);
  const auto second = Ask(SpecFor("https://other.example.com"), Within(seconds(1)));
  const auto third = Ask(SpecFor("https://third.example.com"));
  runtime->Settle();
  EXPECT_NE(first->token, nullptr);
  EXPECT_EQ(second->Message(),
            "The deadline passed while the call was waiting for the login of another call.");
  EXPECT_NE(third->token, nullptr);
}

TEST_F(AccountProtectionTest, GatePassesOnWhenTheOneWhoseTurnItIsLeavesInTheLoginsFunction) {
  // The function blocks for the second request, whose turn has come, until it has been abandoned.
  int calls = 0;
  config.login = PasswordLogin{"alice", [&] {
                                 if (++calls == 4) {
                                   runtime->Pass(seconds(10));
                                 }
                                 return password;
                               }};
  config.endpoints.resize(1);
  Make();
  bool isFirst = true;
  scripts[0]->Set([&](const AttemptRequest&, Limit&) {
    if (std::exchange(isFirst, false)) {
      runtime->Settle();
      return Fault();
    }
    return Issued(NewToken(hours(1)));
  });
  const auto first = Ask(spec);
  const auto second = Ask(SpecFor("https://second.example.com"), Within(seconds(5)));
  const auto third = Ask(SpecFor("https://third.example.com"));
  runtime->Settle();
  EXPECT_TRUE(first->Is<SsoException>());
  EXPECT_TRUE(second->Is<CommunicationException>());
  EXPECT_NE(third->token, nullptr);
}

TEST_F(AccountProtectionTest, GatePassesOnWhenTheSecretHasChanged) {
  int calls = 0;
  config.login = PasswordLogin{"alice", [&] {
                                 // The second request logs in with another one when it has its
                                 // turn.
                                 return std::string(++calls == 4 ? "two" : "one");
                               }};
  config.endpoints.resize(1);
  Make();
  bool isFirst = true;
  std::shared_ptr<Reply> third;
  bool hadTurn = false;
  scripts[0]->Set([&](const AttemptRequest& request, Limit&) {
    if (std::exchange(isFirst, false)) {
      runtime->Settle();
      return Fault();
    }
    if (request.secret == "two") {
      runtime->Settle();
      hadTurn = third->Has();
      return Fault();
    }
    return Issued(NewToken(hours(1)));
  });
  const auto first = Ask(spec);
  const auto second = Ask(SpecFor("https://second.example.com"));
  third = Ask(SpecFor("https://third.example.com"));
  runtime->Settle();
  EXPECT_TRUE(hadTurn);
  EXPECT_TRUE(first->Is<SsoException>());
  EXPECT_TRUE(second->Is<SsoException>());
  EXPECT_NE(third->token, nullptr);
}

TEST_F(AccountProtectionTest, AbandonedLoginKeepsTheGateUntilItHasEnded) {
  Make();
  std::size_t during = 0;
  bool isFirst = true;
  scripts[0]->Set([&](const AttemptRequest&, Limit&) {
    if (std::exchange(isFirst, false)) {
      runtime->Pass(seconds(2));
      Ask(spec);
      Ask(SpecFor("https://other.example.com"));
      runtime->Settle();
      during = Attempts();
      return Refused();
    }
    return Issued(NewToken(hours(1)));
  });
  const auto first = Ask(spec, Within(seconds(1)));
  runtime->Settle();
  EXPECT_EQ(during, 1U);
  EXPECT_EQ(Attempts(), 1U);
  EXPECT_TRUE(first->Is<CommunicationException>());
  EXPECT_TRUE(Get(spec).Is<InvalidCredentialsException>());
}

// ---- tokens to act as

class ActAsRefusalTest : public AccountProtectionTest {
 protected:
  // A service that refuses all tokens to act as.
  void RefuseActAs(bool isAuthenticationRefused) {
    ForAll([this, isAuthenticationRefused](const AttemptRequest& request, Limit&) {
      if (!request.spec.actAsToken) {
        return Issued(NewToken(hours(1)));
      }
      AttemptOutcome outcome = Refused();
      outcome.isAuthenticationRefused = isAuthenticationRefused;
      return outcome;
    });
  }
  TokenSpec ActAs() {
    TokenSpec made = spec;
    made.actAsToken = std::shared_ptr<const SamlToken>(NewToken(hours(1)));
    return made;
  }
};

TEST_F(ActAsRefusalTest, IsRememberedForItsSpecOnly) {
  RefuseActAs(false);
  Make();
  const TokenSpec bad = ActAs();
  for (int i = 0; i < 5; ++i) {
    EXPECT_TRUE(Get(bad).Is<InvalidCredentialsException>());
  }
  EXPECT_EQ(Attempts(), 1U);
  EXPECT_NE(Get(spec).token, nullptr);
  EXPECT_TRUE(Get(ActAs()).Is<InvalidCredentialsException>());
  EXPECT_EQ(Attempts(), 3U);
  password = "changed";
  EXPECT_TRUE(Get(bad).Is<InvalidCredentialsException>());
  EXPECT_EQ(Attempts(), 4U);
  password = "secret";
  runtime->Advance(minutes(5));
  EXPECT_TRUE(Get(bad).Is<InvalidCredentialsException>());
  EXPECT_EQ(Attempts(), 5U);
}

TEST_F(ActAsRefusalTest, OfThePasswordIsRememberedForThePassword) {
  RefuseActAs(true);
  Make();
  EXPECT_TRUE(Get(ActAs()).Is<InvalidCredentialsException>());
  EXPECT_TRUE(Get(spec).Is<InvalidCredentialsException>());
  EXPECT_EQ(Attempts(), 1U);
}

// ---- logins that nobody waits for any longer

class AbandonedLoginTest : public AccountProtectionTest {
 protected:
  // What a service does that answers after a time, unless the attempt is cancelled.
  Script::Function AnswersAfter(milliseconds time, const AttemptOutcome& outcome) {
    return [this, time, outcome](const AttemptRequest&, Limit& limit) {
      for (milliseconds passed{0}; passed < time; passed += milliseconds(100)) {
        if (limit.IsCancelled()) {
          ++cancelled;
          return Failed<CommunicationException>(FailureKind::kAbandoned, "Cancelled.");
        }
        runtime->Pass(milliseconds(100));
      }
      return outcome;
    };
  }
  static AttemptOutcome Silence() {
    return Failed<CommunicationException>(FailureKind::kTimedOut, "It is silent.");
  }

  int cancelled = 0;
};

TEST_F(AbandonedLoginTest, IsSentOnceAlthoughAllCallersLeaveBeforeTheRefusal) {
  ForAll(AnswersAfter(seconds(2), Refused()));
  Make();
  const auto first = Ask(spec, Within(seconds(1)));
  runtime->Settle();
  EXPECT_EQ(first->Message(),
            "The deadline passed while the call was waiting for the attempt at "
            "https://a.example.com/sts.");
  for (int i = 0; i < 10; ++i) {
    EXPECT_TRUE(
        Get(SpecFor(AudienceNumber(i)), Within(seconds(1))).Is<InvalidCredentialsException>());
    runtime->Advance(seconds(1));
  }
  EXPECT_EQ(Attempts(), 1U);
  EXPECT_EQ(cancelled, 0);
  ASSERT_EQ(listener->Ended().size(), 1U);
  EXPECT_EQ(listener->Ended()[0].failure, FailureKind::kRefusedLogin);
}

TEST_F(AbandonedLoginTest, CallerEndsAtItsDeadlineAndLaterOnesShareTheLogin) {
  std::shared_ptr<Reply> later;
  bool hadFirstEnded = false;
  std::shared_ptr<Reply> first;
  ForAll([&](const AttemptRequest&, Limit& limit) {
    runtime->Pass(seconds(2));
    hadFirstEnded = limit.IsCancelled() || first->failure != nullptr || runtime->WorkQueued() > 0;
    later = Ask(spec, Within(seconds(5)));
    EXPECT_FALSE(limit.IsCancelled());
    return Issued(NewToken(hours(1)));
  });
  Make();
  first = Ask(spec, Within(seconds(1)));
  runtime->Settle();
  EXPECT_TRUE(hadFirstEnded);
  EXPECT_TRUE(first->Is<CommunicationException>());
  EXPECT_NE(later->token, nullptr);
  EXPECT_EQ(Attempts(), 1U);
}

TEST_F(AbandonedLoginTest, ServiceThatNeverDecidesIsAskedWithGrowingPauses) {
  config.endpoints.resize(1);
  config.retry.failuresToOpen = 1000;
  ForAll(AnswersAfter(seconds(30), Silence()));
  Make();
  const auto begun = runtime->Now().steady;
  for (int i = 0; i < 1000; ++i) {
    const auto reply = Ask(SpecFor(AudienceNumber(i)), Within(seconds(1)));
    runtime->Advance(seconds(2));
    ASSERT_TRUE(reply->Is<CommunicationException>());
  }
  // Thirty seconds each, and then a pause of up to a minute.
  const auto passed = std::chrono::duration_cast<seconds>(runtime->Now().steady - begun).count();
  EXPECT_LE(static_cast<long>(Attempts()), passed / 70 + 6);
  EXPECT_GE(static_cast<long>(Attempts()), passed / 100);
  EXPECT_EQ(cancelled, 0);
  // A call that waits long enough for the pause and the answer gets it.
  ForAll(Issues(hours(1)));
  const auto reply = Ask(spec, Within(minutes(2)));
  runtime->Advance(minutes(2));
  EXPECT_NE(reply->token, nullptr);
}

TEST_F(AbandonedLoginTest, IsCancelledWhenTheSecretWasAcceptedJustBefore) {
  Make();
  ASSERT_NE(Get(SpecFor("https://first.example.com")).token, nullptr);
  ForAll(AnswersAfter(seconds(30), Silence()));
  Get(spec, Within(seconds(1)));
  EXPECT_EQ(cancelled, 1);
  EXPECT_EQ(listener->Ended().back().failure, FailureKind::kAbandoned);
  // The next one goes on, since the password may have been changed meanwhile.
  Get(spec, Within(seconds(1)));
  EXPECT_EQ(cancelled, 1);
}

TEST_F(AbandonedLoginTest, EndsWithStop) {
  scripts[0]->Set([&](const AttemptRequest&, Limit& limit) {
    runtime->Pass(seconds(2));
    EXPECT_FALSE(limit.IsCancelled());
    source->Stop(milliseconds(0));
    EXPECT_TRUE(limit.IsCancelled());
    return Failed<CommunicationException>(FailureKind::kAbandoned, "Cancelled.");
  });
  Make();
  EXPECT_TRUE(Get(spec, Within(seconds(1))).Is<CommunicationException>());
  EXPECT_EQ(Attempts(), 1U);
  EXPECT_EQ(runtime->WorkQueued(), 0U);
}

TEST_F(AbandonedLoginTest, IsNotRepeatedWhenNoServiceHasDecided) {
  scripts[0]->Set(AnswersAfter(seconds(2), Unreachable()));
  Make();
  Get(spec, Within(seconds(1)));
  runtime->Advance(minutes(1));
  EXPECT_EQ(Attempts(), 1U);
}

// ---- bursts

TEST_F(AccountProtectionTest, BurstAfterTheServiceHasChangedThePasswordSendsTheOldOneTwice) {
  Know("secret", Refused());
  Make();
  ASSERT_NE(Get(spec).token, nullptr);
  runtime->Advance(seconds(5));
  ForAll([&](const AttemptRequest&, Limit&) {
    runtime->Settle();  // all others that may log in do so meanwhile
    return Refused();
  });
  std::vector<std::shared_ptr<Reply>> replies;
  for (int i = 0; i < 200; ++i) {
    replies.push_back(Ask(SpecFor(AudienceNumber(i))));
  }
  runtime->Settle();
  EXPECT_EQ(Attempts(), 1U + 2U);
  for (const auto& reply : replies) {
    EXPECT_TRUE(reply->Is<InvalidCredentialsException>());
  }
}

}  // namespace

}  // namespace SsoClient::Access::Testing
