#ifndef TARNIK_SYSTEM_THREAD_POOL_H
#define TARNIK_SYSTEM_THREAD_POOL_H

#include <functional>

#include <tarnik/core/object.h>
#include <tarnik/core/ref.h>
#include <tarnik/system/cancellable_item.h>

namespace Tarnik::System {

/// The threads of the process: a few I/O threads that run completions, and an elastic set of worker
/// threads that run work items and may block.
///
/// Worker threads are added while all are busy, up to `kMaxWorkers`; further items queue in order.
/// Idle workers end after ten seconds. Thread-safe. Threads of the pool do not run the host
/// program's signal handlers.
///
/// The process may exit while work is under way. From then on nothing is started, timers included;
/// `exit` waits up to 200 ms for the completions and items that are running, and then continues
/// without those that have not ended, so that a blocked item cannot block the exit. A forked child
/// process has none of the pool's threads and must not use the pool before it calls `exec`.
class TARNIK_EXPORT ThreadPool : public virtual Object {
 public:
  static constexpr int kMaxWorkers = 256;

  /// Runs `item` on a worker thread. An exception that leaves the item ends the process, as on any
  /// thread. Throws `InvalidArgumentException` when `item` is empty (as do `Post` and `RunAfter`),
  /// and `std::system_error` when there is no worker and the system cannot create a thread.
  virtual void Run(std::function<void()> item) = 0;
  /// Runs `completion` on an I/O thread, never inside this call; it must not block.
  virtual void Post(std::function<void()> completion) = 0;
  /// Runs `completion` on an I/O thread after `microseconds`, unless the returned item is cancelled
  /// first; a cancelled completion never runs.
  virtual Ref<CancellableItem> RunAfter(unsigned long microseconds,
                                        std::function<void()> completion) = 0;
};

/// The only pool of the process, which is started on first use.
TARNIK_EXPORT Ref<ThreadPool> GetThreadPool();

}  // namespace Tarnik::System

#endif
