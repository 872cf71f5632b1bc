#ifndef TARNIK_SYSTEM_WORKER_SET_H
#define TARNIK_SYSTEM_WORKER_SET_H

#include <chrono>
#include <condition_variable>
#include <cstddef>
#include <deque>
#include <functional>
#include <mutex>

namespace Tarnik::System {

/// Threads that run items which may block. A thread is added while all are busy, up to a maximum;
/// further items queue in order. Threads that are idle for `idleLimit` end. Thread-safe.
///
/// A set that lives as long as the process must be leaked, since its detached threads use it.
class WorkerSet {
 public:
  WorkerSet(const char* threadName, std::size_t maxWorkers, std::chrono::milliseconds idleLimit);
  /// Waits for the items under way; items that have not started are dropped.
  ~WorkerSet();
  WorkerSet(const WorkerSet&) = delete;
  WorkerSet& operator=(const WorkerSet&) = delete;

  void Run(std::function<void()> item);

  /// For process exit: from now on no item is started, and a thread that has finished an item stops
  /// for good. Waits at most `limit` for items that are under way on other threads.
  void Freeze(std::chrono::milliseconds limit);

  /// Takes out the items that have not started. Later items are destroyed by `Run`.
  std::deque<std::function<void()>> TakeQueue();

  std::size_t WorkerCount() const;

 private:
  enum class Phase { kRunning, kEnding, kFrozen };

  void StartWorker();
  void WorkerLoop();
  bool WaitForItem(std::unique_lock<std::mutex>& lock, std::function<void()>& item);

  const char* const threadName_;
  const std::size_t maxWorkers_;
  const std::chrono::milliseconds idleLimit_;

  mutable std::mutex mutex_;
  std::condition_variable itemsOrEnd_;
  std::condition_variable workerChanged_;
  std::deque<std::function<void()>> items_;
  std::size_t workers_ = 0;
  std::size_t idle_ = 0;
  Phase phase_ = Phase::kRunning;
  bool isQueueTaken_ = false;
};

}  // namespace Tarnik::System

#endif
