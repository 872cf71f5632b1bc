// Sources that are stopped or destroyed with callers inside.
#include <atomic>
#include <chrono>
#include <future>
#include <memory>
#include <string>
#include <thread>
#include <utility>
#include <vector>

#include <gmock/gmock.h>

#include "end_to_end/end_to_end_fixture.h"

namespace SsoClient::Access::Testing {
namespace {

using namespace std::chrono_literals;
using Clock = std::chrono::steady_clock;

constexpr std::size_t kAsyncCallers = 300;
constexpr std::size_t kBlockedCallers = 16;
// Far from the limits of the calls, also on a busy machine.
constexpr auto kSoon = 5s;

class StopAsyncTest : public EndToEndTest {
 protected:
  StopAsyncTest() { sts_.SetMisbehavior(Stalling(DevSts::Stall::BeforeAnswer)); }

  /// Calls for the tokens of a few specs.
  void BeginCalls() {
    for (std::size_t i = 0; i < kAsyncCallers; ++i) {
      calls_.Begin(*source_, SpecFor(i % 8));
    }
  }
  void ExpectStopped() {
    for (const Result& result : calls_.Wait()) {
      EXPECT_TRUE(result.Is<Tarnik::InvalidStateException>()) << result.type << result.message;
      EXPECT_EQ(result.reports, 1);
    }
    EXPECT_TRUE(sts_.WaitUntil([](const auto& seen) { return seen.connectionsOpen == 0; }, 1min));
  }

