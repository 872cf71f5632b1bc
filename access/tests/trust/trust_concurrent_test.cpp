#include <atomic>
#include <chrono>
#include <filesystem>
#include <memory>
#include <string>
#include <thread>
#include <vector>

#include <gtest/gtest.h>

#include <tarnik/core/exception.h>

#include "trust/trust_fixture.h"

// A store with the threads of the system.
namespace SsoClient::Access::Testing {

namespace {

using Clock = std::chrono::steady_clock;

constexpr std::chrono::seconds kPatience{30};

class TrustStoreConcurrentTest : public TrustFixture {
 protected:
  TrustStoreConcurrentTest() {
    Put("trust/b.pem", Sts(1).Pem());
    Sts(3);
  }

  void MakeWithSystem() { store = CreateTrustStore(config, CreateSystemRuntime()); }

  template <class Condition>
  static bool Await(const Condition& condition) {
    const auto end = Clock::now() + kPatience;
    while (!condition()) {
      if (Clock::now() > end) {
        return false;
      }
      std::this_thread::yield();
    }
    return true;
  }

  // One of the complete states: neither a mixture, nor anything of a broken file.
  static bool IsWhole(const Names& names) {
    return names == Names{"CN=sts-0", "CN=sts-1"} || names == Names{"CN=sts-2", "CN=sts-3"};
  }

  // Calls `step` on four threads until `isDone`, which this thread runs.
  template <class Step, class Main>
  static void RunBeside(const Step& step, const Main& main) {
    std::atomic<bool> isDone{false};
    std::vector<std::thread> threads;
    for (int i = 0; i < 4; ++i) {
      threads.emplace_back([&] {
        while (!isDone) {
          step();
        }
      });
    }
    main();
    isDone = true;
    for (std::thread& thread : threads) {
      thread.join();
    }
  }

  void ReloadIfItCan() const {
    try {
      store->Reload();
    } catch (const Tarnik::IOException&) {
      // The files have changed during each reading.
    }
  }

