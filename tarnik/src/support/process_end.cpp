#include "support/process_end.h"

#include <atomic>

#include "support/fork.h"

namespace Tarnik {
namespace {

constinit std::atomic<bool> hasBegun{false};
constinit std::mutex watchesMutex;
constinit ProcessEndWatch* firstWatch = nullptr;  // under `watchesMutex`

void LockWatches() noexcept {
  watchesMutex.lock();
}

void UnlockWatches() noexcept {
  watchesMutex.unlock();
}

// The threads that wait do not exist in the child.
void DropWatches() noexcept {
  firstWatch = nullptr;
  watchesMutex.unlock();
}

[[maybe_unused]] const bool kWatchesTakePartInFork =
    (SetForkHooks(ForkOrder::kWaits, {&LockWatches, &UnlockWatches, &DropWatches}), true);

}  // namespace

bool HasProcessEndBegun() noexcept {
  return hasBegun.load(std::memory_order_acquire);
}

void BeginProcessEnd() noexcept {
  hasBegun.store(true, std::memory_order_release);
  const std::lock_guard guard(watchesMutex);
  for (ProcessEndWatch* watch = firstWatch; watch != nullptr; watch = watch->next_) {
    watch->Wake();
  }
}

ProcessEndWatch::ProcessEndWatch(std::mutex& mutex, std::condition_variable& signal) noexcept
    : mutex_(mutex), signal_(signal) {
  const std::lock_guard guard(watchesMutex);
  next_ = firstWatch;
  if (next_ != nullptr) {
    next_->previous_ = this;
  }
  firstWatch = this;
}

ProcessEndWatch::~ProcessEndWatch() {
  const std::lock_guard guard(watchesMutex);
  (previous_ == nullptr ? firstWatch : previous_->next_) = next_;
  if (next_ != nullptr) {
    next_->previous_ = previous_;
  }
}

void ProcessEndWatch::Wake() noexcept {
  // A waiting thread that has seen the condition as false is in the wait once the mutex is free.
  { const std::lock_guard guard(mutex_); }
  signal_.notify_all();
}

}  // namespace Tarnik
