#include <algorithm>
#include <atomic>
#include <chrono>
#include <condition_variable>
#include <memory>
#include <mutex>
#include <new>
#include <string>
#include <utility>
#include <vector>

#include <tarnik/core/checked_cast.h>
#include <tarnik/core/exception.h>
#include <tarnik/core/object_impl.h>
#include <tarnik/http/bounded_user_agent.h>
#include <tarnik/system/thread_pool.h>

#include "core/copy_exception.h"
#include "http/exchange_progress.h"
#include "support/fork.h"
#include "support/object_lock.h"
#include "support/process_end.h"

namespace Tarnik::Http {
namespace {

constexpr const char* kDeadlinePassed = "The caller's deadline has passed.";
constexpr const char* kCancelled = "The call was cancelled by its caller.";

// An exchange of a bounded agent. Without an inner item it was refused.
class BoundedExchange final : public PendingRequestItem, public ObjectImpl {
 public:
  explicit BoundedExchange(UserAgent::Completion completion) : completion_(std::move(completion)) {}

  bool Cancel() override {
    if (mark_.IsFromParent()) {
      return false;
    }
    const Ref<PendingRequestItem> inner = Inner();
    return inner != nullptr && inner->Cancel();
  }

  void RequireOwnProcess() const {
    if (mark_.IsFromParent()) {
      throw InvalidStateException("The request was begun in the parent process.");
    }
  }

  Ref<PendingRequestItem> Inner() const {
    const std::lock_guard lock(mutex_);
    return inner_;
  }
  void SetInner(const Ref<PendingRequestItem>& inner) {
    const std::lock_guard lock(mutex_);
    inner_ = inner;
  }

  /// Ends the exchange without having begun it. Called once, before others know the exchange.
  void Refuse(const Exception& failure) {
    refusal_ = CopyException(failure);
    if (HasProcessEndBegun()) {
      return;
    }
    System::GetThreadPool()->Post([self = Ref<BoundedExchange>(this)] {
      self->Complete(self->refusal_.get(), nullptr);
      {
        const std::lock_guard lock(self->mutex_);
        self->isRefused_ = true;
      }
      self->refused_.notify_all();
    });
  }
  /// Waits until the completion of a refused exchange has run, or the process ends.
  const Exception& WaitForRefusal() {
    const ProcessEndWatch watch(mutex_, refused_);
    std::unique_lock lock(mutex_);
    refused_.wait(lock, [this] { return isRefused_ || HasProcessEndBegun(); });
    return *refusal_;
  }

  void Complete(Exception* failure, ClientResponse* response) {
    const auto completion = std::exchange(completion_, nullptr);
    completion(failure, response, this);
  }

 private:
  ~BoundedExchange() override = default;

  mutable std::mutex mutex_;
  std::condition_variable refused_;
  Ref<PendingRequestItem> inner_;
  std::shared_ptr<Exception> refusal_;  // set once
  bool isRefused_ = false;
  const ForkMark mark_;
  UserAgent::Completion completion_;  // used once
};

class CallLimitImpl final : public CallLimit, public ObjectImpl {
 public:
  explicit CallLimitImpl(Clock::time_point deadline) : deadline_(deadline) {}

  Clock::time_point Deadline() const noexcept override { return deadline_; }
  bool IsCancelled() const noexcept override { return isCancelled_; }
  std::string ToString() const override { return "<CallLimit>"; }

  ExchangeStage Stage() const noexcept override {
    const Ref<BoundedExchange> last = Last();
    const Ref<PendingRequestItem> inner = last == nullptr ? nullptr : last->Inner();
    auto* const progress = dynamic_cast<ExchangeProgress*>(inner.get());
    return progress == nullptr ? ExchangeStage::kNone : progress->Stage();
  }

  void Cancel() override {
    std::vector<Ref<BoundedExchange>> underWay;
    {
      const std::lock_guard lock(ObjectLock(this));
      isCancelled_ = true;
      underWay.swap(underWay_);
    }
    for (const auto& exchange : underWay) {
      exchange->Cancel();
    }
  }

  /// False when the limit is cancelled already.
  bool Add(const Ref<BoundedExchange>& exchange) {
    const std::lock_guard lock(ObjectLock(this));
    if (isCancelled_) {
      return false;
    }
    underWay_.push_back(exchange);
    return true;
  }
  void Remove(const Ref<BoundedExchange>& exchange) {
    const std::lock_guard lock(ObjectLock(this));
    std::erase(underWay_, exchange);
  }

  bool HasPassed() const { return Clock::now() >= deadline_; }

  /// The shorter of `microseconds`, where 0 means no limit, and the time that is left.
  unsigned long Shorten(unsigned long microseconds) const {
    if (deadline_ == Clock::time_point::max()) {
      return microseconds;
    }
    // Rounded up, since messages contain it, and since 0 would mean no limit.
    const auto left = std::chrono::ceil<std::chrono::milliseconds>(deadline_ - Clock::now());
    const auto leftMicroseconds =
        static_cast<unsigned long>(std::max(left, std::chrono::milliseconds(1)).count()) * 1000;
    return microseconds == 0 ? leftMicroseconds : std::min(microseconds, leftMicroseconds);
  }

