// All functions of one source on many threads at once.
#include <atomic>
#include <chrono>
#include <cstddef>
#include <functional>
#include <memory>
#include <string>
#include <thread>
#include <vector>

#include <gmock/gmock.h>

#include "end_to_end/end_to_end_fixture.h"

namespace SsoClient::Access::Testing {
namespace {

using namespace std::chrono_literals;

constexpr std::size_t kSpecs = 6;
constexpr std::size_t kRounds = 60;

class MixedLoadThreadTest : public EndToEndTest {
 protected:
  MixedLoadThreadTest() {
    TokenSourceConfig config = ConfigFor({&first_, &second_});
    // Tokens are evicted, and refreshed while they are in use.
    config.cache.capacity = kSpecs - 1;
    config.refresh.fraction = 0.001;
    config.refresh.jitter = 0;
    config.retry.firstDelay = config.retry.longestDelay = 1ms;
    source_ = Make(config);
  }

  static std::vector<std::function<void(TokenSource&, std::size_t)>> Callers() {
    return {
        [](TokenSource& source, std::size_t i) { Expect(Get(source, SpecFor(i % kSpecs))); },
        [](TokenSource& source, std::size_t i) {
          Expect(Get(source, SpecFor(i % kSpecs), CallContext::Within(1ms * (i % 7 + 1))));
        },
        [](TokenSource& source, std::size_t i) {
          const CancellationSource cancellation;
          CallContext context;
          context.cancellation = cancellation.Token();
          TokenCalls calls;
          calls.Begin(source, SpecFor(i % kSpecs), context);
          calls.Begin(source, SpecFor((i + 1) % kSpecs));
          cancellation.Cancel();
          for (const Result& result : calls.Wait()) {
            Expect(result);
            EXPECT_EQ(result.reports, 1);
          }
        },
        [](TokenSource& source, std::size_t i) {
          try {
            if (const auto token = source.TryGetToken(SpecFor(i % kSpecs))) {
              source.Invalidate(*token);
            }
          } catch (const Tarnik::InvalidStateException&) {
            EXPECT_TRUE(Get(source, SpecFor(0)).Is<Tarnik::InvalidStateException>());
          }
        },
        [](TokenSource& source, std::size_t) {
          EXPECT_LE(source.Metrics().keys, kSpecs);
          std::this_thread::yield();
        },
    };
  }
  /// A token, or one of the exceptions that calls may end with here.
  static void Expect(const Result& result) {
    EXPECT_TRUE(result.token != nullptr || result.Is<CommunicationException>() ||
                result.Is<Tarnik::CancelledException>() ||
                result.Is<Tarnik::InvalidStateException>() ||
                result.Is<Tarnik::InvalidArgumentException>())
        << result.type << result.message;
  }

  /// Runs each of the callers on two threads, and `meanwhile` on this one.
  void Run(const std::function<void()>& meanwhile) {
    std::vector<std::thread> threads;
    for (const auto& caller : Callers()) {
      for (int copy = 0; copy < 2; ++copy) {
        threads.emplace_back([this, caller] {
          for (std::size_t i = 0; i < kRounds; ++i) {
            caller(*source_, i);
          }
        });
      }
    }
    meanwhile();
    for (std::thread& thread : threads) {
      thread.join();
    }
  }

  DevSts::Server first_;
  DevSts::Server second_;
  std::shared_ptr<TokenSource> source_;
};

TEST_F(MixedLoadThreadTest, AllFunctionsAtOnce) {
  Run([this] {
    first_.MisbehaveNext(Resetting(), 5);
    second_.MisbehaveNext(Answering(503), 2);
  });
  EXPECT_NE(Get(*source_, SpecFor(0)).token, nullptr);
  const Records records = listener_->Seen();
  EXPECT_GE(records.begun.size(), records.ended.size());
  EXPECT_GT(records.ended.size(), kSpecs);
  EXPECT_TRUE(source_->Stop(30s));
  EXPECT_EQ(source_->Metrics().callersWaiting, 0U);
}

TEST_F(MixedLoadThreadTest, StopMeanwhile) {
  Run([this] {
    EXPECT_TRUE(listener_->Await([](const Records& seen) { return seen.ended.size() >= 20; }));
    source_->Stop(0s);
  });
  EXPECT_TRUE(source_->Stop(30s));
  EXPECT_EQ(source_->Metrics().callersWaiting, 0U);
  EXPECT_TRUE(Get(*source_, SpecFor(0)).Is<Tarnik::InvalidStateException>());
}

TEST_F(MixedLoadThreadTest, ReleaseMeanwhile) {
  std::vector<std::thread> threads;
  for (int i = 0; i < 4; ++i) {
    threads.emplace_back([copy = source_] {
      for (std::size_t round = 0; round < kRounds; ++round) {
        Expect(Get(*copy, SpecFor(round % kSpecs)));
      }
    });
  }
  source_.reset();
  for (std::thread& thread : threads) {
    thread.join();
  }
}

}  // namespace
}  // namespace SsoClient::Access::Testing
