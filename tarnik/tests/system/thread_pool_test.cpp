#include <array>
#include <atomic>
#include <chrono>
#include <filesystem>
#include <future>
#include <memory>
#include <mutex>
#include <set>
#include <string>
#include <system_error>
#include <thread>
#include <vector>

#include <fcntl.h>
#include <gtest/gtest.h>
#include <signal.h>

#include <tarnik/core/exception.h>
#include <tarnik/system/thread_pool.h>

#include "support/outcome.h"

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::System;
using namespace std::chrono_literals;

bool IsReadyInTime(std::future<void> result) {
  return result.wait_for(kPatience) == std::future_status::ready;
}

TEST(ThreadPoolTest, IsTheSameForTheWholeProcess) {
  EXPECT_EQ(GetThreadPool(), GetThreadPool());
  EXPECT_EQ(GetThreadPool()->ToString(), "<ThreadPool>");
}

TEST(ThreadPoolTest, RunsAnItemOnAnotherThread) {
  std::promise<std::thread::id> ran;
  GetThreadPool()->Run([&] { ran.set_value(std::this_thread::get_id()); });
  auto result = ran.get_future();
  ASSERT_EQ(result.wait_for(kPatience), std::future_status::ready);
  EXPECT_NE(result.get(), std::this_thread::get_id());
}

TEST(ThreadPoolTest, RefusesEmptyFunctions) {
  EXPECT_THROW(GetThreadPool()->Run({}), InvalidArgumentException);
  EXPECT_THROW(GetThreadPool()->Post({}), InvalidArgumentException);
  EXPECT_THROW(GetThreadPool()->RunAfter(1, {}), InvalidArgumentException);
}

TEST(ThreadPoolTest, NeverRunsACompletionInsideThePostingCompletion) {
  static thread_local bool isPosting = false;
  std::promise<bool> ranInside;
  GetThreadPool()->Post([&] {
    isPosting = true;
    GetThreadPool()->Post([&] { ranInside.set_value(isPosting); });
    isPosting = false;
  });
  auto result = ranInside.get_future();
  ASSERT_EQ(result.wait_for(kPatience), std::future_status::ready);
  EXPECT_FALSE(result.get());
}

TEST(ThreadPoolTest, RunsCompletionsOnFewThreads) {
  std::mutex mutex;
  std::set<std::thread::id> threads;
  std::promise<void> done;
  std::atomic<int> ran{0};
  for (int i = 0; i < 200; ++i) {
    GetThreadPool()->Post([&] {
      {
        const std::lock_guard lock(mutex);
        threads.insert(std::this_thread::get_id());
      }
      if (++ran == 200) {
        done.set_value();
      }
    });
  }
  ASSERT_TRUE(IsReadyInTime(done.get_future()));
  EXPECT_LE(threads.size(), 2U);
}

TEST(ThreadPoolTest, RunsWhatCompletionsStartOnTheSameThread) {
  struct Chain {
    std::set<std::thread::id> threads;
    std::promise<void> done;
    int left = 400;

    void Continue() {
      threads.insert(std::this_thread::get_id());
      if (left-- == 0) {
        done.set_value();
      } else if (left % 2 == 0) {
        GetThreadPool()->RunAfter(1, [this] { Continue(); });
      } else {
        GetThreadPool()->Post([this] { Continue(); });
      }
    }
  };
  // Several at a time, so that all I/O threads have something to do.
  std::array<Chain, 4> chains;
  for (Chain& chain : chains) {
    GetThreadPool()->Post([&chain] { chain.Continue(); });
  }
  for (Chain& chain : chains) {
    ASSERT_TRUE(IsReadyInTime(chain.done.get_future()));
    EXPECT_EQ(chain.threads.size(), 1U);
  }
}

TEST(ThreadPoolTest, SpreadsTheCompletionsOfSeveralThreads) {
  std::mutex mutex;
  std::set<std::thread::id> threads;
  const auto postFromAThread = [&] {
    std::promise<void> ran;
    std::thread([&] {
      GetThreadPool()->Post([&] {
        {
          const std::lock_guard lock(mutex);
          threads.insert(std::this_thread::get_id());
        }
        ran.set_value();
      });
      EXPECT_TRUE(IsReadyInTime(ran.get_future()));
    }).join();
  };
  // Usually two; a thread of another test may have taken a turn meanwhile.
  for (int i = 0; i < 20 && threads.size() < 2; ++i) {
    postFromAThread();
  }
  EXPECT_EQ(threads.size(), 2U);
}

TEST(ThreadPoolTest, RunsCompletionsWhileEveryWorkerIsBlocked) {
  std::promise<void> gate;
  const auto opened = gate.get_future().share();
  std::atomic<int> blocked{0};
  std::atomic<int> ended{0};
  std::promise<void> allBlocked;
  std::promise<void> allEnded;
  constexpr int kItems = ThreadPool::kMaxWorkers + 20;
  for (int i = 0; i < kItems; ++i) {
    GetThreadPool()->Run([&] {
      if (++blocked == ThreadPool::kMaxWorkers) {
        allBlocked.set_value();
      }
      opened.wait();
      if (++ended == kItems) {
        allEnded.set_value();
      }
    });
  }
  EXPECT_TRUE(IsReadyInTime(allBlocked.get_future()));
  std::promise<void> timer;
  GetThreadPool()->RunAfter(1000, [&] { timer.set_value(); });
  EXPECT_TRUE(IsReadyInTime(timer.get_future()));
  EXPECT_EQ(blocked, ThreadPool::kMaxWorkers);
  gate.set_value();
  EXPECT_TRUE(IsReadyInTime(allEnded.get_future()));
}

