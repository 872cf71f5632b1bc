// Tokens that are replaced in the background.
#include <chrono>
#include <ctime>
#include <memory>
#include <string>
#include <vector>

#include <gmock/gmock.h>

#include "end_to_end/end_to_end_fixture.h"
#include "integration/holder_of_key_fixture.h"

namespace SsoClient::Access::Testing {
namespace {

using namespace std::chrono_literals;
using testing::ElementsAre;

constexpr char kRenewType[] = "http://docs.oasis-open.org/ws-sx/ws-trust/200512/Renew";

bool HasEnded(const SamlToken& token) {
  const auto now = std::chrono::duration_cast<std::chrono::microseconds>(
      std::chrono::system_clock::now().time_since_epoch());
  return token.ExpirationTime().GetUtcTime() <= now.count();
}

std::vector<AttemptOperation> OperationsOf(const std::vector<AttemptRecord>& attempts) {
  std::vector<AttemptOperation> operations;
  for (const AttemptRecord& attempt : attempts) {
    operations.push_back(attempt.operation);
  }
  return operations;
}

class RefreshAsyncTest : public EndToEndTest {
 protected:
  RefreshAsyncTest() {
    sts_.RegisterCertificate(SsoClient::Testing::kMachine,
                             SsoClient::Testing::Holder().certificatePem);
  }

  /// Refreshes tokens after this part of their lifetime.
  static TokenSourceConfig After(double fraction, TokenSourceConfig config) {
    config.refresh.fraction = fraction;
    config.refresh.jitter = 0;
    config.retry.firstDelay = 20ms;
    config.retry.longestDelay = 100ms;
    return config;
  }
  void Grant(std::chrono::seconds lifetime) {
    DevSts::AssertionOptions options;
    options.maxLifetime = lifetime;
    sts_.SetAssertionOptions(options);
  }
  /// A source whose tokens are bound to a key, and are refreshed after a second.
  std::shared_ptr<TokenSource> MakeForBoundTokens() {
    Grant(20s);
    return Make(After(0.05, BoundConfigFor({&sts_})));
  }
  TokenSpec Renewable() const {
    TokenSpec spec = spec_;
    spec.renewable = true;
    return spec;
  }
  /// Gets a token, and asks for it again, so that it is refreshed.
  std::shared_ptr<const SamlToken> GetAndAskAgain(TokenSource& source, const TokenSpec& spec) {
    const Result result = Get(source, spec);
    EXPECT_NE(result.token, nullptr) << result.message;
    EXPECT_EQ(Get(source, spec).token, result.token);
    return result.token;
  }
  /// Waits until the cache has another token than `token`.
  static std::shared_ptr<const SamlToken> AwaitOther(TokenSource& source, const TokenSpec& spec,
                                                     const SamlToken& token) {
    const auto limit = std::chrono::steady_clock::now() + 1min;
    while (std::chrono::steady_clock::now() < limit) {
      const auto other = source.TryGetToken(spec);
      if (other != nullptr && other.get() != &token) {
        return other;
      }
    }
    return nullptr;
  }

