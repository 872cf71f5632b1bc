#include "system/pool_core.h"

#include <algorithm>
#include <atomic>
#include <deque>
#include <future>

#include <boost/asio/io_context.hpp>
#include <boost/asio/ip/tcp.hpp>
#include <boost/asio/steady_timer.hpp>
#include <boost/system/system_error.hpp>

#include <tarnik/core/exception.h>
#include <tarnik/system/thread_pool.h>

#include "system/pool_thread.h"

namespace Tarnik::System {
namespace {

constexpr std::size_t kIoThreads = 2;
constexpr std::size_t kMaxLookups = 16;
constexpr std::chrono::seconds kIdleLimit{10};
constexpr std::chrono::milliseconds kExitLimit{200};

using IoContexts = std::vector<std::unique_ptr<boost::asio::io_context>>;

// Of an I/O thread.
thread_local const PoolCore* ownCore = nullptr;
thread_local boost::asio::io_context* ownContext = nullptr;

std::unique_ptr<boost::asio::io_context> MakeIoContext() {
  constexpr int kThreads = 1;
  auto ioContext = std::make_unique<boost::asio::io_context>(kThreads);
  // Asio opens its descriptors for the first timer and socket.
  const boost::asio::steady_timer timer(*ioContext);
  const boost::asio::ip::tcp::socket socket(*ioContext);
  return ioContext;
}

// At least one, and more as far as there are descriptors.
IoContexts MakeIoContexts() {
  IoContexts ioContexts;
  try {
    while (ioContexts.size() < kIoThreads) {
      ioContexts.push_back(MakeIoContext());
    }
  } catch (const boost::system::system_error& error) {
    if (ioContexts.empty()) {
      throw ResourceException("Cannot start the thread pool: " + error.code().message() + ".");
    }
  }
  return ioContexts;
}

}  // namespace

PoolCore::PoolCore()
    : ioContexts_(MakeIoContexts()),
      workers_("tarnik-worker", ThreadPool::kMaxWorkers, kIdleLimit),
      lookups_("tarnik-lookup", kMaxLookups, kIdleLimit) {}

PoolCore::~PoolCore() = default;

void PoolCore::Start() {
  const std::lock_guard lock(mutex_);
  for (; ioThreads_ < ioContexts_.size(); ++ioThreads_) {
    try {
      StartPoolThread("tarnik-io",
                      [this, &context = *ioContexts_[ioThreads_]] { IoLoop(context); });
    } catch (...) {
      if (ioThreads_ == 0) {
        throw;
      }
      // Nothing may wait for a thread that does not exist.
      ioContexts_.resize(ioThreads_);
    }
  }
}

boost::asio::io_context& PoolCore::IoContext() noexcept {
  if (ownCore == this) {
    return *ownContext;
  }
  static std::atomic<std::size_t> threads{0};
  thread_local const std::size_t number = threads.fetch_add(1, std::memory_order_relaxed);
  return *ioContexts_[number % ioContexts_.size()];
}

void PoolCore::Freeze() {
  using Clock = std::chrono::steady_clock;
  const auto end = Clock::now() + kExitLimit;
  const auto remaining = [end] {
    return std::max(std::chrono::duration_cast<std::chrono::milliseconds>(end - Clock::now()),
                    std::chrono::milliseconds(0));
  };
  for (const auto& ioContext : ioContexts_) {
    ioContext->stop();
  }
  lookups_.Freeze(std::chrono::milliseconds(0));
  workers_.Freeze(std::chrono::milliseconds(0));
  const std::future<void> isQueueDropped = DropQueue();
  WaitForIoThreads(remaining());
  workers_.Freeze(remaining());
  isQueueDropped.wait_for(remaining());
}

// On another thread, since what an item does when it is destroyed without having run may block.
std::future<void> PoolCore::DropQueue() {
  const auto items = std::make_shared<std::deque<std::function<void()>>>(workers_.TakeQueue());
  const auto done = std::make_shared<std::promise<void>>();
  if (items->empty()) {
    done->set_value();
    return done->get_future();
  }
  auto isDone = done->get_future();
  StartPoolThread("tarnik-exit", [items, done] {
    items->clear();
    done->set_value();
  });
  return isDone;
}

void PoolCore::IoLoop(boost::asio::io_context& ioContext) {
  ownCore = this;
  ownContext = &ioContext;
  const boost::asio::executor_work_guard<boost::asio::io_context::executor_type> untilStopped(
      ioContext.get_executor());
  ioContext.run();
  {
    const std::lock_guard lock(mutex_);
    --ioThreads_;
    ioThreadStopped_.notify_all();
  }
  ParkThread();
}

void PoolCore::WaitForIoThreads(std::chrono::milliseconds limit) {
  const std::size_t ownThreads = ownCore == this ? 1 : 0;
  std::unique_lock lock(mutex_);
  ioThreadStopped_.wait_for(lock, limit, [&] { return ioThreads_ <= ownThreads; });
}

}  // namespace Tarnik::System
