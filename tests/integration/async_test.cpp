#include <atomic>
#include <chrono>
#include <functional>
#include <future>
#include <memory>
#include <string>
#include <thread>
#include <typeinfo>
#include <vector>

#include <gtest/gtest.h>

#include "integration/sts_fixture.h"

namespace SsoClient::Testing {
namespace {

class AsyncTest : public StsTest {};

/// What a callback received, kept after the call.
struct Outcome {
  std::shared_ptr<const SamlToken> token;
  std::unique_ptr<Tarnik::Throwable> error;
};

std::future<Outcome> AcquireAsync(const SecurityTokenService& service, const std::string& user,
                                  const std::string& password) {
  auto promise = std::make_shared<std::promise<Outcome>>();
  auto future = promise->get_future();
  service.AcquireTokenAsync(
      user, password, TenMinutes(),
      [promise](const std::shared_ptr<const SamlToken>& token, const Tarnik::Exception* error) {
        promise->set_value({token, error == nullptr ? nullptr : error->Clone()});
      });
  return future;
}

constexpr std::chrono::seconds kPatience{120};

TEST_F(AsyncTest, SuccessReachesTheCallback) {
  auto future = AcquireAsync(*Service(), kUser, kPassword);
  ASSERT_EQ(future.wait_for(kPatience), std::future_status::ready);
  const Outcome outcome = future.get();
  ASSERT_NE(outcome.token, nullptr);
  EXPECT_EQ(outcome.error, nullptr);
  EXPECT_EQ(outcome.token->Subject().name, "alice");
}

TEST_F(AsyncTest, FailureReachesTheCallbackWithItsExactClass) {
  const Outcome outcome = AcquireAsync(*Service(), kUser, "wrong-secret").get();
  EXPECT_EQ(outcome.token, nullptr);
  ASSERT_NE(outcome.error, nullptr);
  EXPECT_EQ(typeid(*outcome.error), typeid(InvalidCredentialsException));
  EXPECT_EQ(typeid(*AcquireAsync(*Service(), "expired@EXAMPLE.COM", "expired-secret").get().error),
            typeid(PasswordExpiredException));
  const auto nowhere = MakeService(Sts(), "https://sts.invalid/sts");
  EXPECT_EQ(typeid(*AcquireAsync(*nowhere, kUser, kPassword).get().error),
            typeid(CommunicationException));
}

TEST_F(AsyncTest, ArgumentErrorsReachTheCallbackToo) {
  // Shared, here and below: the callback may not have returned yet when the result is available.
  const auto promise = std::make_shared<std::promise<std::string>>();
  Service()->AcquireTokenAsync(
      kUser, kPassword, TokenSpec{},
      [promise](const std::shared_ptr<const SamlToken>&, const Tarnik::Exception* error) {
        promise->set_value(error == nullptr ? "" : error->Message());
      });
  EXPECT_EQ(promise->get_future().get(), "Token lifetime must be positive");
}

TEST_F(AsyncTest, ServiceMayBeReleasedBeforeTheCallEnds) {
  DevSts::Misbehavior slow;
  slow.delayBeforeAnswer = std::chrono::milliseconds(200);
  Sts().SetMisbehavior(slow);
  auto service = Service();
  auto future = AcquireAsync(*service, kUser, kPassword);
  service.reset();
  EXPECT_NE(future.get().token, nullptr);
}

TEST_F(AsyncTest, CallbackMayStartTheNextCall) {
  const auto service = Service();
  const auto promise = std::make_shared<std::promise<int>>();
  std::function<void(int)> next = [&](int left) {
    service->AcquireTokenAsync(kUser, kPassword, TenMinutes(),
                               [&, promise, left](const auto& token, const Tarnik::Exception*) {
                                 if (token == nullptr || left == 0) {
                                   promise->set_value(left);
                                   return;
                                 }
                                 next(left - 1);
                               });
  };
  next(5);
  EXPECT_EQ(promise->get_future().get(), 0);
}

TEST_F(AsyncTest, CallbackMayBlockOnASynchronousCall) {
  const auto service = Service();
  std::vector<std::future<bool>> results;
  for (int i = 0; i < 20; ++i) {
    auto promise = std::make_shared<std::promise<bool>>();
    results.push_back(promise->get_future());
    service->AcquireTokenAsync(
        kUser, kPassword, TenMinutes(), [&, promise](const auto& token, const Tarnik::Exception*) {
          promise->set_value(token != nullptr &&
                             service->AcquireToken(kUser, kPassword, TenMinutes()) != nullptr);
        });
  }
  for (auto& result : results) {
    EXPECT_TRUE(result.get());
  }
}

TEST_F(AsyncTest, ThousandCallsInFlightAllComplete) {
  constexpr int kCalls = 1000;
  auto service = Service();
  std::vector<std::future<Outcome>> futures;
  futures.reserve(kCalls);
  for (int i = 0; i < kCalls; ++i) {
    futures.push_back(AcquireAsync(*service, kUser, i % 10 == 0 ? "wrong-secret" : kPassword));
  }
  service.reset();
  int tokens = 0;
  int refusals = 0;
  for (auto& future : futures) {
    const Outcome outcome = future.get();
    tokens += outcome.token != nullptr ? 1 : 0;
    refusals += dynamic_cast<InvalidCredentialsException*>(outcome.error.get()) != nullptr ? 1 : 0;
  }
  EXPECT_EQ(tokens, 900);
  EXPECT_EQ(refusals, 100);
}

TEST_F(AsyncTest, ConcurrentSynchronousCallsAllComplete) {
  constexpr int kThreads = 16;
  constexpr int kCallsEach = 125;
  const auto service = Service();
  std::atomic<int> tokens{0};
  std::vector<std::thread> threads;
  for (int t = 0; t < kThreads; ++t) {
    threads.emplace_back([&] {
      for (int i = 0; i < kCallsEach; ++i) {
        tokens += service->AcquireToken(kUser, kPassword, TenMinutes()) != nullptr ? 1 : 0;
      }
    });
  }
  for (auto& thread : threads) {
    thread.join();
  }
  EXPECT_EQ(tokens, kThreads * kCallsEach);
}

}  // namespace
}  // namespace SsoClient::Testing