 private:
  ~CallLimitImpl() override = default;

  Ref<BoundedExchange> Last() const noexcept {
    const std::lock_guard lock(ObjectLock(this));
    return underWay_.empty() ? nullptr : underWay_.back();
  }

  const Clock::time_point deadline_;
  std::atomic<bool> isCancelled_{false};
  std::vector<Ref<BoundedExchange>> underWay_;  // under `ObjectLock(this)`
};

// What `failure` says to the caller of a bounded agent if `limit` caused it; null otherwise.
const char* CauseOf(const CallLimitImpl& limit, const Exception& failure) noexcept {
  if (dynamic_cast<const TimeoutException*>(&failure) != nullptr && limit.HasPassed()) {
    return kDeadlinePassed;
  }
  const bool isCancelled = dynamic_cast<const CancelledException*>(&failure) != nullptr &&
                           limit.IsCancelled() && !HasProcessEndBegun();
  return isCancelled ? kCancelled : nullptr;
}

// `failure` as the caller of a bounded agent sees it.
std::shared_ptr<Exception> Translate(const CallLimitImpl& limit,
                                     const Exception& failure) noexcept {
  const char* const cause = CauseOf(limit, failure);
  if (cause == nullptr) {
    return CopyException(failure);
  }
  try {
    const std::string message = std::string(cause) + " " + failure.Message();
    if (cause == kCancelled) {
      return std::make_shared<CancelledException>(message);
    }
    return std::make_shared<TimeoutException>(message);
  } catch (const std::bad_alloc&) {
    return CopyException(failure);
  }
}

class BoundedUserAgent final : public UserAgent, public ObjectImpl {
 public:
  BoundedUserAgent(UserAgent* inner, Ref<CallLimitImpl> limit)
      : inner_(inner), limit_(std::move(limit)) {}

  Ref<PendingRequestItem> SendAsync(ClientRequest* request, Completion completion,
                                    unsigned long timeoutMicroseconds) override {
    if (!completion) {
      throw InvalidArgumentException("The completion of an HTTP request is empty.");
    }
    const auto exchange = MakeRef<BoundedExchange>(std::move(completion));
    if (!limit_->Add(exchange)) {
      exchange->Refuse(CancelledException(kCancelled));
      return exchange;
    }
    if (limit_->HasPassed()) {
      limit_->Remove(exchange);
      exchange->Refuse(TimeoutException(kDeadlinePassed));
      return exchange;
    }
    Begin(request, exchange, timeoutMicroseconds);
    return exchange;
  }

  Ref<ClientResponse> Wait(PendingRequestItem* item, unsigned long timeoutMicroseconds) override {
    const Ref<BoundedExchange> exchange(CheckedCast<BoundedExchange>(item));
    exchange->RequireOwnProcess();
    const Ref<PendingRequestItem> innerItem = exchange->Inner();
    if (innerItem == nullptr) {
      exchange->WaitForRefusal().Throw();
    }
    return WaitFor(innerItem.get(), limit_->Shorten(timeoutMicroseconds));
  }

 private:
  ~BoundedUserAgent() override = default;

  Ref<ClientResponse> WaitFor(PendingRequestItem* innerItem, unsigned long timeoutMicroseconds) {
    std::shared_ptr<Exception> failure;
    try {
      return inner_->Wait(innerItem, timeoutMicroseconds);
    } catch (const IOException& cut) {
      if (CauseOf(*limit_, cut) == nullptr) {
        throw;
      }
      failure = Translate(*limit_, cut);
    }
    failure->Throw();
    return nullptr;
  }

  void Begin(ClientRequest* request, const Ref<BoundedExchange>& exchange,
             unsigned long timeoutMicroseconds) {
    const auto complete = [limit = limit_, exchange](Exception* failure, ClientResponse* response,
                                                     PendingRequestItem*) {
      limit->Remove(exchange);
      const auto translated = failure == nullptr ? nullptr : Translate(*limit, *failure);
      exchange->Complete(translated.get(), response);
    };
    try {
      exchange->SetInner(
          inner_->SendAsync(request, complete, limit_->Shorten(timeoutMicroseconds)));
    } catch (...) {
      limit_->Remove(exchange);
      throw;
    }
    // A `Cancel` before the inner item was known has not reached it.
    if (limit_->IsCancelled()) {
      exchange->Cancel();
    }
  }

  const Ref<UserAgent> inner_;
  const Ref<CallLimitImpl> limit_;
};

}  // namespace

Ref<CallLimit> CreateCallLimit(CallLimit::Clock::time_point deadline) {
  return MakeRef<CallLimitImpl>(deadline);
}

Ref<UserAgent> CreateBoundedUserAgent(UserAgent* inner, CallLimit* limit) {
  if (inner == nullptr || limit == nullptr) {
    throw InvalidArgumentException("A bounded user agent needs a user agent and a limit.");
  }
  return MakeRef<BoundedUserAgent>(inner, Ref<CallLimitImpl>(CheckedCast<CallLimitImpl>(limit)));
}

}  // namespace Tarnik::Http
