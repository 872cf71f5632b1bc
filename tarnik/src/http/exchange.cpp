#include "http/exchange.h"

#include <algorithm>
#include <chrono>
#include <new>
#include <utility>

#include <tarnik/http/http_exception.h>
#include <tarnik/system/date_time.h>
#include <tarnik/system/thread_pool.h>

#include "core/copy_exception.h"
#include "support/ascii.h"
#include "system/connect_stage.h"
#include "system/host_name.h"

namespace Tarnik::Http {
namespace {

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

// What an exchange without a connection is waiting for.
const char* DescribeConnect(const System::CancellableItem* connect) noexcept {
  const auto* progress = dynamic_cast<const System::ConnectProgress*>(connect);
  switch (progress == nullptr ? System::ConnectStage::kConnection : progress->Stage()) {
    case System::ConnectStage::kLookUp:
      return "the host look-up";
    case System::ConnectStage::kConnection:
      return "the connection";
    default:
      return "the TLS handshake";
  }
}

}  // namespace

Exchange::Exchange(Parts parts)
    : endpoint_(std::move(parts.endpoint)),
      host_(std::move(parts.host)),
      cookieHost_(std::move(parts.cookieHost)),
      isProxy_(parts.isProxy),
      cookies_(std::move(parts.cookies)),
      idle_(std::move(parts.idle)),
      target_(parts.request->Target()),
      request_(std::move(parts.request)),
      completion_(std::move(parts.completion)),
      parser_(endpoint_.key) {}

Exchange::~Exchange() = default;

void Exchange::Start(unsigned long timeoutMicroseconds) {
  if (timeoutMicroseconds != 0) {
    SetTimer(timeoutMicroseconds);
  }
  if (const auto idle = idle_.lock()) {
    if (const Ref<Connection> connection = idle->Take(endpoint_)) {
      Begin(connection);
      return;
    }
  }
  try {
    Connect();
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
  const auto timer = System::GetThreadPool()->RunAfter(
      timeoutMicroseconds,
      [self, timeoutMicroseconds] { self->Fail(self->NoAnswer(timeoutMicroseconds)); });
  const std::lock_guard guard(mutex_);
  if (!hasEnded_) {
    work_.timer = timer;
  }
}

void Exchange::Connect() {
  const Ref<Exchange> self(this);
  const auto connect = endpoint_.spec->StartConnect(
      [self](System::Stream* stream, const Exception* error) { self->OnConnected(stream, error); });
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
  request->MoveTo(Route(connection->IsSecure()), wire_);
  Read(connection);
  connection->Write(wire_.Text(), [self = Ref<Exchange>(this)](const Exception* error) {
    self->OnWritten(error);
  });
}

void Exchange::Read(const Ref<Connection>& connection) {
  connection->Read(
      [self = Ref<Exchange>(this), connection](std::string_view bytes, const Exception* error) {
        self->OnRead(connection, bytes, error);
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
  if (HasEnded()) {
    return;
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
  const auto work = Settle({nullptr, response});
  if (!work) {
    return;
  }
  StoreCookies(*response, work->connection->IsSecure());
  Release(*work, mayReuse);
  Deliver();
}

RequestRoute Exchange::Route(bool isSecure) const {
  RequestRoute route;
  route.hostField = HostField(isSecure);
  if (isProxy_) {
    route.targetPrefix = (isSecure ? "https://" : "http://") + route.hostField;
  }
  if (cookies_ != nullptr) {
    route.cookies =
        cookies_->HeaderFor(cookieHost_, CookiePath(), isSecure, System::GetUtcDateTime());
  }
  return route;
}

// RFC 9110, section 7.2: the host and, unless it is the scheme's own, the port.
std::string Exchange::HostField(bool isSecure) const {
  std::string host = System::BracketIPv6(host_);
  const std::string& key = endpoint_.key;
  const auto colon = key.rfind(':');
  const std::string port = colon == std::string::npos ? std::string() : key.substr(colon + 1);
  if (!AreDigits(port) || port == (isSecure ? "443" : "80")) {
    return host;
  }
  return host + ":" + port;
}

std::string Exchange::CookiePath() const {
  if (target_.front() == '/') {
    return target_;
  }
  const auto authority = target_.find("://");
  const auto path = authority == std::string::npos ? authority : target_.find('/', authority + 3);
  return path == std::string::npos ? "/" : target_.substr(path);
}

void Exchange::StoreCookies(const ClientResponseImpl& response, bool isSecure) const {
  if (cookies_ == nullptr) {
    return;
  }
  const System::DateTime now = System::GetUtcDateTime();
  for (const auto& [name, value] : response.Headers()) {
    if (EqualsIgnoringCase(name, "Set-Cookie")) {
      cookies_->Store(cookieHost_, CookiePath(), isSecure, value, now);
    }
  }
}

bool Exchange::HasEnded() {
  const std::lock_guard guard(mutex_);
  return hasEnded_;
}

bool Exchange::Cancel() {
  return FailLater(CancelledException("The request to " + endpoint_.key + " was cancelled."));
}

Ref<ClientResponse> Exchange::Wait(unsigned long timeoutMicroseconds) {
  // Longer than any process runs, and short enough to be added to the clock's time.
  constexpr unsigned long kMaxMicroseconds = 1000000000000000;
  const auto isDelivered = [this] { return isDelivered_; };
  std::unique_lock lock(mutex_);
  if (timeoutMicroseconds != 0) {
    const std::chrono::microseconds limit(std::min(timeoutMicroseconds, kMaxMicroseconds));
    if (!deliveredSignal_.wait_for(lock, limit, isDelivered)) {
      lock.unlock();
      FailLater(NoAnswer(timeoutMicroseconds));
      lock.lock();
    }
  }
  deliveredSignal_.wait(lock, isDelivered);
  if (outcome_.failure != nullptr) {
    outcome_.failure->Throw();
  }
  return outcome_.response;
}

void Exchange::Fail(const Exception& failure) {
  if (const auto work = Settle({CopyException(failure), nullptr})) {
    Release(*work, false);
    Deliver();
  }
}

bool Exchange::FailLater(const Exception& failure) {
  const auto work = Settle({CopyException(failure), nullptr});
  if (!work) {
    return false;
  }
  Release(*work, false);
  System::GetThreadPool()->Post([self = Ref<Exchange>(this)] { self->Deliver(); });
  return true;
}

TimeoutException Exchange::NoAnswer(unsigned long microseconds) {
  return TimeoutException("No answer from " + endpoint_.key + " within " +
                          DurationText(microseconds) + ": waiting for " + DescribeStage() + ".");
}

const char* Exchange::DescribeStage() {
  const std::lock_guard guard(mutex_);
  if (work_.connection == nullptr) {
    return DescribeConnect(work_.connect.get());
  }
  return isWritten_ ? "the answer" : "the request to be sent";
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

void Exchange::Release(const PendingWork& work, bool mayReuse) const {
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
  idle->Put(endpoint_, work.connection);
}

void Exchange::Deliver() {
  UserAgent::Completion completion;
  {
    const std::lock_guard guard(mutex_);
    completion.swap(completion_);
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
