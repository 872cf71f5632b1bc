#ifndef TARNIK_HTTP_BOUNDED_USER_AGENT_H
#define TARNIK_HTTP_BOUNDED_USER_AGENT_H

#include <chrono>

#include <tarnik/core/object.h>
#include <tarnik/core/ref.h>
#include <tarnik/http/http_user_agent.h>

namespace Tarnik::Http {

/// What an exchange is waiting for.
enum class ExchangeStage {
  kNone,          ///< nothing: no exchange is under way
  kLookUp,        ///< the look-up of the host
  kConnection,    ///< the connection
  kHandshake,     ///< what follows the connection, such as the TLS handshake
  kSending,       ///< the request to be sent
  kAnswer,        ///< the beginning of the answer
  kRestOfAnswer,  ///< the rest of an answer that has begun to arrive
};

/// The limit that a caller sets to one call, or to several: a deadline, and a way to give up
/// earlier. Thread-safe.
class TARNIK_EXPORT CallLimit : public virtual Object {
 public:
  /// The clock of deadlines. Changes of the system time do not affect it.
  using Clock = std::chrono::steady_clock;

  /// When the exchanges under this limit end at the latest, to the millisecond.
  virtual Clock::time_point Deadline() const noexcept = 0;
  /// Ends the exchanges under way under this limit, which then fail with a `CancelledException`, as
  /// does each that is started later. Returns at once; may be called on any thread, any number of
  /// times.
  virtual void Cancel() = 0;
  /// True after `Cancel`.
  virtual bool IsCancelled() const noexcept = 0;
  /// What the exchange under way under this limit is waiting for; of several, the one that was
  /// started last. `kNone` also for an exchange of an agent that is not of this library.
  virtual ExchangeStage Stage() const noexcept = 0;
};

/// A limit that ends at `deadline`; with `Clock::time_point::max()` it ends only by `Cancel`.
TARNIK_EXPORT Ref<CallLimit> CreateCallLimit(CallLimit::Clock::time_point deadline);

/// An agent that sends requests by `inner` and ends its exchanges at the deadline of `limit`, or
/// when `limit` is cancelled, whatever longer time-out its callers ask for. With it in
/// `SecurityTokenServiceConfigEx`, an operation of the client ends at the deadline, although the
/// time-outs of the client itself are fixed. Make an agent, and a service, for each call that has a
/// limit of its own; `inner` may be shared, so that its connections are kept.
///
/// An exchange that is cut off fails with a `TimeoutException` that says that the caller's deadline
/// has passed, and what the exchange was waiting for, or with a `CancelledException`. An exchange
/// that is started too late fails in the same way, by its completion, without sending anything.
/// Otherwise the agent behaves as `inner`. Its items are its own: its `Wait` throws
/// `TypeMismatchException` for those of another agent. Thread-safe.
///
/// The limit covers exchanges with the service. It does not interrupt the computations of an
/// operation or the functions that the caller supplies, such as a `NegotiationHandler`.
///
/// Throws `InvalidArgumentException` when `inner` or `limit` is null.
TARNIK_EXPORT Ref<UserAgent> CreateBoundedUserAgent(UserAgent* inner, CallLimit* limit);

}  // namespace Tarnik::Http

#endif
