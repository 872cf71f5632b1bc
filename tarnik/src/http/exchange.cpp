#include "http/exchange.h"

#include <algorithm>
#include <chrono>
#include <exception>
#include <new>
#include <utility>

#include <tarnik/http/http_exception.h>
#include <tarnik/system/thread_pool.h>

#include "core/copy_exception.h"
#include "support/process_end.h"
#include "system/post_with.h"

namespace Tarnik::Http {
namespace {

// As long as process exit waits for completions.
constexpr std::chrono::milliseconds kLimitAtProcessEnd{200};

std::string DurationText(unsigned long microseconds) {
  constexpr unsigned long kPerSecond = 1000000;
  constexpr unsigned long kPerMillisecond = 1000;
  if (microseconds == kPerSecond) {
    return "1 second";
  }
  if (microseconds % kPerSecond == 0) {
    return std::to_string(microseconds / kPerSecond) + " seconds";
  }
  if (microseconds % kPerMillisecond == 0) {
    return std::to_string(microseconds / kPerMillisecond) + " milliseconds";
  }
  return std::to_string(microseconds) + " microseconds";
}

// The failure that `make` returns, or `OutOfMemory()`.
template <class Make>
std::shared_ptr<Exception> MakeFailure(const Make& make) {
  try {
    return CopyException(make());
  } catch (const std::bad_alloc&) {
    return CopyException(OutOfMemory());
  }
}

}  // namespace

Exchange::Exchange(Parts parts)
    : endpoint_(std::move(parts.endpoint)),
      origin_({std::move(parts.host), endpoint_.key, std::move(parts.cookieHost), parts.isProxy,
               std::move(parts.cookies), parts.request->Target()}),
      idle_(std::move(parts.idle)),
      request_(std::move(parts.request)),
      completion_(std::move(parts.completion)),
      parser_(endpoint_.key) {}

Exchange::~Exchange() = default;

void Exchange::Start(unsigned long timeoutMicroseconds) {
  if (HasProcessEndBegun()) {
    EndWithProcess();
    return;
  }
  if (timeoutMicroseconds != 0) {
    SetTimer(timeoutMicroseconds);
  }
  try {
    const auto idle = idle_.lock();
    const Ref<Connection> connection = idle == nullptr ? nullptr : idle->Take(endpoint_);
    if (connection == nullptr) {
      Connect();
      return;
    }
    Begin(connection);
  } catch (...) {
    const auto work = Settle({});
    // If the time limit has passed already, the completion has reported that.
    if (!work) {
      return;
    }
    Release(*work, false);
    throw;
  }
}

void Exchange::SetTimer(unsigned long timeoutMicroseconds) {
  const Ref<Exchange> self(this);
  const auto timer =
      System::GetThreadPool()->RunAfter(timeoutMicroseconds, [self, timeoutMicroseconds] {
        self->Continue([&] { self->Fail(self->NoAnswer(timeoutMicroseconds)); });
      });
  const std::lock_guard guard(mutex_);
  if (!hasEnded_) {
    work_.timer = timer;
  }
}

void Exchange::Connect() {
  const Ref<Exchange> self(this);
  const auto connect =
      endpoint_.spec->StartConnect([self](System::Stream* stream, const Exception* error) {
        self->Continue([&] { self->OnConnected(stream, error); });
      });
  {
    const std::lock_guard guard(mutex_);
    // The completion may have run before this thread continued, and its connection may even serve
    // another exchange already.
    if (hasConnectEnded_) {
      return;
    }
    if (!hasEnded_) {
      work_.connect = connect;
      return;
    }
  }
  if (connect != nullptr) {
    connect->Cancel();
  }
}

void Exchange::OnConnected(System::Stream* stream, const Exception* error) {
  {
    const std::lock_guard guard(mutex_);
    hasConnectEnded_ = true;
    work_.connect = nullptr;
  }
  if (error != nullptr) {
    if (stream != nullptr) {
      stream->Close();
    }
    Fail(*error);
    return;
  }
  if (stream == nullptr) {
    Fail(HttpException("The connection to " + endpoint_.key + " was opened without a stream."));
    return;
  }
  Begin(MakeRef<Connection>(Ref<System::Stream>(stream)));
}

void Exchange::Begin(const Ref<Connection>& connection) {
  Ref<ClientRequestImpl> request;
  {
    const std::lock_guard guard(mutex_);
    if (!hasEnded_) {
      request.swap(request_);
      work_.connection = connection;
    }
  }
  if (request == nullptr) {
    connection->Close();
    return;
  }
  request->MoveTo(origin_.Route(connection->IsSecure()), wire_);
  Read(connection);
  connection->Write(wire_.Text(), [self = Ref<Exchange>(this)](const Exception* error) {
    self->Continue([&] { self->OnWritten(error); });
  });
}

void Exchange::Read(const Ref<Connection>& connection) {
  connection->Read(
      [self = Ref<Exchange>(this), connection](std::string_view bytes, const Exception* error) {
        self->Continue([&] { self->OnRead(connection, bytes, error); });
      });
}

void Exchange::OnWritten(const Exception* error) {
  wire_.Clear();
  bool isAnswerWaiting = false;
  {
    const std::lock_guard guard(mutex_);
    isWritten_ = true;
    isAnswerWaiting = isAnswerWaiting_;
  }
  if (isAnswerWaiting) {
    Finish(error == nullptr);
    return;
  }
  if (error != nullptr) {
    Fail(*error);
  }
}

void Exchange::OnRead(const Ref<Connection>& connection, std::string_view bytes,
                      const Exception* error) {
  {
    const std::lock_guard guard(mutex_);
    if (hasEnded_) {
      return;
    }
    hasAnswerBegun_ = hasAnswerBegun_ || !bytes.empty();
  }
  if (const auto failure = Parse(bytes, error)) {
    Fail(*failure);
    return;
  }
  if (!parser_.IsDone()) {
    Read(connection);
    return;
  }
  OnAnswer();
}

std::shared_ptr<Exception> Exchange::Parse(std::string_view bytes, const Exception* error) {
  if (error != nullptr) {
    return CopyException(*error);
  }
  try {
    if (bytes.empty()) {
      parser_.FeedEnd();
    } else {
      parser_.Feed(bytes);
    }
  } catch (const Exception& exception) {
    return CopyException(exception);
  } catch (const std::bad_alloc&) {
    return std::make_shared<HttpException>("There is not enough memory for the answer from " +
                                           endpoint_.key + ".");
  }
  return nullptr;
}

void Exchange::OnAnswer() {
  const bool mayReuse = parser_.MayReuseConnection();
  {
    const std::lock_guard guard(mutex_);
    if (mayReuse && !isWritten_) {
      // Usually the completion of the write is only late. A peer that answers early and will not
      // read the rest says so with "Connection: close" (RFC 9112, section 9.5).
      isAnswerWaiting_ = true;
      return;
    }
  }
  Finish(mayReuse);
}

void Exchange::Finish(bool mayReuse) {
  const Ref<ClientResponseImpl> response = parser_.TakeResponse();
  if (const auto work = Settle({nullptr, response})) {
    TakeOverAnswer(*response, *work, mayReuse);
    Deliver();
  }
}

// The outcome is set already, but nobody sees it before it is delivered.
void Exchange::TakeOverAnswer(const ClientResponseImpl& response, const PendingWork& work,
                              bool mayReuse) {
  try {
    origin_.StoreCookies(response, work.connection->IsSecure());
  } catch (const Exception& failure) {
    // An answer without its cookies must not count as a success.
    mayReuse = false;
    SetFailure(failure);
  } catch (const std::bad_alloc&) {
    mayReuse = false;
    SetFailure(OutOfMemory());
  }
  Release(work, mayReuse);
}

void Exchange::SetFailure(const Exception& failure) noexcept {
  const std::lock_guard guard(mutex_);
  outcome_ = {CopyException(failure), nullptr};
}

bool Exchange::Cancel() {
  if (mark_.IsFromParent()) {
    return false;
  }
  return FailLater(MakeFailure(
      [&] { return CancelledException("The request to " + endpoint_.key + " was cancelled."); }));
}

Ref<ClientResponse> Exchange::Wait(unsigned long timeoutMicroseconds) {
  // Longer than any process runs, and short enough to be added to the clock's time.
  constexpr unsigned long kMaxMicroseconds = 1000000000000000;
  if (mark_.IsFromParent()) {
    throw InvalidStateException("The request to " + endpoint_.key +
                                " was begun in the parent process.");
  }
  const ProcessEndWatch watch(mutex_, deliveredSignal_);
  const auto hasEnded = [this] { return isDelivered_ || HasProcessEndBegun(); };
  std::unique_lock lock(mutex_);
  if (timeoutMicroseconds != 0) {
    const std::chrono::microseconds limit(std::min(timeoutMicroseconds, kMaxMicroseconds));
    if (!deliveredSignal_.wait_for(lock, limit, hasEnded)) {
      lock.unlock();
      FailLater(MakeFailure([&] { return NoAnswer(timeoutMicroseconds); }));
      lock.lock();
    }
  }
  deliveredSignal_.wait(lock, hasEnded);
  if (!isDelivered_) {
    lock.unlock();
    EndWithProcess();
    lock.lock();
    // A completion that is running may refer to objects of the waiting thread.
    deliveredSignal_.wait_for(lock, kLimitAtProcessEnd, [this] { return isDelivered_; });
  }
  if (outcome_.failure != nullptr) {
    outcome_.failure->Throw();
  }
  return outcome_.response;
}

template <class Step>
void Exchange::Continue(const Step& step) {
  try {
    step();
  } catch (const Exception& failure) {
    Fail(failure);
  } catch (const std::bad_alloc&) {
    Fail(OutOfMemory());
  }
}

void Exchange::Fail(const Exception& failure) {
  if (const auto work = Settle({CopyException(failure), nullptr})) {
    Release(*work, false);
    Deliver();
  }
}

bool Exchange::FailLater(std::shared_ptr<Exception> failure) {
  const auto work = Settle({std::move(failure), nullptr});
  if (!work) {
    return false;
  }
  Release(*work, false);
  System::PostWith(deliveryMemory_, [self = Ref<Exchange>(this)] { self->Deliver(); });
  return true;
}

void Exchange::EndWithProcess() {
  UserAgent::Completion dropped;
  const auto work = Settle({MakeFailure([&] {
                              return CancelledException("The request to " + endpoint_.key +
                                                        " was cancelled: the process is ending.");
                            }),
                            nullptr});
  if (work) {
    Release(*work, false);
  }
  const std::lock_guard guard(mutex_);
  dropped.swap(completion_);
  // Empty when the completion has begun.
  isDelivered_ = isDelivered_ || dropped;
}

TimeoutException Exchange::NoAnswer(unsigned long microseconds) {
  return TimeoutException("No answer from " + endpoint_.key + " within " +
                          DurationText(microseconds) + ": waiting for " + Describe(Stage()) + ".");
}

ExchangeStage Exchange::Stage() noexcept {
  // A thread of the parent may have held the lock.
  if (mark_.IsFromParent()) {
    return ExchangeStage::kNone;
  }
  const std::lock_guard guard(mutex_);
  if (hasEnded_) {
    return ExchangeStage::kNone;
  }
  if (work_.connection == nullptr) {
    return ConnectStageOf(work_.connect.get());
  }
  if (!isWritten_) {
    return ExchangeStage::kSending;
  }
  return hasAnswerBegun_ ? ExchangeStage::kRestOfAnswer : ExchangeStage::kAnswer;
}

std::optional<Exchange::PendingWork> Exchange::Settle(Outcome outcome) {
  Ref<ClientRequestImpl> request;
  const std::lock_guard guard(mutex_);
  if (std::exchange(hasEnded_, true)) {
    return std::nullopt;
  }
  outcome_ = std::move(outcome);
  request.swap(request_);
  return std::exchange(work_, {});
}

void Exchange::Release(const PendingWork& work, bool mayReuse) const noexcept {
  if (work.timer != nullptr) {
    work.timer->Cancel();
  }
  if (work.connect != nullptr) {
    work.connect->Cancel();
  }
  if (work.connection == nullptr) {
    return;
  }
  const auto idle = mayReuse ? idle_.lock() : nullptr;
  if (idle == nullptr) {
    work.connection->Close();
    return;
  }
  try {
    idle->Put(endpoint_, work.connection);
  } catch (const std::exception&) {
    work.connection->Close();  // it cannot be kept without memory
  }
}

void Exchange::Deliver() noexcept {
  UserAgent::Completion completion;
  {
    const std::lock_guard guard(mutex_);
    completion.swap(completion_);
  }
  if (!completion) {
    return;  // dropped when the process ended
  }
  completion(outcome_.failure.get(), outcome_.response.get(), this);
  // What the completion captured is destroyed before a waiting thread continues, since that thread
  // may destroy objects that the captures refer to.
  completion = nullptr;
  {
    const std::lock_guard guard(mutex_);
    isDelivered_ = true;
  }
  deliveredSignal_.notify_all();
}

}  // namespace Tarnik::Http
