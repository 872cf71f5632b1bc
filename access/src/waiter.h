#ifndef SSOCLIENT_ACCESS_WAITER_H
#define SSOCLIENT_ACCESS_WAITER_H

#include <condition_variable>
#include <functional>
#include <memory>
#include <mutex>
#include <optional>
#include <utility>

#include <ssoclient/access/call_context.h>
#include <ssoclient/access/token_source.h>

#include "activity.h"
#include "failure.h"
#include "runtime.h"

namespace SsoClient::Access {

struct Request;

/// A caller that waits for a request. Never destroyed with the lock of the core, since destroying
/// its registration waits for the cancelling thread.
class Waiter {
 public:
  explicit Waiter(const CallContext& context) : context_(context) {}
  Waiter(const Waiter&) = delete;
  Waiter& operator=(const Waiter&) = delete;
  virtual ~Waiter() = default;

  const CallContext& Context() const noexcept { return context_; }
  /// Ends the wait. Called once, without a lock.
  virtual void Receive(Answer answer) noexcept = 0;
  /// The same in the call of the waiter itself, which fails if there is no thread to report on.
  virtual void ReceiveOrThrow(Answer answer) = 0;

  /// What it waits for; null before and after. Under the lock of the core, as is the timer.
  std::shared_ptr<Request> request;
  /// Whether another caller, or the source, has begun the request.
  bool hasJoined = false;
  Tarnik::Ref<Tarnik::System::CancellableItem> deadlineTimer;
  /// The answer that a section is about to give, and the next one in its list.
  Answer dueAnswer;
  std::shared_ptr<Waiter> nextAnswered;
  /// Set by the caller's thread only.
  CancellationRegistration cancellation;

 private:
  const CallContext context_;
};
using WaiterPtr = std::shared_ptr<Waiter>;

/// A caller whose thread is blocked.
class BlockedCaller final : public Waiter {
 public:
  using Waiter::Waiter;

  void Receive(Answer answer) noexcept override;
  void ReceiveOrThrow(Answer answer) override { Receive(std::move(answer)); }
  /// Blocks until there is an answer.
  Answer Wait();

 private:
  std::mutex mutex_;
  std::condition_variable hasAnswer_;
  std::optional<Answer> answer_;
};

/// Receives the answer of a call, once.
using AnswerCallback = std::function<void(const Answer&)>;

/// A caller that is called back on a worker thread.
class CallbackCaller final : public Waiter, public std::enable_shared_from_this<CallbackCaller> {
 public:
  CallbackCaller(const CallContext& context, AnswerCallback callback,
                 std::shared_ptr<Runtime> runtime, std::shared_ptr<Activity> activity)
      : Waiter(context),
        callback_(std::move(callback)),
        runtime_(std::move(runtime)),
        activity_(std::move(activity)) {}
  /// Reports what a worker thread had no time for when the process ends.
  ~CallbackCaller() override;

  /// If no worker can be started, the callback runs on this thread.
  void Receive(Answer answer) noexcept override;
  /// The same, but throws if no worker can be started. The callback then never runs.
  void ReceiveOrThrow(Answer answer) override;

 private:
  void Schedule();
  void Report() noexcept;

  AnswerCallback callback_;
  const std::shared_ptr<Runtime> runtime_;
  const std::shared_ptr<Activity> activity_;
  Answer answer_;
  bool isOwed_ = false;
};

}  // namespace SsoClient::Access

#endif
