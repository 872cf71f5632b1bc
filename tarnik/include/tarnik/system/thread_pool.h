#ifndef TARNIK_SYSTEM_THREAD_POOL_H
#define TARNIK_SYSTEM_THREAD_POOL_H

#include <functional>

#include <tarnik/core/object.h>
#include <tarnik/core/ref.h>
#include <tarnik/system/cancellable_item.h>

namespace Tarnik::System {

/// The process's threads: a few I/O threads that run completions, and an elastic set of worker
/// threads that run work items and may block.
///
/// Worker threads are added while all are busy, up to `kMaxWorkers`; further items queue in order.
/// Idle workers end after a while. Safe from any thread. Process exit with work under way is safe:
/// items that have not started are dropped, and threads that wait stay where they are.
class TARNIK_EXPORT ThreadPool : public virtual Object {
 public:
  static constexpr int kMaxWorkers = 256;

  /// Runs `item` on a worker thread. An exception that leaves the item ends the process, as on any
  /// thread.
  virtual void Run(std::function<void()> item) = 0;
  /// Runs `completion` on an I/O thread; it must not block.
  virtual void Post(std::function<void()> completion) = 0;
  /// Runs `completion` on an I/O thread after `microseconds`, unless the item returned is cancelled
  /// before; a cancelled completion never runs.
  virtual Ref<CancellableItem> RunAfter(unsigned long microseconds,
                                        std::function<void()> completion) = 0;
};

/// The one pool of the process, started with its first use.
TARNIK_EXPORT Ref<ThreadPool> GetThreadPool();

}  // namespace Tarnik::System

#endif
