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
    TokenSourceConfig config = Trusting({});
    config.endpoints = {{"http://127.0.0.1:" + std::to_string(silent_.Port()) + "/sts", ""}};
    return CreateTokenSource(config);
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
  const std::shared_ptr<TokenSource> healthySource_ = Make(ConfigFor({&healthy_}));
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
  EXPECT_LE(Threads(), kMaxThreads);
  cancellation.Cancel();
  for (const Result& result : calls.Wait()) {
    EXPECT_TRUE(result.Is<Tarnik::CancelledException>()) << result.type << result.message;
    EXPECT_EQ(result.reports, 1);
  }
  const auto after = BestCall();
  const double ratio = std::chrono::duration<double>(after) / std::chrono::duration<double>(before);
  RecordProperty("ratio", std::to_string(ratio));
  // The bound allows for other programs on the machine.
  EXPECT_LT(ratio, 3.0);
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
  EXPECT_LE(Threads(), kMaxThreads);
  EXPECT_NE(Get(*healthySource_, SpecFor(++calls_)).token, nullptr);
}

}  // namespace
}  // namespace SsoClient::Access::Testing