  DevSts::Server sts_;
  std::shared_ptr<TokenSource> source_ = Make(ConfigFor({&sts_}));
  TokenCalls calls_;
};

TEST_F(StopAsyncTest, StopEndsAllCallers) {
  std::vector<std::thread> threads;
  std::vector<Result> blocked(kBlockedCallers);
  BeginCalls();
  for (std::size_t i = 0; i < kBlockedCallers; ++i) {
    threads.emplace_back([&, i] { blocked[i] = Get(*source_, SpecFor(i)); });
  }
  AwaitCallers(*source_, kAsyncCallers + kBlockedCallers);
  const auto begun = Clock::now();
  EXPECT_TRUE(source_->Stop(30s));
  EXPECT_LT(Clock::now() - begun, kSoon);
  // No callback is running any more.
  EXPECT_EQ(calls_.Reported(), kAsyncCallers);
  for (std::thread& thread : threads) {
    thread.join();
  }
  for (const Result& result : blocked) {
    EXPECT_TRUE(result.Is<Tarnik::InvalidStateException>()) << result.type;
  }
  ExpectStopped();
  EXPECT_TRUE(Get(*source_, SpecFor(0)).Is<Tarnik::InvalidStateException>());
  EXPECT_THROW(source_->TryGetToken(SpecFor(0)), Tarnik::InvalidStateException);
}

TEST_F(StopAsyncTest, TheDestructorEndsAllCallers) {
  BeginCalls();
  AwaitCallers(*source_, kAsyncCallers);
  const auto begun = Clock::now();
  source_.reset();
  EXPECT_LT(Clock::now() - begun, kSoon);
  EXPECT_EQ(calls_.Reported(), kAsyncCallers);
  ExpectStopped();
}

TEST_F(StopAsyncTest, StopReturnsAtItsLimitWhileTheLoginsFunctionRuns) {
  Gate gate;
  TokenSourceConfig config = ConfigFor({&sts_});
  config.login = PasswordLogin{kUser, [&gate] {
                                 gate.Pass();
                                 return std::string(kPassword);
                               }};
  source_ = Make(config);
  calls_.Begin(*source_, SpecFor(0));
  ASSERT_TRUE(gate.Await(1));
  const auto begun = Clock::now();
  EXPECT_FALSE(source_->Stop(100ms));
  EXPECT_GE(Clock::now() - begun, 100ms);
  EXPECT_LT(Clock::now() - begun, kSoon);
  ExpectStopped();
  gate.Open();
  EXPECT_TRUE(source_->Stop(30s));
  EXPECT_TRUE(sts_.Requests().empty());
}

TEST_F(StopAsyncTest, ACallbackStopsTheSource) {
  sts_.ClearMisbehavior();
  std::promise<bool> stopped;
  source_->GetTokenAsync(SpecFor(0), {}, [&](const auto&, const Tarnik::Exception*) {
    stopped.set_value(source_->Stop(30s));
  });
  EXPECT_TRUE(stopped.get_future().get());
  EXPECT_TRUE(Get(*source_, SpecFor(0)).Is<Tarnik::InvalidStateException>());
}

TEST_F(StopAsyncTest, ACallbackReleasesTheLastReference) {
  sts_.ClearMisbehavior();
  std::promise<void> released;
  auto* const source = source_.get();
  source->GetTokenAsync(SpecFor(0), {},
                        [&released, kept = std::make_shared<std::shared_ptr<TokenSource>>(
                                        std::move(source_))](const auto&, const auto*) {
                          kept->reset();
                          released.set_value();
                        });
  ASSERT_EQ(released.get_future().wait_for(1min), std::future_status::ready);
}

TEST_F(StopAsyncTest, RefreshesUnderWayEnd) {
  TokenSourceConfig config = ConfigFor({&sts_});
  for (std::size_t i = 0; i < 4; ++i) {
    config.keepFresh.push_back(SpecFor(i));
  }
  source_ = Make(config);
  ASSERT_TRUE(sts_.WaitUntil([](const auto& seen) { return seen.stalled >= 1; }, 1min));
  const auto begun = Clock::now();
  source_.reset();
  EXPECT_LT(Clock::now() - begun, kSoon);
  ExpectStopped();
}

TEST_F(StopAsyncTest, TheDestructorDoesNotWaitForAFunctionThatBlocks) {
  const auto gate = std::make_shared<Gate>();
  auto kept = std::make_shared<int>(0);
  const std::weak_ptr<int> left = kept;
  TokenSourceConfig config = ConfigFor({&sts_});
  config.login = PasswordLogin{kUser, [gate, kept = std::exchange(kept, nullptr)] {
                                 gate->Pass();
                                 return std::string(kPassword);
                               }};
  source_ = Make(std::move(config));
  calls_.Begin(*source_, SpecFor(0));
  ASSERT_TRUE(gate->Await(1));
  auto destroyed = std::async(std::launch::async, [this] { source_.reset(); });
  EXPECT_EQ(destroyed.wait_for(20s), std::future_status::ready);
  const Result result = calls_.Wait().front();
  EXPECT_TRUE(result.Is<Tarnik::InvalidStateException>()) << result.type;
  EXPECT_EQ(result.reports, 1);
  EXPECT_FALSE(left.expired());
  // The password is not sent, and nothing remains.
  gate->Open();
  const auto limit = Clock::now() + 1min;
  while (!left.expired() && Clock::now() < limit) {
    std::this_thread::yield();
  }
  EXPECT_TRUE(left.expired());
  EXPECT_EQ(sts_.GetCounters().connectionsAccepted, 0U);
}

// Their code may be that of a plug-in, which is unloaded next.
TEST_F(StopAsyncTest, NothingOfTheUserIsLeftAfterTheDestructor) {
  sts_.ClearMisbehavior();
  for (int i = 0; i < 30; ++i) {
    std::weak_ptr<int> left;
    std::weak_ptr<AwaitingListener> leftListener;
    {
      const auto kept = std::make_shared<int>(0);
      left = kept;
      TokenSourceConfig config = Trusting({&sts_});
      config.endpoints = {{sts_.HttpUrl(), ""}};
      config.login = PasswordLogin{kUser, [kept] { return std::string(kPassword); }};
      config.refresh.fraction = 0.0001;
      config.refresh.jitter = 0;
      config.keepFresh = {SpecFor(0), SpecFor(1)};
      config.listener = std::make_shared<AwaitingListener>();
      leftListener = std::static_pointer_cast<AwaitingListener>(config.listener);
      source_ = CreateTokenSource(std::move(config));
    }
    EXPECT_NE(Get(*source_, SpecFor(0)).token, nullptr);
    for (std::size_t call = 0; call < 20; ++call) {
      calls_.Begin(*source_, SpecFor(call));
    }
    source_.reset();
    ASSERT_TRUE(left.expired()) << "round " << i;
    ASSERT_TRUE(leftListener.expired()) << "round " << i;
  }
}

}  // namespace
}  // namespace SsoClient::Access::Testing
