#include <algorithm>
#include <cstdlib>
#include <new>
#include <utility>

#include <boost/asio/io_context.hpp>
#include <boost/asio/post.hpp>
#include <boost/asio/steady_timer.hpp>

#include <tarnik/core/exception.h>
#include <tarnik/system/thread_pool.h>

#include "support/openssl_init.h"
#include "system/pool_thread.h"
#include "system/thread_pool_impl.h"

namespace Tarnik::System {
namespace {

constexpr std::size_t kIoThreads = 2;
constexpr std::size_t kMaxLookups = 16;
constexpr std::chrono::seconds kIdleLimit{10};
constexpr std::chrono::milliseconds kExitLimit{200};
// Longer delays are cut to 30 years, which the clock can represent.
constexpr unsigned long kMaxDelay = 30UL * 365 * 24 * 3600 * 1000000;

thread_local bool isIoThread = false;

class Timer final : public CancellableItem, public ObjectImpl {
 public:
  Timer(boost::asio::io_context& ioContext, std::function<void()> completion)
      : timer_(ioContext), completion_(std::move(completion)) {}

  void Start(std::chrono::microseconds delay) {
    const std::lock_guard lock(mutex_);
    timer_.expires_after(delay);
    timer_.async_wait([self = Ref<Timer>(this)](const boost::system::error_code&) {
      if (const auto completion = self->TakeCompletion()) {
        completion();
      }
    });
  }

  bool Cancel() override {
    // Destroyed after the lock is released, since destructors of its captures may call `Cancel`.
    const std::function<void()> dropped = TakeCompletion();
    const std::lock_guard lock(mutex_);
    timer_.cancel();
    return dropped != nullptr;
  }

  std::string ToString() const override { return "<Timer>"; }

 private:
  std::function<void()> TakeCompletion() {
    const std::lock_guard lock(mutex_);
    return std::exchange(completion_, nullptr);
  }

  std::mutex mutex_;
  boost::asio::steady_timer timer_;
  std::function<void()> completion_;
};

void RequireCallable(const std::function<void()>& function) {
  if (!function) {
    throw InvalidArgumentException("The thread pool was given an empty function.");
  }
}

// The pool is never destroyed, since its threads use it until the process ends.
ThreadPoolImpl& ThePool() {
  static ThreadPoolImpl* const pool = [] {
    // Exit handlers run in reverse order: the one that is registered below runs before OpenSSL's.
    OpenSsl::Initialise();
    auto* created = new ThreadPoolImpl();
    created->IncRef();
    return created;
  }();
  // Registered after the pool was created, since the handler uses it.
  static const int registered = std::atexit([] { ThePool().Freeze(); });
  if (registered != 0) {
    throw std::bad_alloc();
  }
  return *pool;
}

}  // namespace

ThreadPoolImpl::ThreadPoolImpl()
    : ioContext_(std::make_unique<boost::asio::io_context>(static_cast<int>(kIoThreads))),
      workers_("tarnik-worker", kMaxWorkers, kIdleLimit),
      lookups_("tarnik-lookup", kMaxLookups, kIdleLimit) {
  const std::lock_guard lock(mutex_);
  for (; ioThreads_ < kIoThreads; ++ioThreads_) {
    StartPoolThread("tarnik-io", [this] { IoLoop(); });
  }
}

ThreadPoolImpl::~ThreadPoolImpl() {
  std::abort();
}

void ThreadPoolImpl::Run(std::function<void()> item) {
  RequireCallable(item);
  workers_.Run(std::move(item));
}

void ThreadPoolImpl::Post(std::function<void()> completion) {
  RequireCallable(completion);
  boost::asio::post(*ioContext_, std::move(completion));
}

Ref<CancellableItem> ThreadPoolImpl::RunAfter(unsigned long microseconds,
                                              std::function<void()> completion) {
  RequireCallable(completion);
  const auto timer = MakeRef<Timer>(*ioContext_, std::move(completion));
  timer->Start(std::chrono::microseconds(std::min(microseconds, kMaxDelay)));
  return timer;
}

void ThreadPoolImpl::RunLookup(std::function<void()> lookup) {
  lookups_.Run(std::move(lookup));
}

void ThreadPoolImpl::Freeze() {
  using Clock = std::chrono::steady_clock;
  const auto end = Clock::now() + kExitLimit;
  const auto remaining = [end] {
    return std::max(std::chrono::duration_cast<std::chrono::milliseconds>(end - Clock::now()),
                    std::chrono::milliseconds(0));
  };
  ioContext_->stop();
  lookups_.Freeze(std::chrono::milliseconds(0));
  WaitForIoThreads(remaining());
  workers_.Freeze(remaining());
}

void ThreadPoolImpl::IoLoop() {
  isIoThread = true;
  const boost::asio::executor_work_guard<boost::asio::io_context::executor_type> untilStopped(
      ioContext_->get_executor());
  ioContext_->run();
  {
    const std::lock_guard lock(mutex_);
    --ioThreads_;
    ioThreadStopped_.notify_all();
  }
  ParkThread();
}

void ThreadPoolImpl::WaitForIoThreads(std::chrono::milliseconds limit) {
  const std::size_t ownThreads = isIoThread ? 1 : 0;
  std::unique_lock lock(mutex_);
  ioThreadStopped_.wait_for(lock, limit, [&] { return ioThreads_ <= ownThreads; });
}

ThreadPoolImpl& ToThreadPoolImpl(ThreadPool* pool) {
  auto* impl = dynamic_cast<ThreadPoolImpl*>(pool);
  if (impl == nullptr) {
    throw InvalidArgumentException("The thread pool is not the process's own.");
  }
  return *impl;
}

Ref<ThreadPool> GetThreadPool() {
  return Ref<ThreadPool>(&ThePool());
}

}  // namespace Tarnik::System
