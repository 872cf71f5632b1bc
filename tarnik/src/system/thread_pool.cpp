#include <algorithm>
#include <chrono>
#include <cstdlib>
#include <exception>
#include <memory>
#include <new>
#include <utility>

#include <boost/asio/io_context.hpp>
#include <boost/asio/post.hpp>
#include <boost/asio/steady_timer.hpp>

#include <tarnik/core/exception.h>
#include <tarnik/system/thread_pool.h>

#include "support/fork.h"
#include "support/openssl_init.h"
#include "support/process_end.h"
#include "system/pool_thread.h"
#include "system/thread_pool_impl.h"

namespace Tarnik::System {
namespace {

// Longer delays are cut to 30 years, which the clock can represent.
constexpr unsigned long kMaxDelay = 30UL * 365 * 24 * 3600 * 1000000;

class Timer final : public CancellableItem, public ObjectImpl {
 public:
  Timer(boost::asio::io_context& ioContext, std::function<void()> completion)
      : timer_(ioContext), completion_(std::move(completion)) {}

  void Start(std::chrono::microseconds delay) {
    const std::lock_guard lock(mutex_);
    timer_->expires_after(delay);
    timer_->async_wait([self = Ref<Timer>(this)](const boost::system::error_code&) {
      if (const auto completion = self->TakeCompletion()) {
        RunCompletion(completion);
      }
    });
  }

  bool Cancel() override {
    if (timer_.IsFromParent()) {
      return false;
    }
    // Destroyed after the lock is released, since destructors of its captures may call `Cancel`.
    const std::function<void()> dropped = TakeCompletion();
    const std::lock_guard lock(mutex_);
    timer_->cancel();
    return dropped != nullptr;
  }

  std::string ToString() const override { return "<Timer>"; }

 private:
  std::function<void()> TakeCompletion() {
    const std::lock_guard lock(mutex_);
    return std::exchange(completion_, nullptr);
  }

  std::mutex mutex_;
  ForkBound<boost::asio::steady_timer> timer_;
  std::function<void()> completion_;
};

void RequireCallable(const std::function<void()>& function) {
  if (!function) {
    throw InvalidArgumentException("The thread pool was given an empty function.");
  }
}

// At load, so that no thread can be inside the initialisation of the pool while another forks.
[[maybe_unused]] const bool kPoolTakesPartInFork = [] {
  ProcessThreadPool();
  SetForkHooks(ForkOrder::kThreadPool, {[]() noexcept { ProcessThreadPool().Lock(); },
                                        []() noexcept { ProcessThreadPool().Unlock(); },
                                        []() noexcept { ProcessThreadPool().ForgetParent(); }});
  return true;
}();

}  // namespace

ThreadPoolImpl::~ThreadPoolImpl() {
  std::abort();
}

void ThreadPoolImpl::Run(std::function<void()> item) {
  RequireCallable(item);
  Core().Workers().Run(std::move(item));
}

void ThreadPoolImpl::Post(std::function<void()> completion) {
  RequireCallable(completion);
  boost::asio::post(IoContext(),
                    [completion = std::move(completion)] { RunCompletion(completion); });
}

Ref<CancellableItem> ThreadPoolImpl::RunAfter(unsigned long microseconds,
                                              std::function<void()> completion) {
  RequireCallable(completion);
  const auto timer = MakeRef<Timer>(IoContext(), std::move(completion));
  timer->Start(std::chrono::microseconds(std::min(microseconds, kMaxDelay)));
  return timer;
}

void ThreadPoolImpl::RunLookup(std::function<void()> lookup) {
  Core().Lookups().Run(std::move(lookup));
}

PoolCore& ThreadPoolImpl::Core() {
  PoolCore* const core = core_.load(std::memory_order_acquire);
  return core == nullptr ? StartCore() : *core;
}

PoolCore& ThreadPoolImpl::StartCore() {
  // Exit handlers run in reverse order: the one that is registered below runs before OpenSSL's, if
  // the host program has initialised OpenSSL with one.
  OpenSsl::Initialise();
  const std::lock_guard lock(mutex_);
  if (PoolCore* const started = core_.load(std::memory_order_acquire)) {
    return *started;
  }
  if (HasProcessEndBegun()) {
    throw InvalidStateException("The thread pool cannot be started while the process is ending.");
  }
  auto core = std::make_unique<PoolCore>();
  if (!isExitHandlerRegistered_) {
    if (std::atexit([] { ProcessThreadPool().EndProcess(); }) != 0) {
      throw std::bad_alloc();
    }
    isExitHandlerRegistered_ = true;
  }
  core->Start();
  core_.store(core.get(), std::memory_order_release);
  return *core.release();
}

void ThreadPoolImpl::ForgetParent() noexcept {
  if (PoolCore* const core = core_.exchange(nullptr, std::memory_order_relaxed)) {
    coreOfParent_ = core;
  }
  mutex_.unlock();
}

void ThreadPoolImpl::EndProcess() noexcept {
  BeginProcessEnd();
  PoolCore* const core = core_.load(std::memory_order_acquire);
  if (core == nullptr) {
    return;
  }
  try {
    core->Freeze();
  } catch (const std::exception&) {
    // No thread or memory for the rest of the queue, whose items then never report.
  }
}

// Never destroyed, since threads use it until the process ends.
ThreadPoolImpl& ProcessThreadPool() {
  static ThreadPoolImpl* const pool = [] {
    auto* created = new ThreadPoolImpl();
    created->IncRef();
    return created;
  }();
  return *pool;
}

ThreadPoolImpl& ToThreadPoolImpl(ThreadPool* pool) {
  auto* impl = dynamic_cast<ThreadPoolImpl*>(pool);
  if (impl == nullptr) {
    throw InvalidArgumentException("The thread pool is not the process's own.");
  }
  return *impl;
}

Ref<ThreadPool> GetThreadPool() {
  return Ref<ThreadPool>(&ProcessThreadPool());
}

bool IsProcessEnding() noexcept {
  return HasProcessEndBegun();
}

}  // namespace Tarnik::System
