// Callers who share one request.
#include <atomic>
#include <chrono>
#include <memory>
#include <string>
#include <thread>
#include <vector>

#include <gmock/gmock.h>

#include "end_to_end/end_to_end_fixture.h"

namespace SsoClient::Access::Testing {
namespace {

using namespace std::chrono_literals;

constexpr std::size_t kAsyncCallers = 3000;
constexpr std::size_t kBlockedCallers = 32;

class SharingAsyncTest : public EndToEndTest {
 protected:
  ~SharingAsyncTest() override { gate_.Open(); }

  Gate gate_;
  DevSts::Server sts_{Passing(gate_)};
  const std::shared_ptr<TokenSource> source_ = Make(ConfigFor({&sts_}));
  const TokenSpec spec_ = SpecFor("https://orders.example.com");
};

/// Threads that wait for the token of one spec.
class BlockedCallers {
 public:
  BlockedCallers(TokenSource& source, const TokenSpec& spec, std::size_t count) : results_(count) {
    for (Result& result : results_) {
      threads_.emplace_back([&] { result = Get(source, spec); });
    }
  }
  BlockedCallers(const BlockedCallers&) = delete;
  BlockedCallers& operator=(const BlockedCallers&) = delete;
  ~BlockedCallers() { Join(); }

  const std::vector<Result>& Wait() {
    Join();
    return results_;
  }

 private:
  void Join() {
    for (std::thread& thread : threads_) {
      if (thread.joinable()) {
        thread.join();
      }
    }
  }

  std::vector<Result> results_;
  std::vector<std::thread> threads_;
};

TEST_F(SharingAsyncTest, ThousandsOfCallersCauseOneRequest) {
  TokenCalls calls;
  for (std::size_t i = 0; i < kAsyncCallers; ++i) {
    calls.Begin(*source_, spec_);
  }
  BlockedCallers blocked(*source_, spec_, kBlockedCallers);
  AwaitCallers(*source_, kAsyncCallers + kBlockedCallers);
  gate_.Open();
  const std::vector<Result> results = calls.Wait();
  const auto& token = results.front().token;
  ASSERT_NE(token, nullptr) << results.front().message;
  EXPECT_EQ(token->Subject().name, "alice");
  for (const Result& result : results) {
    EXPECT_EQ(result.token, token);
  }
  for (const Result& result : blocked.Wait()) {
    EXPECT_EQ(result.token, token);
  }
  EXPECT_EQ(sts_.Requests().size(), 1U);
  const TokenSourceMetrics metrics = source_->Metrics();
  EXPECT_EQ(metrics.misses, 1U);
  EXPECT_EQ(metrics.shared, kAsyncCallers + kBlockedCallers - 1);
  EXPECT_EQ(metrics.logins, 1U);
  EXPECT_EQ(metrics.callersWaiting, 0U);
}

TEST_F(SharingAsyncTest, ThousandsOfCallersGetTheFailureOfOneRequest) {
  sts_.SetMisbehavior(Refusing("RequestFailed"));
  TokenCalls calls;
  for (std::size_t i = 0; i < kAsyncCallers; ++i) {
    calls.Begin(*source_, spec_);
  }
  BlockedCallers blocked(*source_, spec_, kBlockedCallers);
  AwaitCallers(*source_, kAsyncCallers + kBlockedCallers);
  gate_.Open();
  const std::vector<Result> results = calls.Wait();
  EXPECT_THAT(results.front().message, testing::StartsWith("Unexpected SOAP fault: "));
  for (const Result& result : results) {
    EXPECT_TRUE(result.Is<SsoException>());
    EXPECT_EQ(result.message, results.front().message);
  }
  for (const Result& result : blocked.Wait()) {
    EXPECT_TRUE(result.Is<SsoException>());
    EXPECT_EQ(result.message, results.front().message);
  }
  EXPECT_EQ(sts_.Requests().size(), 1U);
}

TEST_F(SharingAsyncTest, CallersLeaveAndTheOthersGetTheToken) {
  const CancellationSource cancellation;
  CallContext cancellable;
  cancellable.cancellation = cancellation.Token();
  TokenCalls cancelled;
  TokenCalls late;
  TokenCalls patient;
  patient.Begin(*source_, spec_);
  for (int i = 0; i < 100; ++i) {
    cancelled.Begin(*source_, spec_, cancellable);
    late.Begin(*source_, spec_, CallContext::Within(500ms));
    patient.Begin(*source_, spec_);
  }
  ASSERT_TRUE(gate_.Await(1));
  cancellation.Cancel();
  for (const Result& result : cancelled.Wait()) {
    EXPECT_TRUE(result.Is<Tarnik::CancelledException>()) << result.type;
  }
  for (const Result& result : late.Wait()) {
    EXPECT_TRUE(result.Is<CommunicationException>()) << result.type;
    EXPECT_THAT(result.message,
                testing::StartsWith("The deadline passed while the call was waiting for "));
  }
  EXPECT_EQ(patient.Reported(), 0U);
  EXPECT_EQ(sts_.GetCounters().connectionsOpen, 1U);
  gate_.Open();
  for (const Result& result : patient.Wait()) {
    EXPECT_NE(result.token, nullptr) << result.message;
  }
  EXPECT_EQ(sts_.Requests().size(), 1U);
}

TEST_F(SharingAsyncTest, TheLastCallerThatLeavesEndsTheRequest) {
  gate_.Open();
  // An attempt with a password that was not accepted lately would go on.
  ASSERT_NE(Get(*source_, SpecFor(99)).token, nullptr);
  sts_.SetMisbehavior(Stalling(DevSts::Stall::BeforeAnswer));
  const CancellationSource first;
  const CancellationSource last;
  TokenCalls calls;
  for (const auto& cancellation : {first, last}) {
    CallContext context;
    context.cancellation = cancellation.Token();
    calls.Begin(*source_, spec_, context);
  }
  ASSERT_TRUE(sts_.WaitUntil([](const auto& seen) { return seen.stalled == 1; }, 1min));
  first.Cancel();
  EXPECT_EQ(listener_->Seen().ended.size(), 1U);
  EXPECT_EQ(sts_.GetCounters().connectionsOpen, 1U);
  last.Cancel();
  EXPECT_TRUE(sts_.WaitUntil([](const auto& seen) { return seen.connectionsOpen == 0; }, 1min));
  for (const Result& result : calls.Wait()) {
    EXPECT_TRUE(result.Is<Tarnik::CancelledException>());
  }
  ASSERT_TRUE(listener_->Await([](const Records& seen) { return seen.ended.size() == 2; }));
  EXPECT_EQ(listener_->Seen().ended.back().failure, FailureKind::kAbandoned);

  sts_.ClearMisbehavior();
  EXPECT_NE(Get(*source_, spec_).token, nullptr);
  EXPECT_EQ(sts_.Requests().size(), 3U);
}

}  // namespace
}  // namespace SsoClient::Access::Testing
