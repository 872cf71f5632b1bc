#include <future>
#include <set>
#include <thread>

#include <gtest/gtest.h>

#include <tarnik/core/exception.h>

#include "runtime.h"

namespace SsoClient::Access {

namespace {

TEST(SystemRuntimeTest, ClocksAreThoseOfTheSystem) {
  const auto runtime = CreateSystemRuntime();
  const auto steady = std::chrono::steady_clock::now();
  const auto wall = std::chrono::system_clock::now();
  const Instant now = runtime->Now();
  EXPECT_GE(now.steady, steady);
  EXPECT_LT(now.steady, steady + std::chrono::minutes(10));
  EXPECT_GE(now.wall, wall);
}

TEST(SystemRuntimeTest, DrawsAreInTheRangeAndDiffer) {
  const auto runtime = CreateSystemRuntime();
  std::set<double> draws;
  for (int i = 0; i < 1000; ++i) {
    const double draw = runtime->Draw();
    ASSERT_GE(draw, 0.0);
    ASSERT_LT(draw, 1.0);
    draws.insert(draw);
  }
  EXPECT_GT(draws.size(), 990U);
}

TEST(SystemRuntimeTest, WorkRunsOnAThreadOfThePool) {
  const auto runtime = CreateSystemRuntime();
  std::promise<std::thread::id> thread;
  runtime->Run([&] { thread.set_value(std::this_thread::get_id()); });
  EXPECT_TRUE(thread.get_future().get() != std::this_thread::get_id());
}

TEST(SystemRuntimeTest, TimerOfThePoolFiresNotBeforeItsTime) {
  const auto runtime = CreateSystemRuntime();
  const auto time = runtime->Now().steady + std::chrono::milliseconds(5);
  std::promise<Instant::Steady> fired;
  const auto item =
      runtime->RunAt(time, [&] { fired.set_value(std::chrono::steady_clock::now()); });
  EXPECT_GE(fired.get_future().get(), time);
}

TEST(SystemRuntimeTest, TimerOfThePoolForThePastFiresAtOnce) {
  const auto runtime = CreateSystemRuntime();
  std::promise<void> fired;
  const auto item = runtime->RunAt(Instant::Steady::min(), [&] { fired.set_value(); });
  fired.get_future().get();
}

TEST(SystemRuntimeTest, CancelledTimerOfThePoolDoesNotFire) {
  const auto runtime = CreateSystemRuntime();
  const auto now = runtime->Now().steady;
  bool hasFired = false;
  const auto item = runtime->RunAt(now + std::chrono::milliseconds(20), [&] { hasFired = true; });
  EXPECT_TRUE(item->Cancel());
  std::promise<void> later;
  const auto after =
      runtime->RunAt(now + std::chrono::milliseconds(25), [&] { later.set_value(); });
  later.get_future().get();
  EXPECT_FALSE(hasFired);
}

}  // namespace

}  // namespace SsoClient::Access
