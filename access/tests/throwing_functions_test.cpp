#include <stdexcept>

#include <gtest/gtest.h>

#include <ssoclient/exceptions.h>

#include "support/source_fixture.h"
#include "support/threaded_runtime.h"

namespace SsoClient::Access::Testing {

namespace {

/// Throws from one of its functions, or from all of them.
class ThrowingListener final : public AccessListener {
 public:
  enum Function { kBegun, kEnded, kRefresh, kCircuit, kClock, kDeviation, kAll };

  explicit ThrowingListener(Function function) : function_(function) {}

  void OnAttemptBegun(const AttemptRecord&) override { Throw(kBegun); }
  void OnAttemptEnded(const AttemptRecord&) override { Throw(kEnded); }
  void OnRefreshFailed(const RefreshFailureRecord&) override { Throw(kRefresh); }
  void OnCircuit(const CircuitRecord&) override { Throw(kCircuit); }
  void OnClock(const ClockRecord&) override { Throw(kClock); }
  void OnDeviation(const DeviationRecord&) override { Throw(kDeviation); }

  int thrown = 0;

 private:
  void Throw(Function function) {
    if (function_ != function && function_ != kAll) {
      return;
    }
    if (++thrown % 2 == 0) {
      throw std::runtime_error("listener");
    }
    throw 1;  // not an exception class
  }

  const Function function_;
};

class ThrowingListenerTest : public SourceFixture,
                             public ::testing::WithParamInterface<ThrowingListener::Function> {};

TEST_P(ThrowingListenerTest, SourceWorksOn) {
  const auto throwing = std::make_shared<ThrowingListener>(GetParam());
  config.listener = throwing;
  config.keepFresh = {spec};
  config.retry.failuresToOpen = 1;
  config.retry.attemptsAtOnce = 2;  // one place at each endpoint
  ForAll(Fails(Unreachable()));
  Make();
  runtime->Settle();
  EXPECT_TRUE(Get(SpecFor("down")).Is<CommunicationException>());
  ForAll([this](const AttemptRequest&, Tarnik::Http::CallLimit&) {
    AttemptOutcome outcome = Issued(NewToken(hours(1)));
    outcome.clockOffset = seconds(90);
    outcome.deviations.push_back({"", "", "subject", "a", "b"});
    return outcome;
  });
  runtime->Advance(minutes(5));
  EXPECT_NE(source->TryGetToken(spec), nullptr);
  for (int i = 0; i < 5; ++i) {
    EXPECT_NE(Get(SpecFor(std::to_string(i))).token, nullptr);
  }
  EXPECT_GT(throwing->thrown, 0);
  EXPECT_EQ(source->Metrics().callersWaiting, 0U);
  EXPECT_TRUE(source->Stop(milliseconds(0)));
}

INSTANTIATE_TEST_SUITE_P(Functions, ThrowingListenerTest,
                         ::testing::Values(ThrowingListener::kBegun, ThrowingListener::kEnded,
                                           ThrowingListener::kRefresh, ThrowingListener::kCircuit,
                                           ThrowingListener::kClock, ThrowingListener::kDeviation,
                                           ThrowingListener::kAll));

class ThrowingLoginTest : public SourceFixture {};

TEST_F(ThrowingLoginTest, AnythingThatThePasswordFunctionThrowsReachesTheCallers) {
  config.retry.attemptsAtOnce = 1;
  bool throws = true;
  config.login = PasswordLogin{"alice", [&throws]() -> std::string {
                                 if (throws) {
                                   throw 42;
                                 }
                                 return "secret";
                               }};
  Make();
  for (int i = 0; i < 3; ++i) {
    const Reply reply = Get(spec);
    EXPECT_TRUE(reply.Is<SsoException>()) << reply.Message();
  }
  EXPECT_EQ(Attempts(), 0U);
  throws = false;
  EXPECT_NE(Get(spec).token, nullptr);
}

TEST_F(ThrowingLoginTest, FailureOfThePasswordFunctionIsCountedAndReported) {
  bool isEmpty = false;
  config.login = PasswordLogin{"alice", [&]() -> std::string {
                                 runtime->Pass(milliseconds(20));
                                 return isEmpty ? "" : throw Tarnik::IOException("no vault");
                               }};
  config.keepFresh = {spec};
  Make();
  runtime->Settle();
  isEmpty = true;
  Get(SpecFor("other"));
  constexpr auto kIndex = static_cast<std::size_t>(FailureKind::kSecretFailed);
  EXPECT_EQ(source->Metrics().attempts[kIndex], 2U);
  const auto ended = listener->Ended();
  ASSERT_EQ(ended.size(), 2U);
  ASSERT_EQ(listener->Begun().size(), 2U);
  EXPECT_EQ(listener->Begun()[0].id, ended[0].id);
  EXPECT_EQ(ended[0].source, "orders");
  EXPECT_EQ(ended[0].endpoint, "");
  EXPECT_EQ(ended[0].operation, AttemptOperation::kLogin);
  EXPECT_EQ(ended[0].number, 1);
  EXPECT_EQ(ended[0].duration, milliseconds(20));
  EXPECT_EQ(ended[0].failure, FailureKind::kSecretFailed);
  EXPECT_EQ(ended[0].message, "no vault");
  EXPECT_EQ(ended[1].message, "The login's function has returned an empty password.");
  EXPECT_NE(ended[0].id, ended[1].id);
}

TEST_F(ThrowingLoginTest, BlockedCallerReceivesTheObject) {
  config.login = PasswordLogin{"alice", []() -> std::string { throw 42; }};
  const auto shared = std::make_shared<const TokenSourceConfig>(config);
  const auto threads = std::make_shared<ThreadedRuntime>(1);
  TokenSourceImpl threaded([shared, threads, scripts = scripts] {
    Core::Parts parts{shared, threads, {}};
    for (std::size_t i = 0; i < shared->endpoints.size(); ++i) {
      parts.clients.push_back(std::make_unique<ScriptedEndpoint>(shared->endpoints[i], scripts[i]));
    }
    return parts;
  });
  EXPECT_THROW(threaded.GetToken(spec, {}), int);
}

TEST_F(ThrowingLoginTest, ClientThatThrowsLeavesNothingTaken) {
  config.retry.attemptsAtOnce = 1;
  Make();
  ForAll([](const AttemptRequest&, Tarnik::Http::CallLimit&) -> AttemptOutcome { throw 42; });
  for (int i = 0; i < 3; ++i) {
    EXPECT_TRUE(Get(spec).Is<SsoException>());
  }
  ForAll(Issues(hours(1)));
  EXPECT_NE(Get(spec).token, nullptr);
  EXPECT_NE(Get(SpecFor("other")).token, nullptr);
}

/// A source of the program that throws objects of any type.
class ThrowingSource final : public TokenSource {
 public:
  std::shared_ptr<const SamlToken> token;
  bool throws = true;

