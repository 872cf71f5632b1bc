#ifndef TARNIK_SYSTEM_POOL_CORE_H
#define TARNIK_SYSTEM_POOL_CORE_H

#include <chrono>
#include <condition_variable>
#include <cstddef>
#include <functional>
#include <future>
#include <memory>
#include <mutex>
#include <vector>

#include "system/worker_set.h"

namespace boost::asio {
class io_context;
}

namespace Tarnik::System {

/// The threads of the pool in one process; a forked child has another core. Thread-safe.
///
/// A core whose threads have started is never destroyed, since they use it until the process ends.
class PoolCore {
 public:
  /// Throws `ResourceException` when the system has too few descriptors.
  PoolCore();
  ~PoolCore();
  PoolCore(const PoolCore&) = delete;
  PoolCore& operator=(const PoolCore&) = delete;

  /// Starts the I/O threads. One is enough; throws `ResourceException` when not even one can start.
  /// Called once, before the core is used.
  void Start();

  /// The context of the calling I/O thread. Every other thread always gets the same one of them, so
  /// that what it starts for one connection runs on one I/O thread.
  boost::asio::io_context& IoContext() noexcept;
  WorkerSet& Workers() noexcept { return workers_; }
  WorkerSet& Lookups() noexcept { return lookups_; }

  /// Stops everything for process exit, as `ThreadPool` describes.
  void Freeze();

 private:
  void IoLoop(boost::asio::io_context& ioContext);
  void WaitForIoThreads(std::chrono::milliseconds limit);
  std::future<void> DropQueue();

  // One for each I/O thread. Two threads with a common context would wake each other for every
  // handler.
  std::vector<std::unique_ptr<boost::asio::io_context>> ioContexts_;
  WorkerSet workers_;
  WorkerSet lookups_;

  std::mutex mutex_;
  std::condition_variable ioThreadStopped_;
  std::size_t ioThreads_ = 0;
};

}  // namespace Tarnik::System

#endif
