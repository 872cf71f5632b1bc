#include "per_process.h"

#include <atomic>
#include <memory>
#include <thread>
#include <vector>

#include <gtest/gtest.h>
#include <sys/wait.h>
#include <unistd.h>

namespace SsoClient::Access {

namespace {

// What `check` returns in a forked child.
template <class Check>
bool HoldsInForkedChild(const Check& check) {
  const pid_t child = fork();
  if (child == 0) {
    alarm(30);
    _exit(check() ? 0 : 1);
  }
  int status = -1;
  return waitpid(child, &status, 0) == child && status == 0;
}

TEST(PerProcessTest, ObjectIsMadeOnFirstUse) {
  const PerProcess<int> object;
  EXPECT_EQ(object.Find(), nullptr);
  EXPECT_EQ(object.Get([] { return 7; }), 7);
  EXPECT_EQ(object.Get([] { return 8; }), 7);
  ASSERT_NE(object.Find(), nullptr);
  EXPECT_EQ(*object.Find(), 7);
}

TEST(PerProcessTest, ObjectIsDestroyedWithItsOwner) {
  const auto counted = std::make_shared<int>(0);
  {
    const PerProcess<std::shared_ptr<int>> object;
    object.Get([&] { return counted; });
    EXPECT_EQ(counted.use_count(), 2);
  }
  EXPECT_EQ(counted.use_count(), 1);
}

TEST(PerProcessTest, ChildMakesItsOwnAndLeavesThatOfItsParent) {
  const auto counted = std::make_shared<int>(0);
  auto object = std::make_unique<PerProcess<std::shared_ptr<int>>>();
  object->Get([&] { return counted; });
  EXPECT_TRUE(HoldsInForkedChild([&] {
    const bool isNone = object->Find() == nullptr;
    const auto other = std::make_shared<int>(1);
    const bool isOwn = object->Get([&] { return other; }) == other;
    object.reset();
    return isNone && isOwn && other.use_count() == 1 && counted.use_count() == 2;
  }));
  EXPECT_EQ(*object->Find(), counted);
}

TEST(PerProcessTest, ChildThatUsesNothingLeavesThatOfItsParent) {
  const auto counted = std::make_shared<int>(0);
  auto object = std::make_unique<PerProcess<std::shared_ptr<int>>>();
  object->Get([&] { return counted; });
  EXPECT_TRUE(HoldsInForkedChild([&] {
    object.reset();
    return counted.use_count() == 2;
  }));
}

TEST(PerProcessTest, ThreadsAgreeOnOneObject) {
  const PerProcess<std::shared_ptr<int>> object;
  std::atomic<int> waiting{4};
  std::vector<const int*> seen(4);
  std::vector<std::thread> threads;
  for (std::size_t i = 0; i < seen.size(); ++i) {
    threads.emplace_back([&, i] {
      --waiting;
      while (waiting > 0) {
        std::this_thread::yield();
      }
      seen[i] = object.Get([] { return std::make_shared<int>(1); }).get();
    });
  }
  for (std::thread& thread : threads) {
    thread.join();
  }
  for (const int* const one : seen) {
    EXPECT_EQ(one, object.Find()->get());
  }
}

}  // namespace

}  // namespace SsoClient::Access