  // Both files in one step, by a link to their folder.
  void Switch(int state) const {
    const std::string folder = "state" + std::to_string(state);
    if (!std::filesystem::exists(PathOf(folder))) {
      std::filesystem::create_directory(PathOf(folder));
      const auto first = static_cast<std::size_t>(2 * state);
      Put(folder + "/a.pem", Sts(first).Pem());
      Put(folder + "/b.pem", Sts(first + 1).Pem());
    }
    std::filesystem::create_directory_symlink(PathOf(folder), PathOf("next"));
    Rename("next", "link");
  }
};

TEST_F(TrustStoreConcurrentTest, ThreadsSeeOnlyWholeStates) {
  Switch(0);
  config.issuers[0].certificatePaths = {PathOf("link")};
  MakeWithSystem();
  std::atomic<int> halves{0};
  const auto step = [&] {
    const auto trust = store->Current();
    const auto description = store->Describe();
    Names described;
    for (const TrustedSigner& signer : description.signers) {
      described.push_back(signer.certificate->SubjectName());
    }
    if (!IsWhole(SignersOf(*trust)) || !IsWhole(described)) {
      ++halves;
    }
  };
  RunBeside(step, [&] {
    for (int i = 1; i < 20; ++i) {
      Switch(i % 2);
      store->Reload();
      EXPECT_EQ(Signers().front(), i % 2 == 0 ? "CN=sts-0" : "CN=sts-2");
    }
    // The files of one reading must not be those of two states.
    std::atomic<bool> isSwitching{true};
    std::thread other([&] {
      for (int i = 0; isSwitching; ++i) {
        Switch(i % 2);
      }
    });
    for (int i = 0; i < 100; ++i) {
      ReloadIfItCan();
    }
    isSwitching = false;
    other.join();
    Switch(1);
    Put("state1/b.pem", "broken");
    EXPECT_TRUE(Await([&] { return !store->Describe().failure.empty(); }));
  });
  EXPECT_EQ(halves, 0);
}

TEST_F(TrustStoreConcurrentTest, WatchSeesAChangeByItself) {
  MakeWithSystem();
  const auto version = store->Version();
  Put("trust/a.pem", Sts(2).Pem());
  EXPECT_TRUE(Await([&] { return store->Version() != version; }));
  EXPECT_EQ(Signers(), (Names{"CN=sts-2", "CN=sts-1"}));
}

TEST_F(TrustStoreConcurrentTest, ReloadsOfManyThreadsNeverGoBack) {
  config.listener.reset();
  MakeWithSystem();
  std::atomic<std::uint64_t> newest{0};
  std::atomic<int> setbacks{0};
  RunBeside(
      [&] {
        ReloadIfItCan();
        const std::uint64_t before = newest;
        const std::uint64_t version = store->Version();
        if (version < before) {
          ++setbacks;
        }
        std::uint64_t known = newest;
        while (known < version && !newest.compare_exchange_weak(known, version)) {
        }
      },
      [&] {
        for (std::size_t i = 0; i < 51; ++i) {
          Put("trust/a.pem", Sts(i % 3).Pem());
        }
      });
  store->Reload();
  EXPECT_EQ(setbacks, 0);
  EXPECT_EQ(Signers().front(), "CN=sts-2");
}

TEST_F(TrustStoreConcurrentTest, ListenerRunsOnOneThreadAtATime) {
  struct Counting final : TrustListener {
    void OnTrustReplaced(const TrustRecord&) override {
      overlaps += ++running > 1 ? 1 : 0;
      std::this_thread::yield();
      --running;
    }
    std::atomic<int> running{0};
    std::atomic<int> overlaps{0};
  };
  const auto counting = std::make_shared<Counting>();
  config.listener = counting;
  MakeWithSystem();
  RunBeside([&] { ReloadIfItCan(); },
            [&] {
              for (std::size_t i = 0; i < 51; ++i) {
                Put("trust/a.pem", Sts(i % 3).Pem());
              }
            });
  EXPECT_EQ(counting->overlaps, 0);
}

TEST_F(TrustStoreConcurrentTest, ListenerDoesNotRunAfterTheStore) {
  struct Watched final : TrustListener {
    void OnTrustReplaced(const TrustRecord&) override {
      hasBegun = true;
      const auto end = Clock::now() + std::chrono::milliseconds(20);
      while (Clock::now() < end) {
        std::this_thread::yield();
      }
      late += isGone ? 1 : 0;
    }
    std::atomic<bool> hasBegun{false};
    std::atomic<bool> isGone{false};
    std::atomic<int> late{0};
  };
  const auto watched = std::make_shared<Watched>();
  config.listener = watched;
  MakeWithSystem();
  config.listener.reset();
  Put("trust/a.pem", Sts(2).Pem());
  ASSERT_TRUE(Await([&] { return watched->hasBegun.load(); }));
  store.reset();
  watched->isGone = true;
  EXPECT_EQ(watched.use_count(), 1);
  EXPECT_EQ(watched->late, 0);
}

TEST_F(TrustStoreConcurrentTest, StoreMayBeReleasedByItsListenerOnAWorker) {
  struct Releasing final : TrustListener {
    void OnTrustReplaced(const TrustRecord&) override {
      store.reset();
      isReleased = true;
    }
    std::shared_ptr<TrustStoreImpl> store;
    std::atomic<bool> isReleased{false};
  };
  const auto releasing = std::make_shared<Releasing>();
  config.listener = releasing;
  config.isWatching = true;
  releasing->store = CreateTrustStore(config, CreateSystemRuntime());
  Put("trust/a.pem", Sts(2).Pem());
  EXPECT_TRUE(Await([&] { return releasing->isReleased.load(); }));
}

}  // namespace

}  // namespace SsoClient::Access::Testing
