#ifndef TARNIK_SYSTEM_THREAD_POOL_IMPL_H
#define TARNIK_SYSTEM_THREAD_POOL_IMPL_H

#include <atomic>
#include <functional>
#include <mutex>
#include <string>

#include <tarnik/core/object_impl.h>
#include <tarnik/system/thread_pool.h>

#include "system/pool_core.h"

namespace Tarnik::System {

/// The only implementation of `ThreadPool`. Its threads are those of the process that calls it: a
/// forked child starts new ones on first use.
class ThreadPoolImpl final : public ThreadPool, public ObjectImpl {
 public:
  ThreadPoolImpl() = default;
  ~ThreadPoolImpl() override;

  void Run(std::function<void()> item) override;
  void Post(std::function<void()> completion) override;
  Ref<CancellableItem> RunAfter(unsigned long microseconds,
                                std::function<void()> completion) override;
  std::string ToString() const override { return "<ThreadPool>"; }

  /// Throws `ResourceException` when the pool cannot be started.
  boost::asio::io_context& IoContext() { return Core().IoContext(); }

  /// Runs `lookup`, which may block but must not wait for other work of the pool. Name lookups have
  /// separate threads, so that work items which occupy all workers and wait for connections cannot
  /// prevent these connections from being made.
  void RunLookup(std::function<void()> lookup);

  /// Starts the pool if that has not been done in this process.
  PoolCore& Core();

  /// The hooks of `fork`.
  void Lock() noexcept { mutex_.lock(); }
  void Unlock() noexcept { mutex_.unlock(); }
  void ForgetParent() noexcept;

  /// The exit handler.
  void EndProcess() noexcept;

 private:
  PoolCore& StartCore();

  std::mutex mutex_;
  std::atomic<PoolCore*> core_{nullptr};
  // The core of a parent, which is not used but must be found by leak checkers. Those of earlier
  // ancestors are not kept: they were forgotten in the parent as well.
  PoolCore* coreOfParent_ = nullptr;
  bool isExitHandlerRegistered_ = false;
};

/// The implementation of what `GetThreadPool` returns.
ThreadPoolImpl& ProcessThreadPool();

/// The implementation of `pool`. Throws `InvalidArgumentException` unless `GetThreadPool` returned
/// it.
ThreadPoolImpl& ToThreadPoolImpl(ThreadPool* pool);

}  // namespace Tarnik::System

#endif
