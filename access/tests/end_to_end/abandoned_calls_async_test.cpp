// Thousands of calls to a silent service that nobody waits for any longer.
#include <algorithm>
#include <chrono>
#include <cstddef>
#include <filesystem>
#include <functional>
#include <iterator>
#include <memory>
#include <string>
#include <vector>

#include <gmock/gmock.h>

#include <tarnik/system/thread_pool.h>

#include "end_to_end/end_to_end_fixture.h"
#include "integration/holder_of_key_fixture.h"
#include "support/loopback.h"

namespace SsoClient::Access::Testing {
namespace {

using namespace std::chrono_literals;
using Clock = std::chrono::steady_clock;

constexpr std::size_t kAbandoned = 2000;
// The workers of the pool, its I/O threads, and those of the dev STS and the test.
constexpr std::size_t kMaxThreads = Tarnik::System::ThreadPool::kMaxWorkers + 32;
// Allows for other programs on the machine.
constexpr double kMaxRatio = 3.0;

std::size_t Threads() {
  const std::filesystem::directory_iterator threads("/proc/self/task");
  return static_cast<std::size_t>(std::distance(begin(threads), end(threads)));
}

double Ratio(Clock::duration duration, Clock::duration reference) {
  return std::chrono::duration<double>(duration) / std::chrono::duration<double>(reference);
}

class AbandonedCallsAsyncTest : public EndToEndTest {
 protected:
  /// A source for a service whose connections are never accepted, and so never answered.
  std::shared_ptr<TokenSource> MakeSilent() const {
    TokenSourceConfig config = Trusting({});
    config.endpoints = {{"http://127.0.0.1:" + std::to_string(silent_.Port()) + "/sts", ""}};
    return CreateTokenSource(config);
  }
  Clock::duration TimeOfCall() {
    const auto begun = Clock::now();
    const Result result = Get(*healthySource_, SpecFor(++calls_));
    EXPECT_NE(result.token, nullptr) << result.message;
    return result.ended - begun;
  }
  /// The shortest time of a few calls that reach the healthy service.
  Clock::duration BestCall() {
    auto best = Clock::duration::max();
    for (int i = 0; i < 20; ++i) {
      best = std::min(best, TimeOfCall());
    }
    return best;
  }
  /// The ratio of the shortest time of a few calls to `before`. More calls are made if it is large,
  /// since another program may have slowed down the first ones.
  double RatioTo(Clock::duration before) {
    double ratio = Ratio(BestCall(), before);
    for (int i = 0; i < 10 && ratio >= kMaxRatio && !HasFailure(); ++i) {
      ratio = std::min(ratio, Ratio(BestCall(), before));
    }
    return ratio;
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
  const double ratio = RatioTo(before);
  RecordProperty("ratio", std::to_string(ratio));
  EXPECT_LT(ratio, kMaxRatio);
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

/// As many attempts as may be are under way at a silent service: logins by certificate do not wait
/// for each other after one has been accepted.
class AbandonedAttemptsAsyncTest : public AbandonedCallsAsyncTest {
 protected:
  static constexpr std::size_t kAtOnce = 64;

  AbandonedAttemptsAsyncTest() {
    service_.RegisterCertificate(SsoClient::Testing::kMachine,
                                 SsoClient::Testing::Holder().certificatePem);
    TokenSourceConfig config = BoundConfigFor({&service_});
    config.endpoints = {{service_.HttpUrl(), ""}};
    config.login = CertificateLogin{};
    // No attempt ends by itself.
    config.retry.attemptTimeout = 240s;
    EXPECT_EQ(config.retry.attemptsAtOnce, static_cast<int>(kAtOnce));
    source_ = CreateTokenSource(config);
  }

  /// The service accepts a login, and is silent from then on.
  void Silence() {
    service_.ClearMisbehavior();
    const Result result = Get(*source_, SpecFor(++calls_));
    ASSERT_NE(result.token, nullptr) << result.message;
    service_.SetMisbehavior(Stalling(DevSts::Stall::BeforeAnswer));
  }
  TokenCalls BeginCalls(const std::function<CallContext()>& makeContext) {
    TokenCalls calls;
    for (std::size_t i = 0; i < kAbandoned; ++i) {
      calls.Begin(*source_, SpecFor(++calls_), makeContext());
    }
    return calls;
  }
  bool AwaitUnderWay(std::chrono::milliseconds limit) const {
    return service_.WaitUntil([](const auto& seen) { return seen.stalled == kAtOnce; }, limit);
  }
  /// Waits until no attempt is under way. The source then works as before.
  void ExpectNothingLeft() {
    EXPECT_TRUE(
        service_.WaitUntil([](const auto& seen) { return seen.connectionsOpen == 0; }, 1min));
    service_.ClearMisbehavior();
    const Result result = Get(*source_, SpecFor(++calls_), CallContext::Within(1min));
    EXPECT_NE(result.token, nullptr) << result.message;
  }

  DevSts::Server service_;
  std::shared_ptr<TokenSource> source_;
};

TEST_F(AbandonedAttemptsAsyncTest, LeaveAHealthyServiceAsFastAsBefore) {
  ASSERT_NE(Get(*healthySource_, SpecFor(++calls_)).token, nullptr);
  const auto before = BestCall();
  Silence();
  const CancellationSource cancellation;
  CallContext context;
  context.cancellation = cancellation.Token();
  const TokenCalls calls = BeginCalls([&context] { return context; });
  ASSERT_TRUE(AwaitUnderWay(1min));
  const double during = RatioTo(before);
  RecordProperty("ratio while they wait", std::to_string(during));
  EXPECT_LT(during, kMaxRatio);
  EXPECT_LE(Threads(), kMaxThreads + kAtOnce);
  EXPECT_EQ(service_.GetCounters().stalled, kAtOnce);
  EXPECT_EQ(calls.Reported(), 0U);

  cancellation.Cancel();
  for (const Result& result : calls.Wait()) {
    EXPECT_TRUE(result.Is<Tarnik::CancelledException>()) << result.type << result.message;
    EXPECT_EQ(result.reports, 1);
  }
  ExpectNothingLeft();
  const double after = RatioTo(before);
  RecordProperty("ratio after they have left", std::to_string(after));
  EXPECT_LT(after, kMaxRatio);
}

TEST_F(AbandonedAttemptsAsyncTest, EndWhenTheDeadlinesOfTheirCallersHavePassed) {
  // On a slow machine, it takes long until so many are under way.
  bool wereUnderWay = false;
  for (auto limit = 1000ms; limit <= 32s && !wereUnderWay; limit *= 2) {
    Silence();
    const TokenCalls calls = BeginCalls([limit] { return CallContext::Within(limit); });
    wereUnderWay = AwaitUnderWay(limit);
    for (const Result& result : calls.Wait()) {
      EXPECT_TRUE(result.Is<CommunicationException>()) << result.type << result.message;
      EXPECT_EQ(result.reports, 1);
    }
    ExpectNothingLeft();
  }
  EXPECT_TRUE(wereUnderWay);
}

}  // namespace
}  // namespace SsoClient::Access::Testing
