#include "support/fork.h"

#include <atomic>
#include <future>
#include <mutex>
#include <optional>
#include <thread>

#include <gtest/gtest.h>
#include <unistd.h>

#include "support/forked_child.h"
#include "support/object_lock.h"
#include "support/openssl_section.h"

namespace Tarnik::Testing {
namespace {

TEST(ForkMarkTest, ChangesInAChild) {
  const ForkMark mark;
  EXPECT_FALSE(mark.IsFromParent());
  EXPECT_TRUE(HoldsInChild([&] { return mark.IsFromParent() && !ForkMark().IsFromParent(); }));
  EXPECT_FALSE(mark.IsFromParent());
}

TEST(ForkMarkTest, ChangesInAChildOfAChild) {
  const ForkMark mark;
  EXPECT_TRUE(HoldsInChild([&] {
    const ForkMark ofChild;
    return HoldsInChild([&] { return mark.IsFromParent() && ofChild.IsFromParent(); });
  }));
}

struct CountsDestruction {
  explicit CountsDestruction(int& destroyed) : count(destroyed) {}
  ~CountsDestruction() { ++count; }
  int& count;
};

TEST(ForkBoundTest, IsDestroyedOnlyInItsProcess) {
  int destroyed = 0;
  std::optional<ForkBound<CountsDestruction>> bound;
  bound.emplace(destroyed);
  EXPECT_TRUE(HoldsInChild([&] {
    bound.reset();
    return destroyed == 0;
  }));
  bound.reset();
  EXPECT_EQ(destroyed, 1);
}

TEST(ObjectLockTest, IsFreeInAChildThatIsForkedWhileItIsHeld) {
  const int object = 0;
  std::promise<void> locked;
  std::atomic<bool> isStopping{false};
  std::thread holder([&] {
    bool isFirst = true;
    while (!isStopping) {
      const std::lock_guard lock(ObjectLock(&object));
      if (std::exchange(isFirst, false)) {
        locked.set_value();
      }
    }
  });
  locked.get_future().wait();
  for (int i = 0; i < 20; ++i) {
    EXPECT_TRUE(HoldsInChildOfBusyThreads([&] {
      const std::lock_guard lock(ObjectLock(&object));
      return true;
    })) << i;
  }
  isStopping = true;
  holder.join();
}

TEST(OpenSslSectionTest, IsEmptyWhenAChildIsForked) {
  std::atomic<bool> isInside{false};
  std::atomic<bool> isStopping{false};
  std::promise<void> entered;
  std::thread worker([&] {
    bool isFirst = true;
    while (!isStopping) {
      const OpenSsl::Section section;
      isInside = true;
      if (std::exchange(isFirst, false)) {
        entered.set_value();
      }
      isInside = false;
    }
  });
  entered.get_future().wait();
  for (int i = 0; i < 20; ++i) {
    EXPECT_TRUE(HoldsInChildOfBusyThreads([&] {
      const OpenSsl::Section section;
      return !isInside;
    })) << i;
  }
  isStopping = true;
  worker.join();
}

// A callback of OpenSSL may fork; waiting for the section would be waiting for the own thread.
TEST(OpenSslSectionTest, MayForkInside) {
  const OpenSsl::Section section;
  EXPECT_TRUE(HoldsInChild([] {
    const OpenSsl::Section inner;
    return true;
  }));
}

}  // namespace
}  // namespace Tarnik::Testing
