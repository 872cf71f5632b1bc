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
/// without those that have not ended, so that a blocked item cannot block the exit.
///
/// A forked child has the same pool with threads of its own, which start on first use. Items,
/// completions and timers of the parent run only in the parent. When an item or a completion forks,
/// the child should call `exec` or `_exit` within it: if the item returns in the child, the child
/// ends as if by `exit(0)`, since the thread belongs to the parent. `fork` runs handlers that
/// acquire locks, so a signal handler must not call it; `_Fork` runs none, and its child may only
/// call `exec` or `_exit`.
class TARNIK_EXPORT ThreadPool : public virtual Object {
 public:
  /// The largest number of worker threads.
  static constexpr int kMaxWorkers = 256;

  /// Runs `item` on a worker thread. An exception that leaves the item, also `std::bad_alloc`, ends
  /// the process, as on any thread; so does one that leaves a completion.
  ///
  /// Throws `InvalidArgumentException` when `item` is empty, and `ResourceException` when there is
  /// no worker and the system cannot create a thread. `Run`, `Post` and `RunAfter` throw
  /// `ResourceException` when the pool cannot be started for lack of threads or descriptors,
  /// `InvalidStateException` when it was not started before the process began to end, and
  /// `std::bad_alloc`. What they were given then never runs.
  virtual void Run(std::function<void()> item) = 0;
  /// Runs `completion` on an I/O thread, never inside this call. It must not block: what it starts
  /// runs on the same thread, as do half of all connections. Throws as `Run` does for an empty
  /// function and for the pool.
  virtual void Post(std::function<void()> completion) = 0;
  /// Runs `completion` on an I/O thread after `microseconds`, unless the returned item is cancelled
  /// first; a cancelled completion never runs. Throws as `Post` does.
  virtual Ref<CancellableItem> RunAfter(unsigned long microseconds,
                                        std::function<void()> completion) = 0;
};

/// The only pool of the process, whose threads start on first use.
TARNIK_EXPORT Ref<ThreadPool> GetThreadPool();

/// True from the moment when process exit has stopped the pool: operations that need it end with a
/// failure immediately.
TARNIK_EXPORT bool IsProcessEnding() noexcept;

}  // namespace Tarnik::System

#endif
