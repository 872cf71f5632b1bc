#ifndef TARNIK_HTTP_EXCHANGE_H
#define TARNIK_HTTP_EXCHANGE_H

#include <condition_variable>
#include <memory>
#include <mutex>
#include <optional>
#include <string>

#include <tarnik/core/object_impl.h>
#include <tarnik/http/cookie_store.h>
#include <tarnik/http/http_user_agent.h>

#include "http/connection.h"
#include "http/exchange_progress.h"
#include "http/http_request_impl.h"
#include "http/idle_connections.h"
#include "http/origin.h"
#include "http/response_parser.h"
#include "support/fork.h"
#include "system/handler_memory.h"

namespace Tarnik::Http {

/// One request and its answer: connects or takes an idle connection, writes, reads, and ends once,
/// with whatever comes first: the answer, a failure, its time limit or `Cancel`.
///
/// The read starts together with the write, so that a close or an early answer is noticed
/// immediately. The completions of operations under way keep alive what these operations use.
class Exchange final : public PendingRequestItem, public ExchangeProgress, public ObjectImpl {
 public:
  /// What an exchange is made from.
  struct Parts {
    Endpoint endpoint;
    std::string host;
    std::string cookieHost;
    bool isProxy;
    /// May be null.
    Ref<CookieStore> cookies;
    std::weak_ptr<IdleConnections> idle;
    Ref<ClientRequestImpl> request;
    UserAgent::Completion completion;
  };

  explicit Exchange(Parts parts);

  /// Starts the exchange; a `timeoutMicroseconds` of 0 sets no limit. Throws what the spec throws
  /// when it cannot begin to connect, and `std::bad_alloc`; the completion then never runs.
  void Start(unsigned long timeoutMicroseconds);
  bool Cancel() override;
  ExchangeStage Stage() noexcept override;
  /// As `UserAgent::Wait`.
  Ref<ClientResponse> Wait(unsigned long timeoutMicroseconds);

 private:
  /// How an exchange ended. Exactly one of the two is set.
  struct Outcome {
    std::shared_ptr<Exception> failure;
    Ref<ClientResponse> response;
  };
  /// The operations under way for the exchange.
  struct PendingWork {
    Ref<System::CancellableItem> timer;
    Ref<System::CancellableItem> connect;
    Ref<Connection> connection;
  };

  ~Exchange() override;

  void SetTimer(unsigned long timeoutMicroseconds);
  void Connect();
  void OnConnected(System::Stream* stream, const Exception* error);
  void Begin(const Ref<Connection>& connection);
  void Read(const Ref<Connection>& connection);
  void OnWritten(const Exception* error);
  void OnRead(const Ref<Connection>& connection, std::string_view bytes, const Exception* error);
  /// Passes the result of a read to the parser; returns the failure, or null.
  std::shared_ptr<Exception> Parse(std::string_view bytes, const Exception* error);
  void OnAnswer();
  void Finish(bool mayReuse);

  void TakeOverAnswer(const ClientResponseImpl& response, const PendingWork& work, bool mayReuse);

  /// Runs a step of the exchange on an I/O thread. What the step throws is the failure of the
  /// exchange.
  template <class Step>
  void Continue(const Step& step);
  /// Ends with a copy of `failure` and runs the completion. Called on an I/O thread.
  void Fail(const Exception& failure);
  /// Ends with `failure` on any thread; the completion runs later. False when the exchange had
  /// already ended.
  bool FailLater(std::shared_ptr<Exception> failure);
  /// Ends without the completion, unless it has begun: the threads that would run it stop.
  void EndWithProcess();
  void SetFailure(const Exception& failure) noexcept;
  /// The failure after the time limit; says what the exchange is waiting for.
  TimeoutException NoAnswer(unsigned long microseconds);
  /// Sets the outcome and returns the operations under way; nothing when there already is an
  /// outcome.
  std::optional<PendingWork> Settle(Outcome outcome);
  /// Stops the operations under way and closes the connection, or keeps it if `mayReuse`.
  void Release(const PendingWork& work, bool mayReuse) const noexcept;
  /// Runs the completion. An exception that leaves it ends the process.
  void Deliver() noexcept;

  const Endpoint endpoint_;
  const Origin origin_;
  const std::weak_ptr<IdleConnections> idle_;
  const ForkMark mark_;

  std::mutex mutex_;
  std::condition_variable deliveredSignal_;
  Ref<ClientRequestImpl> request_;
  UserAgent::Completion completion_;
  PendingWork work_;
  Outcome outcome_;
  bool hasEnded_ = false;
  bool hasConnectEnded_ = false;
  bool isDelivered_ = false;
  bool isWritten_ = false;
  bool hasAnswerBegun_ = false;
  /// The answer is complete; its connection may be kept once the request has been written.
  bool isAnswerWaiting_ = false;

  System::HandlerMemory deliveryMemory_;
  /// Used only by the start of the write and by its completion.
  SensitiveText wire_;
  /// Used only by the read under way and, after the last read, by `Finish`.
  ResponseParser parser_;
};

}  // namespace Tarnik::Http

#endif
