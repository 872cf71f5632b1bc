#include "system/worker_set.h"

#include <atomic>
#include <chrono>
#include <cstddef>
#include <future>
#include <memory>
#include <thread>
#include <utility>
#include <vector>

#include <gtest/gtest.h>

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::System;
using namespace std::chrono_literals;

TEST(WorkerSetConcurrencyTest, GrowsWhileAllWorkersAreBusy) {
  std::promise<void> gate;
  const auto opened = gate.get_future().share();
  std::atomic<int> started{0};
  std::promise<void> allStarted;
  WorkerSet workers("test", 10, 10s);
  for (int i = 0; i < 10; ++i) {
    workers.Run([&] {
      if (++started == 10) {
        allStarted.set_value();
      }
      opened.wait();
    });
  }
  EXPECT_EQ(allStarted.get_future().wait_for(30s), std::future_status::ready);
  EXPECT_EQ(workers.WorkerCount(), 10U);
  gate.set_value();
}

TEST(WorkerSetConcurrencyTest, QueuesItemsInOrderBeyondItsMaximum) {
  std::promise<void> gate;
  const auto opened = gate.get_future().share();
  std::vector<int> order;
  std::promise<void> done;
  {
    WorkerSet workers("test", 1, 10s);
    workers.Run([&] { opened.wait(); });
    for (int i = 0; i < 100; ++i) {
      workers.Run([&order, i] { order.push_back(i); });
    }
    workers.Run([&] { done.set_value(); });
    EXPECT_EQ(workers.WorkerCount(), 1U);
    gate.set_value();
    ASSERT_EQ(done.get_future().wait_for(30s), std::future_status::ready);
  }
  ASSERT_EQ(order.size(), 100U);
  for (int i = 0; i < 100; ++i) {
    EXPECT_EQ(order[static_cast<std::size_t>(i)], i);
  }
}

// A worker that has fulfilled its promise may not be idle yet when the next item comes. On a busy
// machine this may happen several times in a row, but not every time.
TEST(WorkerSetConcurrencyTest, ReusesAnIdleWorker) {
  constexpr std::size_t kItems = 100;
  WorkerSet workers("test", kItems, 60s);
  bool isReused = false;
  for (std::size_t i = 0; i < kItems && !isReused; ++i) {
    const std::size_t before = workers.WorkerCount();
    std::promise<void> done;
    workers.Run([&] { done.set_value(); });
    ASSERT_EQ(done.get_future().wait_for(30s), std::future_status::ready);
    isReused = workers.WorkerCount() == before;
  }
  EXPECT_TRUE(isReused);
}

TEST(WorkerSetConcurrencyTest, EndsIdleWorkers) {
  WorkerSet workers("test", 10, 1ms);
  for (int i = 0; i < 4; ++i) {
    std::promise<void> done;
    workers.Run([&] { done.set_value(); });
    ASSERT_EQ(done.get_future().wait_for(30s), std::future_status::ready);
  }
  const auto limit = std::chrono::steady_clock::now() + 30s;
  while (workers.WorkerCount() > 0 && std::chrono::steady_clock::now() < limit) {
    std::this_thread::yield();
  }
  EXPECT_EQ(workers.WorkerCount(), 0U);
}

TEST(WorkerSetConcurrencyTest, RunsEachItemFromManyThreadsOnce) {
  std::atomic<int> ran{0};
  std::promise<void> done;
  WorkerSet workers("test", 4, 1ms);
  std::vector<std::thread> callers;
  for (int i = 0; i < 4; ++i) {
    callers.emplace_back([&] {
      for (int j = 0; j < 500; ++j) {
        workers.Run([&] {
          if (++ran == 2000) {
            done.set_value();
          }
        });
      }
    });
  }
  for (auto& caller : callers) {
    caller.join();
  }
  EXPECT_EQ(done.get_future().wait_for(30s), std::future_status::ready);
  EXPECT_EQ(ran, 2000);
}

TEST(WorkerSetConcurrencyTest, DestroysAnItemRightAfterItHasRun) {
  WorkerSet workers("test", 1, 60s);
  auto held = std::make_shared<int>(0);
  const std::weak_ptr<int> watched = held;
  workers.Run([held = std::move(held)] { ++*held; });
  std::promise<void> done;
  workers.Run([&] { done.set_value(); });
  ASSERT_EQ(done.get_future().wait_for(30s), std::future_status::ready);
  EXPECT_TRUE(watched.expired());
}

TEST(WorkerSetConcurrencyTest, StartsNothingOnceFrozenAndWaitsForRunningItems) {
  // Threads of a frozen set stop for good, so the set is leaked like the pool of the process.
  static auto* const workers = new WorkerSet("test", 2, 60s);
  static std::atomic<bool> first{false};
  static std::atomic<bool> second{false};
  static std::promise<void> started;
  static std::promise<void> gate;
  workers->Run([] {
    started.set_value();
    gate.get_future().wait();
    first = true;
  });
  started.get_future().wait();
  std::thread opener([] { gate.set_value(); });
  workers->Freeze(30s);
  EXPECT_TRUE(first);
  workers->Run([] { second = true; });
  opener.join();
  EXPECT_FALSE(second);
}

TEST(WorkerSetConcurrencyTest, StopsWaitingForABlockedItemWhenFreezing) {
  static auto* const workers = new WorkerSet("test", 2, 60s);
  static std::promise<void> started;
  static std::promise<void> never;
  workers->Run([] {
    started.set_value();
    never.get_future().wait();
  });
  started.get_future().wait();
  const auto begin = std::chrono::steady_clock::now();
  workers->Freeze(10ms);
  EXPECT_LT(std::chrono::steady_clock::now() - begin, 10s);
}

}  // namespace
}  // namespace Tarnik::Testing
