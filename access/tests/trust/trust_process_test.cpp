#include <atomic>
#include <chrono>
#include <cstdlib>
#include <functional>
#include <memory>
#include <thread>
#include <vector>

#include <gtest/gtest.h>
#include <unistd.h>

#include "support/forked_child.h"
#include "trust/trust_fixture.h"

// A store in a process that forks and ends.
namespace SsoClient::Access::Testing {

namespace {

using Tarnik::Testing::AwaitIdleThreads;
using Tarnik::Testing::HoldsInChild;

class TrustProcessTest : public TrustFixture {
 protected:
  void MakeWithSystem() { store = CreateTrustStore(config, CreateSystemRuntime()); }

  template <class Condition>
  static bool Await(const Condition& condition) {
    const auto end = std::chrono::steady_clock::now() + std::chrono::seconds(30);
    while (!condition()) {
      if (std::chrono::steady_clock::now() > end) {
        return false;
      }
      std::this_thread::yield();
    }
    return true;
  }
};

TEST_F(TrustProcessTest, ChildWatchesAgainWhenItUsesTheStore) {
  MakeWithSystem();
  EXPECT_TRUE(HoldsInChild([this] {
    const auto version = store->Version();
    Put("trust/a.pem", Sts(1).Pem());
    return Await([&] { return store->Version() != version; }) && Signers() == Names{"CN=sts-1"};
  }));
}

TEST_F(TrustProcessTest, ChildOfAProcessInVirtualTimeArmsATimerOfItsOwn) {
  Make();
  for (const auto use : {0, 1, 2}) {
    EXPECT_TRUE(HoldsInChild([this, use] {
      const std::size_t before = runtime->TimersArmed();
      use == 0   ? static_cast<void>(store->Current())
      : use == 1 ? static_cast<void>(store->Version())
                 : static_cast<void>(store->Describe());
      return before == 1 && runtime->TimersArmed() == 2;
    }));
  }
}

TEST_F(TrustProcessTest, ChildReloadsWhileItsParentDoes) {
  // The listener forks, with the locks of a reading held.
  struct Forking final : TrustListener {
    void OnTrustReplaced(const TrustRecord&) override { isRight = HoldsInChild(inChild); }
    std::function<bool()> inChild;
    bool isRight = false;
  };
  const auto forking = std::make_shared<Forking>();
  forking->inChild = [this] {
    Put("trust/a.pem", Sts(2).Pem());
    store->Reload();
    return Signers() == Names{"CN=sts-2"};
  };
  config.listener = forking;
  config.isWatching = false;
  Sts(2);
  Make();
  Put("trust/a.pem", Sts(1).Pem());
  store->Reload();
  EXPECT_TRUE(forking->isRight);
}

TEST_F(TrustProcessTest, ChildIsForkedWhileThreadsUseTheStore) {
  config.isWatching = false;
  Make();
  std::atomic<bool> isDone{false};
  std::vector<std::thread> threads;
  for (int i = 0; i < 3; ++i) {
    threads.emplace_back([&] {
      while (!isDone) {
        store->Current();
      }
    });
  }
  int failures = 0;
  for (int i = 0; i < 40 && failures == 0; ++i) {
    const pid_t child = fork();
    if (child == 0) {
      alarm(10);
      _exit(store->Current()->Version() == store->Version() ? 0 : 1);
    }
    failures += Tarnik::Testing::HasSucceeded(child) ? 0 : 1;
  }
  isDone = true;
  for (std::thread& thread : threads) {
    thread.join();
  }
  EXPECT_EQ(failures, 0);
}

TEST_F(TrustProcessTest, ChildMayDestroyTheStore) {
  MakeWithSystem();
  EXPECT_TRUE(HoldsInChild([this] {
    store.reset();
    return true;
  }));
  EXPECT_EQ(Signers(), Names{"CN=sts-0"});
}

TEST_F(TrustProcessTest, ProcessThatWatchesEnds) {
#ifdef __SANITIZE_ADDRESS__
  GTEST_SKIP() << "at its exit, a child reports what threads of its parent hold as leaks";
#endif
  AwaitIdleThreads();
  const pid_t child = Tarnik::Testing::ForkWithLimit();
  if (child == 0) {
    static std::shared_ptr<TrustStoreImpl> kept;
    kept = CreateTrustStore(config, CreateSystemRuntime());
    const auto version = kept->Version();
    Put("trust/a.pem", Sts(1).Pem());
    Await([version] { return kept->Version() != version; });
    std::exit(0);
  }
  EXPECT_TRUE(Tarnik::Testing::HasSucceeded(child));
}

}  // namespace

}  // namespace SsoClient::Access::Testing
