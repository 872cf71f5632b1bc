// Logins that are refused reach one service once.
#include <atomic>
#include <chrono>
#include <memory>
#include <mutex>
#include <string>
#include <thread>
#include <utility>
#include <vector>

#include <gmock/gmock.h>

#include "end_to_end/end_to_end_fixture.h"
#include "end_to_end/silent_resolver.h"

namespace SsoClient::Access::Testing {
namespace {

constexpr std::size_t kAsyncCallers = 50;
constexpr std::size_t kBlockedCallers = 10;

/// A password that the test changes.
class Vault {
 public:
  explicit Vault(std::string password) : password_(std::move(password)) {}

  void Set(const std::string& password) {
    const std::lock_guard lock(mutex_);
    password_ = password;
  }
  std::string Get() const {
    const std::lock_guard lock(mutex_);
    return password_;
  }

 private:
  mutable std::mutex mutex_;
  std::string password_;
};

class AccountAsyncTest : public EndToEndTest {
 protected:
  std::shared_ptr<TokenSource> MakeFor(const std::string& user, const std::string& password) {
    vault_->Set(password);
    TokenSourceConfig config = ConfigFor({&first_, &second_});
    config.login = PasswordLogin{user, [vault = vault_] { return vault->Get(); }};
    return Make(config);
  }
  std::size_t Requests() const { return RequestsOf({&first_, &second_}); }

  /// Many callers at once, half of them for the same token.
  static std::vector<Result> GetMany(TokenSource& source) {
    TokenCalls calls;
    std::vector<std::thread> threads;
    std::vector<Result> blocked(kBlockedCallers);
    for (std::size_t i = 0; i < kAsyncCallers; ++i) {
      calls.Begin(source, SpecFor(i % 2 == 0 ? 0 : i));
    }
    for (std::size_t i = 0; i < kBlockedCallers; ++i) {
      threads.emplace_back([&, i] { blocked[i] = Get(source, SpecFor(i)); });
    }
    for (std::thread& thread : threads) {
      thread.join();
    }
    std::vector<Result> results = calls.Wait();
    results.insert(results.end(), blocked.begin(), blocked.end());
    return results;
  }

  DevSts::Server first_;
  DevSts::Server second_;
  const std::shared_ptr<Vault> vault_ = std::make_shared<Vault>("");
};

TEST_F(AccountAsyncTest, AWrongPasswordReachesOneServiceOnce) {
  const auto source = MakeFor(kUser, "wrong");
  const std::vector<Result> results = GetMany(*source);
  EXPECT_EQ(results.size(), kAsyncCallers + kBlockedCallers);
  for (const Result& result : results) {
    EXPECT_TRUE(result.Is<InvalidCredentialsException>()) << result.type;
    EXPECT_EQ(result.message, results.front().message);
  }
  EXPECT_EQ(Requests(), 1U);
  EXPECT_GE(source->Metrics().refusedFromMemory, 1U);
  const auto attempts = AwaitEnded(1);
  ASSERT_EQ(attempts.size(), 1U);
  EXPECT_EQ(attempts[0].failure, FailureKind::kRefusedLogin);
}

TEST_F(AccountAsyncTest, AnExpiredPasswordReachesOneServiceOnce) {
  const auto source = MakeFor("expired@EXAMPLE.COM", "expired-secret");
  for (int round = 0; round < 2; ++round) {
    for (const Result& result : GetMany(*source)) {
      EXPECT_TRUE(result.Is<PasswordExpiredException>()) << result.type;
    }
  }
  EXPECT_EQ(Requests(), 1U);
  EXPECT_EQ(AwaitEnded(1)[0].failure, FailureKind::kExpiredPassword);
}

TEST_F(AccountAsyncTest, AChangedPasswordIsUsedAtOnce) {
  const auto source = MakeFor(kUser, "wrong");
  GetMany(*source);
  EXPECT_EQ(Requests(), 1U);
  vault_->Set(kPassword);
  const Result result = Get(*source, SpecFor(0));
  EXPECT_NE(result.token, nullptr) << result.message;
  EXPECT_EQ(Requests(), 2U);
  // And so is one that becomes wrong; the token in the cache remains.
  vault_->Set("wrong");
  EXPECT_TRUE(Get(*source, SpecFor(1)).Is<InvalidCredentialsException>());
  EXPECT_EQ(Get(*source, SpecFor(0)).token, result.token);
  EXPECT_EQ(Requests(), 2U);
}

TEST_F(AccountAsyncTest, ACallThatLeavesBeforeThePasswordIsSentDelaysNoOther) {
  const SilentResolver resolver;
  TokenSourceConfig config = Trusting({});
  config.endpoints = {{"http://" + std::string(SilentResolver::kSilentHost) + "/sts", ""}};
  // The pause if nobody knew what the service thinks of the password.
  config.retry.firstDelay = config.retry.longestDelay = std::chrono::hours(1000);
  const auto source = Make(config);
  const CancellationSource cancellation;
  CallContext context;
  context.cancellation = cancellation.Token();
  TokenCalls calls;
  calls.Begin(*source, SpecFor(0), context);
  ASSERT_TRUE(resolver.Await(1));
  cancellation.Cancel();
  EXPECT_TRUE(calls.Wait().front().Is<Tarnik::CancelledException>());
  calls.Begin(*source, SpecFor(1));
  EXPECT_TRUE(listener_->Await([](const Records& seen) { return seen.begun.size() == 2; }));
}

TEST_F(AccountAsyncTest, TheLongestDurationsOfAConfigurationWork) {
  TokenSourceConfig config = ConfigFor({&first_});
  config.login = PasswordLogin{kUser, [vault = vault_] { return vault->Get(); }};
  config.refresh.longestMargin = std::chrono::seconds::max();
  config.retry.firstDelay = std::chrono::milliseconds::max();
  config.retry.longestDelay = std::chrono::milliseconds::max();
  config.retry.longestRetryAfter = std::chrono::milliseconds::max();
  config.retry.refusalMemory = std::chrono::seconds::max();
  const auto source = Make(config);
  vault_->Set(kPassword);
  const Result result = Get(*source, SpecFor(0));
  ASSERT_NE(result.token, nullptr) << result.message;
  vault_->Set("wrong");
  for (std::size_t i = 1; i < 4; ++i) {
    EXPECT_TRUE(Get(*source, SpecFor(i)).Is<InvalidCredentialsException>());
  }
  EXPECT_EQ(Requests(), 2U);
  EXPECT_EQ(Get(*source, SpecFor(0)).token, result.token);
}

TEST_F(AccountAsyncTest, AFailureBeforeTheLoginIsJudgedCountsForNothing) {
  first_.SetMisbehavior(Resetting());
  const auto source = MakeFor(kUser, "wrong");
  for (const Result& result : GetMany(*source)) {
    EXPECT_TRUE(result.Is<InvalidCredentialsException>()) << result.type << result.message;
  }
  EXPECT_EQ(second_.Requests().size(), 1U);
}

}  // namespace
}  // namespace SsoClient::Access::Testing
