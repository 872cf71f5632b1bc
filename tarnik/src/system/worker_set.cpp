#include "system/worker_set.h"

#include <utility>

#include "system/pool_thread.h"

namespace Tarnik::System {
namespace {

thread_local const WorkerSet* ownSet = nullptr;

}  // namespace

WorkerSet::WorkerSet(const char* threadName, std::size_t maxWorkers,
                     std::chrono::milliseconds idleLimit)
    : threadName_(threadName), maxWorkers_(maxWorkers), idleLimit_(idleLimit) {}

WorkerSet::~WorkerSet() {
  std::unique_lock lock(mutex_);
  phase_ = Phase::kEnding;
  itemsOrEnd_.notify_all();
  workerChanged_.wait(lock, [this] { return workers_ == 0; });
}

void WorkerSet::Run(std::function<void()> item) {
  // Destroyed after the lock is released, since destructors of its captures may call `Run`.
  std::function<void()> refused;
  const std::lock_guard lock(mutex_);
  if (isQueueTaken_) {
    refused.swap(item);
    return;
  }
  items_.push_back(std::move(item));
  if (phase_ != Phase::kRunning) {
    return;
  }
  // Idle workers that were woken but have not taken their item yet still count as idle, and their
  // items as waiting.
  if (items_.size() <= idle_ || workers_ == maxWorkers_) {
    itemsOrEnd_.notify_one();
    return;
  }
  try {
    StartWorker();
  } catch (...) {
    // With another worker the item runs later; without one it would never run.
    if (workers_ == 0) {
      refused.swap(items_.back());
      items_.pop_back();
      throw;
    }
  }
}

void WorkerSet::Freeze(std::chrono::milliseconds limit) {
  std::unique_lock lock(mutex_);
  phase_ = Phase::kFrozen;
  const std::size_t ownThreads = ownSet == this ? 1 : 0;
  workerChanged_.wait_for(lock, limit,
                          [this, ownThreads] { return workers_ - idle_ <= ownThreads; });
}

std::deque<std::function<void()>> WorkerSet::TakeQueue() {
  const std::lock_guard lock(mutex_);
  isQueueTaken_ = true;
  return std::exchange(items_, {});
}

std::size_t WorkerSet::WorkerCount() const {
  const std::lock_guard lock(mutex_);
  return workers_;
}

void WorkerSet::StartWorker() {
  StartPoolThread(threadName_, [this] { WorkerLoop(); });
  ++workers_;
}

void WorkerSet::WorkerLoop() {
  ownSet = this;
  std::unique_lock lock(mutex_);
  std::function<void()> item;
  while (WaitForItem(lock, item)) {
    lock.unlock();
    RunCompletion(item);
    item = nullptr;
    lock.lock();
  }
  // This object must not be used after the lock is released: the destructor waits only until no
  // worker is left.
  --workers_;
  workerChanged_.notify_all();
}

bool WorkerSet::WaitForItem(std::unique_lock<std::mutex>& lock, std::function<void()>& item) {
  const auto deadline = std::chrono::steady_clock::now() + idleLimit_;
  ++idle_;
  if (phase_ == Phase::kFrozen) {
    workerChanged_.notify_all();
  }
  const auto canContinue = [this] { return phase_ == Phase::kEnding || !items_.empty(); };
  while (phase_ == Phase::kFrozen || !canContinue()) {
    if (phase_ == Phase::kFrozen) {
      lock.unlock();
      ParkThread();
    }
    const bool timedOut = itemsOrEnd_.wait_until(lock, deadline) == std::cv_status::timeout;
    if (timedOut && phase_ == Phase::kRunning && items_.empty()) {
      break;
    }
  }
  --idle_;
  if (phase_ == Phase::kEnding || items_.empty()) {
    return false;
  }
  item = std::move(items_.front());
  items_.pop_front();
  return true;
}

}  // namespace Tarnik::System
