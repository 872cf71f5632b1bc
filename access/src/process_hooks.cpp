#include "process_hooks.h"

#include <atomic>
#include <chrono>
#include <cstdlib>
#include <mutex>
#include <utility>
#include <vector>

#include <pthread.h>

#include "core.h"

namespace SsoClient::Access {

namespace {

// For the callbacks of all sources together.
constexpr std::chrono::milliseconds kExitLimit{200};

// Never destroyed. A forked child makes a new one, since a thread that the child does not have may
// hold the lock of this one.
struct Registry {
  /// The one of the parent process, unused, so that leak checkers find it.
  const Registry* inherited = nullptr;
  std::mutex mutex;
  std::vector<std::weak_ptr<Core>> cores;
};

std::atomic<std::uint64_t> generation{0};
std::atomic<Registry*> registry{nullptr};
std::atomic<Registry*> inheritedRegistry{nullptr};
std::atomic<bool> isEndWatched{false};

// Only what a signal handler may do as well.
void BeginChild() noexcept {
  generation.fetch_add(1, std::memory_order_relaxed);
  Registry* const own = registry.exchange(nullptr, std::memory_order_relaxed);
  if (own != nullptr) {
    inheritedRegistry.store(own, std::memory_order_relaxed);
  }
}

[[maybe_unused]] const bool kTakesPartInFork = pthread_atfork(nullptr, nullptr, &BeginChild) == 0;

Registry& OwnRegistry() {
  Registry* current = registry.load(std::memory_order_acquire);
  if (current == nullptr) {
    auto created = std::make_unique<Registry>();
    created->inherited = inheritedRegistry.load(std::memory_order_relaxed);
    if (registry.compare_exchange_strong(current, created.get(), std::memory_order_acq_rel)) {
      current = created.release();
    }
  }
  return *current;
}

template <class Action>
void ForAll(const std::vector<std::weak_ptr<Core>>& cores, const Action& action) noexcept {
  for (const auto& weak : cores) {
    if (const auto core = weak.lock()) {
      action(*core);
    }
  }
}

}  // namespace

std::uint64_t ForkGeneration() noexcept {
  return generation.load(std::memory_order_relaxed);
}

void RegisterCore(const std::shared_ptr<Core>& core) {
  Registry& own = OwnRegistry();
  const std::lock_guard lock(own.mutex);
  std::erase_if(own.cores, [](const auto& other) { return other.expired(); });
  own.cores.push_back(core);
}

void WatchProcessEnd() noexcept {
  if (!isEndWatched.load(std::memory_order_relaxed) && !isEndWatched.exchange(true)) {
    // Without memory for the handler, waiting calls end with the process.
    static_cast<void>(std::atexit([] { EndCoresOfProcess(); }));
  }
}

void EndCoresOfProcess() noexcept {
  Registry* const own = registry.load(std::memory_order_acquire);
  if (own == nullptr) {
    return;
  }
  std::vector<std::weak_ptr<Core>> cores;
  {
    const std::lock_guard lock(own->mutex);
    cores.swap(own->cores);
  }
  ForAll(cores, [](Core& core) { core.EndProcess(); });
  const Instant::Steady end = std::chrono::steady_clock::now() + kExitLimit;
  ForAll(cores, [end](Core& core) { core.WaitUntil(end); });
}

}  // namespace SsoClient::Access
