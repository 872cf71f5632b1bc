#ifndef TARNIK_SYSTEM_THREAD_POOL_IMPL_H
#define TARNIK_SYSTEM_THREAD_POOL_IMPL_H

#include <chrono>
#include <condition_variable>
#include <cstddef>
#include <memory>
#include <mutex>

#include <tarnik/core/object_impl.h>
#include <tarnik/system/thread_pool.h>

#include "system/worker_set.h"

namespace boost::asio {
class io_context;
}

namespace Tarnik::System {

/// The only implementation of `ThreadPool`.
class ThreadPoolImpl final : public ThreadPool, public ObjectImpl {
 public:
  ThreadPoolImpl();
  ~ThreadPoolImpl() override;

  void Run(std::function<void()> item) override;
  void Post(std::function<void()> completion) override;
  Ref<CancellableItem> RunAfter(unsigned long microseconds,
                                std::function<void()> completion) override;
  std::string ToString() const override { return "<ThreadPool>"; }

  boost::asio::io_context& IoContext() noexcept { return *ioContext_; }

  /// Runs `lookup`, which may block but must not wait for other work of the pool. Name lookups have
  /// separate threads, so that work items which occupy all workers and wait for connections cannot
  /// prevent these connections from being made.
  void RunLookup(std::function<void()> lookup);

  /// Stops everything for process exit, as `ThreadPool` describes.
  void Freeze();

 private:
  void IoLoop();
  void WaitForIoThreads(std::chrono::milliseconds limit);

  const std::unique_ptr<boost::asio::io_context> ioContext_;
  WorkerSet workers_;
  WorkerSet lookups_;

  std::mutex mutex_;
  std::condition_variable ioThreadStopped_;
  std::size_t ioThreads_ = 0;
};

/// The implementation of `pool`. Throws `InvalidArgumentException` unless `GetThreadPool` returned
/// it.
ThreadPoolImpl& ToThreadPoolImpl(ThreadPool* pool);

}  // namespace Tarnik::System

#endif
