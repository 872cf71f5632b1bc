#include <atomic>
#include <future>
#include <thread>

#include <gtest/gtest.h>

#include <ssoclient/exceptions.h>

#include "core.h"
#include "support/source_fixture.h"
#include "support/threaded_runtime.h"

namespace SsoClient::Access::Testing {

namespace {

using Limit = Tarnik::Http::CallLimit;

class CoreConcurrentTest : public SourceFixture {
 protected:
  CoreConcurrentTest() {
    config.listener = nullptr;
    config.login = PasswordLogin{"alice", [] { return std::string("secret"); }};
    config.retry.firstDelay = milliseconds(1);
    config.retry.longestDelay = milliseconds(2);
    const auto issued = std::make_shared<std::atomic<int>>(0);
    ForAll([issued](const AttemptRequest&, Limit&) {
      const int number = ++*issued;
      if (number % 3 == 0) {
        return Unreachable();
      }
      // Short enough that refreshes are due all the time.
      const auto wall = std::chrono::duration_cast<std::chrono::microseconds>(
          std::chrono::system_clock::now().time_since_epoch());
      return Issued(std::make_shared<IssuedToken>("_" + std::to_string(number), wall.count(),
                                                  wall.count() + 5000));
    });
  }

  void MakeThreaded() {
    const auto shared = std::make_shared<const TokenSourceConfig>(config);
    source = std::make_shared<TokenSourceImpl>([shared, threads = threads, scripts = scripts] {
      Core::Parts parts{shared, threads, {}};
      for (std::size_t i = 0; i < shared->endpoints.size(); ++i) {
        parts.clients.push_back(
            std::make_unique<ScriptedEndpoint>(shared->endpoints[i], scripts[i]));
      }
      return parts;
    });
  }

  // One caller of many: every kind of call, with deadlines and cancellations.
  void CallMany(int seed) {
    for (int i = 0; i < kCalls; ++i) {
      const int choice = (seed * 7 + i) % 6;
      const TokenSpec asked = SpecFor(std::to_string((seed + i) % 5));
      const CancellationSource cancellation;
      CallContext context;
      context.cancellation = cancellation.Token();
      if (choice % 2 == 0) {
        context.deadline = std::chrono::steady_clock::now() + milliseconds(1 + choice);
      }
      ++begun;
      if (choice < 4) {
        source->GetTokenAsync(asked, context, [this](const auto& token, const auto* failure) {
          EXPECT_NE(token == nullptr, failure == nullptr);
          ++ended;
        });
        if (choice == 1) {
          cancellation.Cancel();
        }
        continue;
      }
      try {
        source->Invalidate(*source->GetToken(asked, context));
      } catch (const Tarnik::Exception&) {
        // Some are too late, or come after the end.
      }
      ++ended;
    }
  }

  static constexpr int kCallers = 4;
  static constexpr int kCalls = 300;
  const std::shared_ptr<ThreadedRuntime> threads = std::make_shared<ThreadedRuntime>(4);
  std::atomic<int> begun{0};
  std::atomic<int> ended{0};
};

TEST_F(CoreConcurrentTest, EveryCallEndsOnce) {
  config.keepFresh = {SpecFor("0")};
  MakeThreaded();
  std::vector<std::thread> callers;
  for (int i = 0; i < kCallers; ++i) {
    callers.emplace_back([this, i] { CallMany(i); });
  }
  for (auto& caller : callers) {
    caller.join();
  }
  EXPECT_TRUE(source->Stop(seconds(60)));
  EXPECT_EQ(begun, kCallers * kCalls);
  EXPECT_EQ(ended, begun);
  EXPECT_EQ(source->Metrics().callersWaiting, 0U);
}

TEST_F(CoreConcurrentTest, StopAmongCallsEndsEachOnce) {
  MakeThreaded();
  std::vector<std::thread> callers;
  for (int i = 0; i < kCallers; ++i) {
    callers.emplace_back([this, i] { CallMany(i); });
  }
  while (begun < kCalls) {
    std::this_thread::yield();
  }
  source->Stop(milliseconds(0));
  for (auto& caller : callers) {
    caller.join();
  }
  EXPECT_TRUE(source->Stop(seconds(60)));
  EXPECT_EQ(ended, kCallers * kCalls);
}

TEST_F(CoreConcurrentTest, HitsOfManyThreadsAreCounted) {
  config.refresh.fraction = 0.9;
  ForAll([](const AttemptRequest&, Limit&) {
    return Issued(std::make_shared<IssuedToken>("_long", 0, 4000000000000000L));
  });
  MakeThreaded();
  const auto token = source->GetToken(spec, {});
  std::vector<std::thread> callers;
  for (int i = 0; i < kCallers; ++i) {
    callers.emplace_back([&] {
      for (int j = 0; j < kCalls; ++j) {
        EXPECT_EQ(source->GetToken(spec, {}), token);
      }
    });
  }
  for (auto& caller : callers) {
    caller.join();
  }
  EXPECT_EQ(source->Metrics().hits, static_cast<std::uint64_t>(kCallers * kCalls));
  EXPECT_EQ(Attempts(), 1U);
}

class BlockedCallersTest : public SourceFixture {};

TEST_F(BlockedCallersTest, BlockedCallersOfManyThreadsGetTheToken) {
  Make();
  constexpr int kBlocked = 16;
  std::atomic<int> answered{0};
  std::vector<std::future<std::shared_ptr<const SamlToken>>> calls;
  for (int i = 0; i < kBlocked; ++i) {
    calls.push_back(std::async(std::launch::async, [&] {
      auto token = source->GetToken(spec, {});
      if (++answered == kBlocked) {
        runtime->Run([] {});
      }
      return token;
    }));
  }
  runtime->RunUntil([&] { return answered == kBlocked; });
  const auto token = calls[0].get();
  EXPECT_NE(token, nullptr);
  for (int i = 1; i < kBlocked; ++i) {
    EXPECT_EQ(calls[static_cast<std::size_t>(i)].get(), token);
  }
  EXPECT_EQ(Attempts(), 1U);
}

}  // namespace

}  // namespace SsoClient::Access::Testing
