#ifndef TARNIK_HTTP_HTTP_USER_AGENT_H
#define TARNIK_HTTP_HTTP_USER_AGENT_H

#include <cstddef>
#include <functional>

#include <tarnik/core/exception.h>
#include <tarnik/core/ref.h>
#include <tarnik/http/connection_spec.h>
#include <tarnik/http/cookie_store.h>
#include <tarnik/http/http_request.h>
#include <tarnik/http/http_response.h>
#include <tarnik/system/cancellable_item.h>

namespace Tarnik::Http {

/// The longest status line and headers of an answer, with those of its interim answers, in bytes.
inline constexpr std::size_t kMaxHeaderBytes = std::size_t{64} * 1024;
/// The longest body of an answer, in bytes.
inline constexpr std::size_t kMaxBodyBytes = std::size_t{16} * 1024 * 1024;

/// An exchange under way. `Cancel` closes its connection, and the completion then receives a
/// `CancelledException`. `Cancel` returns false when the exchange had already ended.
class TARNIK_EXPORT PendingRequestItem : public System::CancellableItem {};

/// Keeps idle connections for later requests: at most 8 to one endpoint and 64 in total, each for
/// at most 5 seconds. Several agents may share a pool, but only agents with the same spec object
/// share connections, since another spec may trust other peers. The pool closes its idle
/// connections when it is destroyed. Thread-safe.
class TARNIK_EXPORT ConnectionPool : public virtual Object {};

/// An empty pool.
TARNIK_EXPORT Ref<ConnectionPool> CreateConnectionPool();

/// Sends HTTP/1.1 requests (RFC 9112) to one endpoint. Thread-safe. Each exchange under way has a
/// separate connection, and connections are kept for later exchanges while the agent (or the pool
/// that it was given) exists. Redirects are not followed, no content coding is requested, and no
/// request is ever sent twice: when the peer closes an idle connection at the moment of the next
/// request, that exchange fails (RFC 9110, section 9.2.2).
///
/// An exchange fails with `HttpException` when the answer violates RFC 9112, is ambiguous or
/// exceeds a limit, and with `CutOffException` when it is cut off; failures of the stream are
/// reported unchanged.
class TARNIK_EXPORT UserAgent : public virtual Object {
 public:
  /// Receives an exception or an answer, and the item that `SendAsync` has returned.
  using Completion = std::function<void(Exception*, ClientResponse*, PendingRequestItem*)>;

  /// Sends `request` and returns immediately. The completion runs exactly once, on an I/O thread,
  /// with exactly one of exception and response; both are valid only during the call. It must not
  /// block, and an exception that leaves it ends the process, as on any thread. When
  /// `timeoutMicroseconds` is not 0 and that time passes first, the exchange ends with a
  /// `TimeoutException`; the time is measured from the call to the last byte of the answer.
  ///
  /// Throws `InvalidArgumentException` for a null request, an empty completion or a spec whose host
  /// is neither a name nor an address, `InvalidStateException` for a request that has already been
  /// sent, `ResourceException` when the thread pool cannot be started, `std::bad_alloc`, and
  /// whatever the spec throws when it cannot begin to connect. The completion then never runs. It
  /// never runs either when the process is ending (see `ThreadPool`) and in a forked child.
  ///
  /// When an allocation fails on an I/O thread, the exchange ends with a `ResourceException`. An
  /// allocation that fails inside the completion is the completion's own.
  virtual Ref<PendingRequestItem> SendAsync(ClientRequest* request, Completion completion,
                                            unsigned long timeoutMicroseconds) = 0;

  /// Waits until the exchange has ended and its completion has run, and returns its response or
  /// throws its exception. When `timeoutMicroseconds` is not 0 and that time passes first, the
  /// exchange is cancelled and ends with the `TimeoutException` that is thrown. May be called
  /// several times. Must not be called on an I/O thread, including from a completion. Throws
  /// `TypeMismatchException` for an item that was not created by an agent of this library,
  /// `CancelledException` when the process is ending before the exchange has ended, and
  /// `InvalidStateException` in a forked child for an exchange that was begun in the parent.
  virtual Ref<ClientResponse> Wait(PendingRequestItem* item, unsigned long timeoutMicroseconds) = 0;
};

/// An agent that connects through `spec`. Throws `TypeMismatchException` unless `spec` is a
/// `CustomConnectionSpec`. `cookies` may be null for no cookies. If `pool` is null, the agent uses
/// a pool of its own.
TARNIK_EXPORT Ref<UserAgent> CreateHttpUserAgent(ConnectionSpec* spec, CookieStore* cookies,
                                                 ConnectionPool* pool);

}  // namespace Tarnik::Http

#endif
