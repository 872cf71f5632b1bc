#include <stdexcept>

#include <gtest/gtest.h>

#include <ssoclient/exceptions.h>

#include "support/source_fixture.h"

namespace SsoClient::Access::Testing {

namespace {

using Limit = Tarnik::Http::CallLimit;

std::string AudienceNumber(int number) {
  return "https://service" + std::to_string(number) + ".example.com";
}

// ---- account protection

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

TEST_F(RenewalTest, RenewalThatNoServiceDecidedIsRepeatedAtTheNextEndpoint) {
  Make();
  Get(spec);
  source->TryGetToken(spec);
  scripts[0]->Set(Fails(Unreachable()));
  runtime->Advance(minutes(45));
  ASSERT_EQ(scripts[1]->Count(), 1U);
  EXPECT_EQ(scripts[1]->Seen()[0].operation, AttemptOperation::kRenewal);
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

// ---- exchanges

class BaseSource final : public TokenSource {
 public:
  std::shared_ptr<const SamlToken> GetToken(const TokenSpec&, const CallContext&) override {
    return token;
  }
  std::shared_ptr<const SamlToken> TryGetToken(const TokenSpec&) override { return token; }
  void GetTokenAsync(const TokenSpec&, const CallContext& context,
                     TokenCallback callback) override {
    ++calls;
    lastContext = context;
    if (isHeld) {
      held = std::move(callback);
    } else if (isBroken) {
      const CommunicationException failure("The base source is broken.");
      callback(nullptr, &failure);
    } else {
      callback(token, nullptr);
    }
  }
  void Invalidate(const SamlToken& refused) override {
    invalidated.push_back(refused.Id());
    if (next != nullptr) {
      token = next;
    }
  }
  TokenSourceMetrics Metrics() const override { return {}; }
  bool Stop(milliseconds) override { return true; }

  std::shared_ptr<const SamlToken> token;
  std::shared_ptr<const SamlToken> next;
  std::vector<std::string> invalidated;
  CallContext lastContext;
  TokenCallback held;
  bool isHeld = false;
  bool isBroken = false;
  int calls = 0;
};

class ExchangeTest : public SourceFixture {
 protected:
  ExchangeTest() {
    base->token = std::make_shared<IssuedToken>("_base", 0, 1);
    TokenLogin login;
    login.source = base;
    login.spec = SpecFor("https://base.example.com");
    config.login = login;
    config.holderOfKey = HolderOfKeyConfig{Tarnik::MakeRef<NamedCertificate>("own"), nullptr};
  }

  const std::shared_ptr<BaseSource> base = std::make_shared<BaseSource>();
};

TEST_F(ExchangeTest, TokenOfTheOtherSourceIsExchanged) {
  Make();
  EXPECT_NE(Get(spec).token, nullptr);
  ASSERT_EQ(scripts[0]->Count(), 1U);
  EXPECT_EQ(scripts[0]->Seen()[0].operation, AttemptOperation::kExchange);
  EXPECT_EQ(scripts[0]->Seen()[0].base, "_base");
  EXPECT_EQ(source->Metrics().exchanges, 1U);
}

TEST_F(ExchangeTest, RefusedTokenIsReplacedOnce) {
  base->next = std::make_shared<IssuedToken>("_new", 0, 1);
  ForAll([this](const AttemptRequest& request, Limit&) {
    return request.base->Id() == "_base" ? Refused() : Issued(NewToken(hours(1)));
  });
  Make();
  EXPECT_NE(Get(spec).token, nullptr);
  EXPECT_EQ(base->invalidated, std::vector<std::string>{"_base"});
  EXPECT_EQ(Attempts(), 2U);
}

TEST_F(ExchangeTest, SecondRefusalIsRememberedForItsSpecOnly) {
  ForAll([this](const AttemptRequest& request, Limit&) {
    return request.spec.audienceRestriction.count("https://orders.example.com") != 0
               ? Refused()
               : Issued(NewToken(hours(1)));
  });
  Make();
  for (int i = 0; i < 5; ++i) {
    EXPECT_TRUE(Get(spec).Is<InvalidCredentialsException>());
  }
  EXPECT_EQ(Attempts(), 2U);
  EXPECT_NE(Get(SpecFor("https://other.example.com")).token, nullptr);
  runtime->Advance(minutes(5));
  EXPECT_TRUE(Get(spec).Is<InvalidCredentialsException>());
  EXPECT_EQ(Attempts(), 5U);
}

TEST_F(ExchangeTest, FailureOfTheOtherSourceReachesTheCallers) {
  base->isBroken = true;
  Make();
  const Reply reply = Get(spec);
  EXPECT_TRUE(reply.Is<CommunicationException>());
  EXPECT_EQ(reply.Message(), "The base source is broken.");
  EXPECT_EQ(Attempts(), 0U);
}

TEST_F(ExchangeTest, CallToTheOtherSourceEndsWithTheLastCaller) {
  base->isHeld = true;
  Make();
  const auto reply = Ask(spec, Within(seconds(1)));
  runtime->Settle();
  ASSERT_EQ(base->calls, 1);
  EXPECT_FALSE(base->lastContext.cancellation.IsCancelled());
  runtime->Advance(seconds(1));
  EXPECT_TRUE(base->lastContext.cancellation.IsCancelled());
  EXPECT_EQ(reply->Message(),
            "The deadline passed while the call was waiting for the token to exchange.");
  base->held(base->token, nullptr);
  runtime->Settle();
  EXPECT_EQ(Attempts(), 0U);
}

TEST_F(ExchangeTest, SourceThatReturnsNullIsAnError) {
  base->token = nullptr;
  Make();
  EXPECT_TRUE(Get(spec).Is<SsoException>());
}

}  // namespace

}  // namespace SsoClient::Access::Testing
