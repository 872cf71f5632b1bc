#include <atomic>
#include <chrono>
#include <mutex>
#include <random>
#include <utility>

#include <tarnik/system/thread_pool.h>

#include "process_hooks.h"
#include "runtime.h"

namespace SsoClient::Access {

namespace {

class SystemRuntime final : public Runtime {
 public:
  Instant Now() const override { return Instant::Now(); }

  double Draw() override {
    // Not an engine with a state, which a forked child would share with its parent.
    const std::lock_guard lock(mutex_);
    return std::generate_canonical<double, 32>(random_);
  }

  void Run(std::function<void()> work) override {
    WatchEnd();
    pool_->Run(std::move(work));
  }

  Tarnik::Ref<Tarnik::System::CancellableItem> RunAt(Instant::Steady time,
                                                     std::function<void()> action) override {
    const Instant::Steady now = std::chrono::steady_clock::now();
    // Rounded up, so that the time has come when the action runs.
    const auto delay = std::chrono::ceil<std::chrono::microseconds>(
        time > now ? time - now : std::chrono::steady_clock::duration(0));
    WatchEnd();
    return pool_->RunAfter(static_cast<unsigned long>(delay.count()), std::move(action));
  }

 private:
  // The pool must have been started before.
  void WatchEnd() {
    if (!isEndWatched_.load(std::memory_order_relaxed)) {
      pool_->Post([] {});
      WatchProcessEnd();
      isEndWatched_.store(true, std::memory_order_relaxed);
    }
  }

  const Tarnik::Ref<Tarnik::System::ThreadPool> pool_ = Tarnik::System::GetThreadPool();
  std::atomic<bool> isEndWatched_{false};
  std::mutex mutex_;
  std::random_device random_;
};

}  // namespace

std::shared_ptr<Runtime> CreateSystemRuntime() {
  return std::make_shared<SystemRuntime>();
}

}  // namespace SsoClient::Access