TEST(ThreadPoolTest, DoesNotRunATimerEarly) {
  const auto begin = std::chrono::steady_clock::now();
  std::promise<void> ran;
  GetThreadPool()->RunAfter(20000, [&] { ran.set_value(); });
  ASSERT_TRUE(IsReadyInTime(ran.get_future()));
  EXPECT_GE(std::chrono::steady_clock::now() - begin, 20ms);
}

TEST(ThreadPoolTest, RunsTimersInTheOrderOfTheirTimes) {
  std::vector<int> order;
  std::mutex mutex;
  std::promise<void> done;
  const auto note = [&](int number) {
    bool isLast = false;
    {
      const std::lock_guard lock(mutex);
      order.push_back(number);
      isLast = order.size() == 2;
    }
    // Not under the lock, which is destroyed as soon as the test is done.
    if (isLast) {
      done.set_value();
    }
  };
  GetThreadPool()->RunAfter(200000, [&] { note(2); });
  GetThreadPool()->RunAfter(1000, [&] { note(1); });
  ASSERT_TRUE(IsReadyInTime(done.get_future()));
  EXPECT_EQ(order, (std::vector<int>{1, 2}));
}

TEST(ThreadPoolTest, NeverRunsACancelledTimer) {
  const auto ran = std::make_shared<std::atomic<bool>>(false);
  const auto timer = GetThreadPool()->RunAfter(5000, [ran] { *ran = true; });
  EXPECT_TRUE(timer->Cancel());
  EXPECT_FALSE(timer->Cancel());
  std::promise<void> later;
  GetThreadPool()->RunAfter(30000, [&] { later.set_value(); });
  ASSERT_TRUE(IsReadyInTime(later.get_future()));
  EXPECT_FALSE(*ran);
}

TEST(ThreadPoolTest, CannotCancelATimerThatHasRun) {
  std::promise<void> ran;
  const auto timer = GetThreadPool()->RunAfter(0, [&] { ran.set_value(); });
  ASSERT_TRUE(IsReadyInTime(ran.get_future()));
  EXPECT_FALSE(timer->Cancel());
}

TEST(ThreadPoolTest, ReleasesWhatACancelledTimerHoldsAtOnce) {
  auto held = std::make_shared<int>(1);
  const auto timer = GetThreadPool()->RunAfter(60000000, [held] { (void)held; });
  EXPECT_EQ(held.use_count(), 2);
  EXPECT_TRUE(timer->Cancel());
  EXPECT_EQ(held.use_count(), 1);
}

TEST(ThreadPoolTest, AcceptsTheLongestDelay) {
  const auto ran = std::make_shared<std::atomic<bool>>(false);
  const auto timer = GetThreadPool()->RunAfter(~0UL, [ran] { *ran = true; });
  std::promise<void> later;
  GetThreadPool()->RunAfter(1000, [&] { later.set_value(); });
  ASSERT_TRUE(IsReadyInTime(later.get_future()));
  EXPECT_FALSE(*ran);
  EXPECT_TRUE(timer->Cancel());
}

TEST(ThreadPoolTest, EitherCancelsOrRunsEachTimerInARace) {
  constexpr int kTimers = 500;
  std::atomic<int> ran{0};
  int cancelled = 0;
  for (int i = 0; i < kTimers; ++i) {
    const auto timer = GetThreadPool()->RunAfter(static_cast<unsigned long>(i % 7), [&] { ++ran; });
    cancelled += timer->Cancel() ? 1 : 0;
  }
  const auto limit = std::chrono::steady_clock::now() + kPatience;
  while (ran + cancelled < kTimers && std::chrono::steady_clock::now() < limit) {
    std::this_thread::yield();
  }
  EXPECT_EQ(ran + cancelled, kTimers);
}

TEST(ThreadPoolTest, BlocksTheHostsSignalsOnItsThreads) {
  std::promise<bool> blocked;
  GetThreadPool()->Run([&] {
    sigset_t mask;
    pthread_sigmask(SIG_BLOCK, nullptr, &mask);
    blocked.set_value(sigismember(&mask, SIGINT) == 1 && sigismember(&mask, SIGUSR1) == 1 &&
                      sigismember(&mask, SIGSEGV) == 0);
  });
  EXPECT_TRUE(blocked.get_future().get());
}

TEST(ThreadPoolTest, ItsDescriptorsAreNotInheritedByPrograms) {
  std::promise<void> done;
  GetThreadPool()->RunAfter(1, [&] { done.set_value(); });
  done.get_future().wait();
  int ofThePool = 0;
  for (const auto& entry : std::filesystem::directory_iterator("/proc/self/fd")) {
    std::error_code ignored;
    const std::string target = std::filesystem::read_symlink(entry.path(), ignored).string();
    if (target.starts_with("anon_inode:[event") || target.starts_with("anon_inode:[timerfd")) {
      ++ofThePool;
      EXPECT_NE(fcntl(std::stoi(entry.path().filename()), F_GETFD) & FD_CLOEXEC, 0) << target;
    }
  }
  EXPECT_GE(ofThePool, 3);
}

}  // namespace
}  // namespace Tarnik::Testing
