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

TEST_F(ExchangeTest, SourceThatReturnsNullIsAnError) {
  base->token = nullptr;
  Make();
  EXPECT_TRUE(Get(spec).Is<SsoException>());
}

}  // namespace

}  // namespace SsoClient::Access::Testing
