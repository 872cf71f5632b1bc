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

#include "http/client_request.h"
#include "http/connection.h"
#include "http/connection_pool.h"
#include "http/response_parser.h"

namespace Tarnik::Http {

/// One request and its answer: connects or takes an idle connection, writes, reads, and ends once,
/// by whatever comes first: the answer, a failure, its time limit or `Cancel`.
///
/// The read starts with the write, so that a close or an early answer is seen at once. What
/// operations under way need, their completions keep alive.
class Exchange final : public PendingRequestItem, public ObjectImpl {
 public:
  /// What an exchange works with.
  struct Parts {
    Place place;
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

  /// Begins; `timeoutMicroseconds` of 0 sets no limit. Throws what the spec throws when it cannot
  /// even begin to connect; the completion then never runs.
  void Start(unsigned long timeoutMicroseconds);
  bool Cancel() override;
  /// As `UserAgent::Wait`.
  Ref<ClientResponse> Wait(unsigned long timeoutMicroseconds);

 private:
  /// How an exchange has ended: by exactly one of the two.
  struct Outcome {
    std::shared_ptr<Exception> failure;
    Ref<ClientResponse> response;
  };
  /// What is under way on behalf of the exchange.
  struct Work {
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
  /// Feeds the parser; gives what is wrong, if anything.
  std::shared_ptr<Exception> Take(std::string_view bytes, const Exception* error);
  void OnAnswer();
  void Finish(bool mayReuse);

  RequestRoute Route(bool isSecure) const;
  std::string HostField(bool isSecure) const;
  std::string CookiePath() const;
  void StoreCookies(const ClientResponseImpl& response, bool isSecure) const;

  bool HasEnded();
  /// On an I/O thread: ends with a copy of `failure` and runs the completion.
  void Fail(const Exception& failure);
  /// On any thread: the same, but the completion runs later. False when it had ended before.
  bool FailLater(const Exception& failure);
  /// Settles the outcome, unless there is one, and gives what was under way.
  std::optional<Work> Settle(Outcome outcome);
  /// Stops what was under way; a connection in good order may serve the next exchange.
  void Release(const Work& work, bool mayReuse) const;
  void Deliver();

  const Place place_;
  const std::string host_;
  const std::string cookieHost_;
  const bool isProxy_;
  const Ref<CookieStore> cookies_;
  const std::weak_ptr<IdleConnections> idle_;
  const std::string target_;

  std::mutex mutex_;
  std::condition_variable deliveredSignal_;
  Ref<ClientRequestImpl> request_;
  UserAgent::Completion completion_;
  Work work_;
  Outcome outcome_;
  bool hasEnded_ = false;
  bool hasConnectEnded_ = false;
  bool isDelivered_ = false;
  bool isWritten_ = false;
  /// The whole answer is there, and its connection is good for another once the request is written.
  bool isAnswerWaiting_ = false;

  /// Touched by the start of the write and by its completion alone.
  SensitiveText wire_;
  /// Touched by the one read under way and, after the last of them, by the end alone.
  ResponseParser parser_;
};

}  // namespace Tarnik::Http

#endif