  std::shared_ptr<const SamlToken> GetToken(const TokenSpec&, const CallContext&) override {
    throw 42;
  }
  std::shared_ptr<const SamlToken> TryGetToken(const TokenSpec&) override { throw 42; }
  void GetTokenAsync(const TokenSpec&, const CallContext&, TokenCallback callback) override {
    if (throws) {
      throw 42;
    }
    callback(token, nullptr);
  }
  void Invalidate(const SamlToken&) override { throw 42; }
  TokenSourceMetrics Metrics() const override { return {}; }
  bool Stop(std::chrono::milliseconds) override { return true; }
};

TEST_F(ThrowingLoginTest, SourceOfTheProgramMayThrowAnything) {
  const auto throwing = std::make_shared<ThrowingSource>();
  throwing->token = NewToken(hours(1));
  config.login = TokenLogin{throwing, SpecFor("base")};
  Make();
  EXPECT_TRUE(Get(spec).Is<SsoException>());
  EXPECT_EQ(Attempts(), 0U);
  throwing->throws = false;
  ForAll(Fails(Refused()));
  EXPECT_TRUE(Get(spec).Is<InvalidCredentialsException>());
  ForAll(Issues(hours(1)));
  EXPECT_NE(Get(SpecFor("other")).token, nullptr);
}

}  // namespace

}  // namespace SsoClient::Access::Testing