  DevSts::Server sts_;
  const TokenSpec spec_ = SpecFor("https://orders.example.com");
};

TEST_F(RefreshAsyncTest, AShortLivedTokenIsReplacedBeforeItsEnd) {
  Grant(5s);
  const auto source = Make(After(0.2, ConfigFor({&sts_})));
  const auto token = GetAndAskAgain(*source, spec_);
  ASSERT_NE(token, nullptr);
  const auto attempts = AwaitEnded(2);
  ASSERT_EQ(attempts.size(), 2U);
  EXPECT_FALSE(HasEnded(*token));
  EXPECT_FALSE(attempts[0].isRefresh);
  EXPECT_TRUE(attempts[1].isRefresh);
  EXPECT_EQ(attempts[1].failure, FailureKind::kNone);
  const auto next = AwaitOther(*source, spec_, *token);
  ASSERT_NE(next, nullptr);
  EXPECT_GT(next->ExpirationTime().GetUtcTime(), token->ExpirationTime().GetUtcTime());
  EXPECT_EQ(sts_.Requests().size(), 2U);
  EXPECT_EQ(source->Metrics().misses, 1U);
}

TEST_F(RefreshAsyncTest, ATokenThatNobodyAsksForIsNotReplaced) {
  Grant(5s);
  const auto source = Make(After(0.1, ConfigFor({&sts_})));
  const TokenSpec other = SpecFor("https://stock.example.com");
  ASSERT_NE(Get(*source, other).token, nullptr);
  const auto token = GetAndAskAgain(*source, spec_);
  ASSERT_NE(token, nullptr);
  // Its moment is after that of the other one.
  AwaitEnded(3);
  ASSERT_NE(AwaitOther(*source, spec_, *token), nullptr);
  EXPECT_EQ(sts_.Requests().size(), 3U);
  EXPECT_THAT(sts_.LastRequest().body, testing::HasSubstr("https://orders.example.com"));
}

TEST_F(RefreshAsyncTest, ARenewableTokenIsRenewed) {
  const auto source = MakeForBoundTokens();
  const TokenSpec spec = Renewable();
  const auto token = GetAndAskAgain(*source, spec);
  ASSERT_NE(token, nullptr);
  EXPECT_TRUE(token->IsRenewable());
  ASSERT_NE(AwaitOther(*source, spec, *token), nullptr);
  EXPECT_THAT(OperationsOf(AwaitEnded(2)),
              ElementsAre(AttemptOperation::kLogin, AttemptOperation::kRenewal));
  ASSERT_EQ(sts_.Requests().size(), 2U);
  EXPECT_THAT(sts_.LastRequest().body, testing::HasSubstr(kRenewType));
  EXPECT_THAT(sts_.LastRequest().body, testing::HasSubstr(token->Id()));
  EXPECT_EQ(source->Metrics().renewals, 1U);
  EXPECT_EQ(source->Metrics().logins, 1U);
}

TEST_F(RefreshAsyncTest, ARenewalThatFailsLogsIn) {
  const auto source = MakeForBoundTokens();
  const TokenSpec spec = Renewable();
  const auto token = GetAndAskAgain(*source, spec);
  ASSERT_NE(token, nullptr);
  ASSERT_TRUE(sts_.Revoke(token->Id()));
  ASSERT_NE(AwaitOther(*source, spec, *token), nullptr);
  const auto attempts = AwaitEnded(3);
  ASSERT_EQ(attempts.size(), 3U);
  EXPECT_THAT(
      OperationsOf(attempts),
      ElementsAre(AttemptOperation::kLogin, AttemptOperation::kRenewal, AttemptOperation::kLogin));
  EXPECT_NE(attempts[1].failure, FailureKind::kNone);
  EXPECT_EQ(attempts[2].failure, FailureKind::kNone);
  EXPECT_EQ(sts_.Requests().size(), 3U);
  EXPECT_EQ(source->Metrics().renewals, 0U);
  EXPECT_EQ(source->Metrics().refreshFailures, 0U);
}

TEST_F(RefreshAsyncTest, ATokenThatIsNotRenewableIsNotRenewed) {
  const auto source = MakeForBoundTokens();
  const auto token = GetAndAskAgain(*source, spec_);
  ASSERT_NE(token, nullptr);
  EXPECT_FALSE(token->IsRenewable());
  ASSERT_NE(AwaitOther(*source, spec_, *token), nullptr);
  EXPECT_THAT(OperationsOf(AwaitEnded(2)),
              ElementsAre(AttemptOperation::kLogin, AttemptOperation::kLogin));
  EXPECT_THAT(sts_.LastRequest().body, testing::Not(testing::HasSubstr(kRenewType)));
}

TEST_F(RefreshAsyncTest, WhileAllEndpointsAreDownTheTokenIsServedAndRefreshesAreRepeated) {
  Grant(60s);
  DevSts::Server other;
  const auto source = Make(After(0.01, ConfigFor({&sts_, &other})));
  const auto token = GetAndAskAgain(*source, spec_);
  ASSERT_NE(token, nullptr);
  sts_.SetMisbehavior(Answering(503));
  other.SetMisbehavior(Resetting());
  ASSERT_TRUE(
      listener_->Await([](const Records& seen) { return seen.refreshFailures.size() >= 4; }));
  EXPECT_EQ(Get(*source, spec_).token, token);
  const RefreshFailureRecord failure = listener_->Seen().refreshFailures.front();
  EXPECT_TRUE(AllowsFailover(failure.failure));
  ASSERT_TRUE(failure.usableUntil);
  EXPECT_LT(failure.usableUntil->GetUtcTime(), token->ExpirationTime().GetUtcTime());
  EXPECT_GE(source->Metrics().refreshFailures, 4U);

  sts_.ClearMisbehavior();
  const auto next = AwaitOther(*source, spec_, *token);
  ASSERT_NE(next, nullptr);
  EXPECT_FALSE(HasEnded(*token));
  EXPECT_TRUE(AwaitCircuit(sts_.HttpsUrl(), CircuitState::kClosed));
  const auto failures = source->Metrics().refreshFailures;
  ASSERT_NE(Get(*source, SpecFor(1)).token, nullptr);
  EXPECT_EQ(source->Metrics().refreshFailures, failures);
}

// Without the answer, the refresh would be repeated after minutes.
TEST_F(RefreshAsyncTest, TheAnswerToAnotherCallEndsAnOutage) {
  const std::string heldAudience = "https://stock.example.com";
  Gate gate;
  DevSts::ServerOptions options;
  options.onRequest = [&](const DevSts::ReceivedRequest& request) {
    if (request.body.find(heldAudience) != std::string::npos) {
      gate.Pass();
    }
  };
  DevSts::Server sts(options);
  const auto source = Make(After(0.002, ConfigFor({&sts})));
  // From then on, two logins may be under way.
  ASSERT_NE(Get(*source, SpecFor(0)).token, nullptr);
  TokenCalls held;
  held.Begin(*source, SpecFor(heldAudience));
  const bool isHeld = gate.Await(1);
  const auto token = GetAndAskAgain(*source, spec_);
  sts.SetMisbehavior(Answering(503, "3600"));
  const bool hasFailed =
      listener_->Await([](const Records& seen) { return !seen.refreshFailures.empty(); });
  EXPECT_EQ(Get(*source, spec_).token, token);
  sts.ClearMisbehavior();
  gate.Open();
  EXPECT_NE(held.Wait().front().token, nullptr);
  ASSERT_TRUE(isHeld && hasFailed && token != nullptr);
  EXPECT_GE(listener_->Seen().refreshFailures.front().nextAttempt, 2min);
  EXPECT_NE(AwaitOther(*source, spec_, *token), nullptr);
  EXPECT_EQ(source->Metrics().refreshFailures, 1U);
}

TEST_F(RefreshAsyncTest, ATokenToKeepFreshIsThereBeforeTheFirstCall) {
  TokenSourceConfig config = ConfigFor({&sts_});
  config.keepFresh = {spec_};
  const auto source = Make(config);
  AwaitEnded(1);
  EXPECT_NE(source->TryGetToken(spec_), nullptr);
  EXPECT_NE(Get(*source, spec_).token, nullptr);
  EXPECT_EQ(sts_.Requests().size(), 1U);
  EXPECT_EQ(source->Metrics().misses, 0U);
}

TEST_F(RefreshAsyncTest, AnInvalidatedTokenIsReplacedOnce) {
  const auto source = Make(ConfigFor({&sts_}));
  const auto token = Get(*source, spec_).token;
  ASSERT_NE(token, nullptr);
  source->Invalidate(*token);
  const auto next = Get(*source, spec_).token;
  ASSERT_NE(next, nullptr);
  EXPECT_NE(next, token);
  source->Invalidate(*token);
  EXPECT_EQ(Get(*source, spec_).token, next);
  EXPECT_EQ(sts_.Requests().size(), 2U);
}

TEST_F(RefreshAsyncTest, SourcesCompose) {
  TokenSourceConfig config = BoundConfigFor({&sts_});
  config.login = CertificateLogin{};
  TokenSpec delegable = spec_;
  delegable.delegable = true;
  const auto machine = Make(config);
  config.login = TokenLogin{machine, delegable};
  const auto source = CreateTokenSource(config);
  const Result result = Get(*source, SpecFor("https://stock.example.com"));
  ASSERT_NE(result.token, nullptr) << result.message;
  EXPECT_EQ(result.token->Subject().name, "machine");
  EXPECT_EQ(source->Metrics().exchanges, 1U);
  // A token that the service no longer accepts is replaced, and the exchange repeated.
  ASSERT_TRUE(sts_.Revoke(machine->GetToken(delegable)->Id()));
  EXPECT_NE(Get(*source, SpecFor("https://bills.example.com")).token, nullptr);
  EXPECT_EQ(machine->Metrics().logins, 2U);
  EXPECT_EQ(sts_.Requests().size(), 5U);
}

}  // namespace
}  // namespace SsoClient::Access::Testing
