#include <utility>

#include <gtest/gtest.h>

#include <ssoclient/exceptions.h>

#include "support/source_fixture.h"

namespace SsoClient::Access::Testing {

namespace {

using Limit = Tarnik::Http::CallLimit;

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
  std::exchange(base->held, nullptr)(base->token, nullptr);
  runtime->Settle();
  EXPECT_EQ(Attempts(), 0U);
}

TEST_F(ExchangeTest, LifeThatTheOtherTokenNeedsHasALimit) {
  Make();
  CallContext context;
  context.minimumLife = seconds::max();
  EXPECT_TRUE(Get(spec, context).Is<SsoException>());
  EXPECT_EQ(Attempts(), 1U);
  EXPECT_GT(base->lastContext.minimumLife, hours(24 * 365 * 29));
  EXPECT_LT(base->lastContext.minimumLife, hours(24 * 365 * 31));
}

TEST_F(ExchangeTest, SourceThatReturnsNullIsAnError) {
  base->token = nullptr;
  Make();
  EXPECT_TRUE(Get(spec).Is<SsoException>());
}

TEST_F(ExchangeTest, RefusedExchangesReplaceTheTokenOnceInAWhile) {
  base->next = std::make_shared<IssuedToken>("_new", 0, 1);
  ForAll(Fails(Refused()));
  Make();
  for (int i = 0; i < 100; ++i) {
    EXPECT_TRUE(Get(SpecFor(std::to_string(i))).Is<InvalidCredentialsException>());
  }
  EXPECT_EQ(base->invalidated, std::vector<std::string>{"_base"});
  EXPECT_EQ(Attempts(), 101U);
  base->next = std::make_shared<IssuedToken>("_newer", 0, 1);
  runtime->Advance(seconds(30));
  for (int i = 100; i < 200; ++i) {
    Get(SpecFor(std::to_string(i)));
  }
  EXPECT_EQ(base->invalidated, (std::vector<std::string>{"_base", "_new"}));
}

TEST_F(ExchangeTest, TokenThatWasReplacedMeanwhileIsNotInvalidated) {
  Make();
  scripts[0]->Set([&](const AttemptRequest& request, Limit&) {
    if (request.base->Id() != "_base") {
      return Issued(NewToken(hours(1)));
    }
    base->token = std::make_shared<IssuedToken>("_new", 0, 1);
    scripts[0]->Set(Issues(hours(1)));
    EXPECT_NE(Get(SpecFor("https://other.example.com")).token, nullptr);
    return Refused();
  });
  EXPECT_NE(Get(spec).token, nullptr);
  EXPECT_TRUE(base->invalidated.empty());
}

// ---- the life of the token to exchange

class BaseLifeTest : public ExchangeTest {
 protected:
  BaseLifeTest() {
    // Ends with the token to exchange.
    ForAll([this](const AttemptRequest& request, Limit&) {
      const auto now = std::chrono::duration_cast<std::chrono::microseconds>(
          runtime->Now().wall.time_since_epoch());
      const std::chrono::microseconds end(request.base->ExpirationTime().GetUtcTime());
      return Issued(NewToken(std::chrono::duration_cast<milliseconds>(end - now)));
    });
    UseSource(hours(1));
  }

  // An inner source of tokens with this lifetime.
  void UseSource(milliseconds lifetime) {
    innerScript->Set(Issues(lifetime));
    TokenSourceConfig inner = config;
    inner.login = PasswordLogin{"alice", [] { return std::string("secret"); }};
    inner.endpoints.resize(1);
    inner.listener = nullptr;
    // Not refreshed when it is used late.
    inner.refresh = {0.99, 0};
    const auto shared = std::make_shared<const TokenSourceConfig>(std::move(inner));
    TokenLogin login;
    login.spec = SpecFor("https://base.example.com");
    login.source =
        std::make_shared<TokenSourceImpl>([shared, runtime = runtime, script = innerScript] {
          Core::Parts parts;
          parts.config = shared;
          parts.runtime = runtime;
          parts.clients.push_back(std::make_unique<ScriptedEndpoint>(shared->endpoints[0], script));
          return parts;
        });
    config.login = login;
  }
  static CallContext For(std::chrono::seconds minimumLife) {
    CallContext context;
    context.minimumLife = minimumLife;
    return context;
  }

  const std::shared_ptr<Script> innerScript = std::make_shared<Script>();
};

TEST_F(BaseLifeTest, IsLongEnoughForTheCallers) {
  Make();
  Get(spec);
  runtime->Advance(minutes(57));
  EXPECT_NE(Get(SpecFor("https://other.example.com"), For(minutes(5))).token, nullptr);
  EXPECT_EQ(innerScript->Count(), 2U);
}

TEST_F(BaseLifeTest, IsLengthenedBeforeATokenIsTooShort) {
  Make();
  Get(spec);
  runtime->Advance(minutes(57));
  // Its token has three minutes, as the one in the cache of the other source.
  EXPECT_NE(Get(SpecFor("https://other.example.com")).token, nullptr);
  const Reply reply = Get(SpecFor("https://other.example.com"), For(minutes(5)));
  EXPECT_NE(reply.token, nullptr) << reply.Message();
}

TEST_F(BaseLifeTest, IsLengthenedForACallerThatJoins) {
  Make();
  Get(spec);
  runtime->Advance(minutes(57));
  std::shared_ptr<Reply> joined;
  const TokenSpec other = SpecFor("https://other.example.com");
  scripts[0]->Set([&, isFirst = true](const AttemptRequest& request, Limit&) mutable {
    if (std::exchange(isFirst, false)) {
      joined = Ask(other, For(minutes(5)));
    }
    const auto now = std::chrono::duration_cast<std::chrono::microseconds>(
        runtime->Now().wall.time_since_epoch());
    const std::chrono::microseconds end(request.base->ExpirationTime().GetUtcTime());
    return Issued(NewToken(std::chrono::duration_cast<milliseconds>(end - now)));
  });
  EXPECT_NE(Get(other).token, nullptr);
  EXPECT_NE(joined->token, nullptr) << joined->Message();
}

TEST_F(BaseLifeTest, CallersThatNeedLessAreServedAlthoughNoBaseIsLongEnoughForOthers) {
  Make();
  const auto demanding = Ask(spec, For(hours(2)));
  const auto modest = Ask(spec, For(minutes(5)));
  runtime->Settle();
  EXPECT_NE(modest->token, nullptr);
  EXPECT_TRUE(demanding->Is<SsoException>());
  EXPECT_EQ(demanding->Message(),
            "The service grants 3600 s, but the caller needs a token for 7200 s.");
}

}  // namespace

}  // namespace SsoClient::Access::Testing
