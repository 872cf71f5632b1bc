#include <atomic>
#include <memory>
#include <thread>
#include <vector>

#include <gtest/gtest.h>
#include <sys/wait.h>
#include <unistd.h>

#include <ssoclient/access/call_context.h>
#include <tarnik/core/exception.h>

namespace SsoClient::Access {

namespace {

TEST(CallContextTest, WithinIsFromNow) {
  const auto before = CallContext::Clock::now();
  const CallContext context = CallContext::Within(std::chrono::hours(1));
  EXPECT_GE(context.deadline, before + std::chrono::hours(1));
  EXPECT_LE(context.deadline, CallContext::Clock::now() + std::chrono::hours(1));
}

TEST(CallContextTest, WithinNegativeIsNow) {
  const CallContext context = CallContext::Within(std::chrono::hours(-1));
  EXPECT_LE(context.deadline, CallContext::Clock::now());
  EXPECT_GT(CallContext::Within(std::chrono::hours::min()).deadline,
            CallContext::Clock::now() - std::chrono::hours(1));
}

TEST(CallContextTest, WithinTooLongIsNoDeadline) {
  EXPECT_EQ(CallContext::Within(std::chrono::hours::max()).deadline,
            CallContext::Clock::time_point::max());
  EXPECT_EQ(CallContext::Within(std::chrono::duration<double>(1e30)).deadline,
            CallContext::Clock::time_point::max());
}

TEST(CancellationTest, DefaultTokenIsNeverCancelled) {
  const CancellationToken token;
  EXPECT_FALSE(token.CanBeCancelled());
  EXPECT_FALSE(token.IsCancelled());
  bool hasRun = false;
  {
    const auto registration = token.OnCancel([&] { hasRun = true; });
  }
  EXPECT_FALSE(hasRun);
  EXPECT_THROW(static_cast<void>(token.OnCancel(nullptr)), Tarnik::InvalidArgumentException);
}

TEST(CancellationTest, CancelRunsWhatIsRegisteredOnce) {
  const CancellationSource source;
  int runs = 0;
  const auto registration = source.Token().OnCancel([&] { ++runs; });
  EXPECT_FALSE(source.Token().IsCancelled());
  source.Cancel();
  source.Cancel();
  EXPECT_TRUE(source.Token().IsCancelled());
  EXPECT_EQ(runs, 1);
}

TEST(CancellationTest, RegistrationThatIsGoneDoesNotRun) {
  const CancellationSource source;
  int runs = 0;
  {
    const auto registration = source.Token().OnCancel([&] { ++runs; });
  }
  auto moved = source.Token().OnCancel([&] { runs += 10; });
  auto target = source.Token().OnCancel([&] { runs += 100; });
  target = std::move(moved);
  source.Cancel();
  EXPECT_EQ(runs, 10);
}

TEST(CancellationTest, RegisteredAfterwardsRunsAtOnce) {
  const CancellationSource source;
  source.Cancel();
  int runs = 0;
  const auto registration = source.Token().OnCancel([&] { ++runs; });
  EXPECT_EQ(runs, 1);
}

TEST(CancellationTest, TokenOutlivesItsSource) {
  CancellationToken token;
  {
    const CancellationSource source;
    token = source.Token();
    source.Cancel();
  }
  EXPECT_TRUE(token.IsCancelled());
}

TEST(CancellationTest, RegistrationMayBeRemovedByWhatItRuns) {
  const CancellationSource source;
  CancellationRegistration registration;
  int runs = 0;
  registration = source.Token().OnCancel([&] {
    registration = CancellationRegistration();
    ++runs;
  });
  source.Cancel();
  EXPECT_EQ(runs, 1);
}

TEST(CancellationTest, SourceMayBeDestroyedByWhatItRuns) {
  struct Session {
    CancellationSource cancellation;
    CancellationRegistration first;
    CancellationRegistration second;
  };
  auto session = std::make_unique<Session>();
  int runs = 0;
  session->first = session->cancellation.Token().OnCancel([&] {
    ++runs;
    session.reset();
  });
  session->second = session->cancellation.Token().OnCancel([&] { runs += 10; });
  session->cancellation.Cancel();
  EXPECT_EQ(session, nullptr);
  EXPECT_EQ(runs, 1);
}

// The exit status of a child that runs `body` and ends with its result.
template <class Body>
int InChild(const Body& body) {
  const pid_t child = fork();
  if (child == 0) {
    alarm(20);
    _exit(body());
  }
  int status = -1;
  EXPECT_EQ(waitpid(child, &status, 0), child);
  return WIFEXITED(status) ? WEXITSTATUS(status) : -1;
}

TEST(CancellationForkTest, ChildRunsOnlyWhatItHasRegistered) {
  const CancellationSource source;
  int runs = 0;
  auto ofParent = source.Token().OnCancel([&] { ++runs; });
  EXPECT_EQ(InChild([&] {
              const auto own = source.Token().OnCancel([&] { runs += 10; });
              ofParent = {};
              source.Cancel();
              return source.Token().IsCancelled() ? runs : 100;
            }),
            10);
  EXPECT_EQ(InChild([&] {
              source.Cancel();
              const auto own = source.Token().OnCancel([&] { runs += 10; });
              return runs;
            }),
            10);
  EXPECT_FALSE(source.Token().IsCancelled());
  source.Cancel();
  EXPECT_EQ(runs, 1);
}

TEST(CancellationForkTest, RegistrationOfTheParentRemovesNothingInTheChild) {
  const CancellationSource source;
  int runs = 0;
  EXPECT_EQ(InChild([&] {
              // The child of a child, whose first registration is its parent's second.
              auto ofParent = source.Token().OnCancel([&] { ++runs; });
              return InChild([&] {
                const auto own = source.Token().OnCancel([&] { runs += 10; });
                ofParent = {};
                source.Cancel();
                return runs;
              });
            }),
            10);
}

TEST(CancellationForkTest, ChildIsNotBlockedByALockOfTheParent) {
  const CancellationSource source;
  std::atomic<bool> mayEnd{false};
  std::vector<std::thread> threads;
  for (int i = 0; i < 2; ++i) {
    threads.emplace_back([&] {
      while (!mayEnd) {
        const auto registration = source.Token().OnCancel([] {});
      }
    });
  }
  for (int i = 0; i < 20; ++i) {
    EXPECT_EQ(InChild([&] {
                const auto own = source.Token().OnCancel([] {});
                source.Cancel();
                return 0;
              }),
              0);
  }
  mayEnd = true;
  for (auto& thread : threads) {
    thread.join();
  }
}

TEST(CancellationTest, RemovalWaitsForWhatRunsOnAnotherThread) {
  const CancellationSource source;
  std::atomic<bool> hasBegun{false};
  std::atomic<bool> mayEnd{false};
  bool hasEnded = false;
  auto registration = source.Token().OnCancel([&] {
    hasBegun = true;
    while (!mayEnd) {
      std::this_thread::yield();
    }
    hasEnded = true;
  });
  std::thread canceller([&] { source.Cancel(); });
  while (!hasBegun) {
    std::this_thread::yield();
  }
  std::thread releaser([&] { mayEnd = true; });
  registration = CancellationRegistration();
  EXPECT_TRUE(hasEnded);
  canceller.join();
  releaser.join();
}

TEST(CancellationTest, ConcurrentRegistrationsAndCancelAreConsistent) {
  for (int round = 0; round < 200; ++round) {
    const CancellationSource source;
    std::atomic<int> runs{0};
    std::vector<std::thread> threads;
    for (int i = 0; i < 4; ++i) {
      threads.emplace_back([&] {
        for (int j = 0; j < 5; ++j) {
          const auto kept = source.Token().OnCancel([&] { ++runs; });
        }
      });
    }
    source.Cancel();
    for (auto& thread : threads) {
      thread.join();
    }
    EXPECT_LE(runs, 20);
    const int before = runs;
    source.Cancel();
    EXPECT_EQ(runs, before);
  }
}

}  // namespace

}  // namespace SsoClient::Access
