// Thousands of calls to a silent service that nobody waits for any longer.
#include <algorithm>
#include <chrono>
#include <cstddef>
#include <filesystem>
#include <iterator>
#include <memory>
#include <string>
#include <vector>

#include <gmock/gmock.h>

#include <tarnik/system/thread_pool.h>

#include "end_to_end/end_to_end_fixture.h"
#include "support/loopback.h"

namespace SsoClient::Access::Testing {
namespace {

using namespace std::chrono_literals;
using Clock = std::chrono::steady_clock;

constexpr std::size_t kAbandoned = 2000;
// `RetryConfig::attemptsAtOnce` by default.
constexpr std::size_t kAtOnce = 64;
// The workers of the pool, its I/O threads, and those of the dev STS and the test.
constexpr std::size_t kMaxThreads = Tarnik::System::ThreadPool::kMaxWorkers + 32;

std::size_t Threads() {
  const std::filesystem::directory_iterator threads("/proc/self/task");
  return static_cast<std::size_t>(std::distance(begin(threads), end(threads)));
}

class AbandonedCallsAsyncTest : public EndToEndTest {
 protected:
  /// A service whose connections are never accepted, and so never answered.
  std::shared_ptr<TokenSource> MakeSilent() const {
    // Of the logins by password, only a few are sent at once.
    TokenSourceConfig config = BoundConfigFor({});
    config.login = CertificateLogin{};
    config.endpoints = {{"http://127.0.0.1:" + std::to_string(silent_.Port()) + "/sts", ""}};
    return Make(config);
  }
  /// Waits until as many attempts as may be made at once are waiting for an answer.
  void AwaitAttempts() const {
    EXPECT_TRUE(listener_->Await([](const Records& seen) { return seen.begun.size() >= kAtOnce; }));
  }
  /// Waits until all attempts have ended, and returns the number.
  std::size_t AwaitAbandoned() const {
    EXPECT_TRUE(listener_->Await([](const Records& seen) {
      return seen.begun.size() >= kAtOnce && seen.ended.size() == seen.begun.size();
    }));
    const std::vector<AttemptRecord> ended = listener_->Seen().ended;
    return static_cast<std::size_t>(std::count_if(
        ended.begin(), ended.end(),
        [](const AttemptRecord& attempt) { return attempt.failure == FailureKind::kAbandoned; }));
  }
  /// The shortest time of a few calls that reach the healthy service.
  Clock::duration BestCall() {
    auto best = Clock::duration::max();
    for (int i = 0; i < 20; ++i) {
      const auto begun = Clock::now();
      const Result result = Get(*healthySource_, SpecFor(++calls_));
      EXPECT_NE(result.token, nullptr) << result.message;
      best = std::min(best, result.ended - begun);
    }
    return best;
  }

  const Tarnik::Testing::LoopbackListener silent_{false, 4096};
  DevSts::Server healthy_;
  const std::shared_ptr<TokenSource> healthySource_ = CreateTokenSource(ConfigFor({&healthy_}));
  std::size_t calls_ = 0;
};

TEST_F(AbandonedCallsAsyncTest, LeaveAHealthyServiceAsFastAsBefore) {
  ASSERT_NE(Get(*healthySource_, SpecFor(++calls_)).token, nullptr);
  const auto before = BestCall();
  const auto silentSource = MakeSilent();
  const CancellationSource cancellation;
  TokenCalls calls;
  for (std::size_t i = 0; i < kAbandoned; ++i) {
    CallContext context = CallContext::Within(10min);
    context.cancellation = cancellation.Token();
    calls.Begin(*silentSource, SpecFor(i), context);
  }
  AwaitAttempts();
  EXPECT_LE(Threads(), kMaxThreads);
  const auto meanwhile = BestCall();
  cancellation.Cancel();
  for (const Result& result : calls.Wait()) {
    EXPECT_TRUE(result.Is<Tarnik::CancelledException>()) << result.type << result.message;
    EXPECT_EQ(result.reports, 1);
  }
  EXPECT_GE(AwaitAbandoned(), kAtOnce);
  const auto after = BestCall();
  const auto ratio = [before](Clock::duration time) {
    return std::chrono::duration<double>(time) / std::chrono::duration<double>(before);
  };
  RecordProperty("ratio_while_they_wait", std::to_string(ratio(meanwhile)));
  RecordProperty("ratio_afterwards", std::to_string(ratio(after)));
  // The bound allows for other programs on the machine.
  EXPECT_LT(ratio(meanwhile), 3.0);
  EXPECT_LT(ratio(after), 3.0);
  EXPECT_LE(Threads(), kMaxThreads);
}

TEST_F(AbandonedCallsAsyncTest, EndAtTheirDeadlines) {
  const auto silentSource = MakeSilent();
  TokenCalls calls;
  for (std::size_t i = 0; i < kAbandoned; ++i) {
    calls.Begin(*silentSource, SpecFor(i), CallContext::Within(500ms));
  }
  for (const Result& result : calls.Wait()) {
    EXPECT_TRUE(result.Is<CommunicationException>()) << result.type << result.message;
  }
  EXPECT_GE(AwaitAbandoned(), kAtOnce);
  EXPECT_LE(Threads(), kMaxThreads);
  EXPECT_NE(Get(*healthySource_, SpecFor(++calls_)).token, nullptr);
}

}  // namespace
}  // namespace SsoClient::Access::Testing
