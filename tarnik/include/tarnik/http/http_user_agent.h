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

/// What an answer may hold.
inline constexpr std::size_t kMaxHeaderBytes = std::size_t{64} * 1024;
inline constexpr std::size_t kMaxBodyBytes = std::size_t{16} * 1024 * 1024;

/// An exchange under way. `Cancel` closes its connection; the completion then gets a
/// `CancelledException`.
class TARNIK_EXPORT PendingRequestItem : public System::CancellableItem {};

/// Keeps idle connections for later requests to the same endpoint; several agents may share one.
/// Safe from many threads.
class TARNIK_EXPORT ConnectionPool : public virtual Object {};

TARNIK_EXPORT Ref<ConnectionPool> CreateConnectionPool();

/// Sends HTTP/1.1 requests (RFC 9112) to one endpoint. Safe from many threads; each exchange under
/// way has a connection of its own, and connections are kept for the next one while the agent
/// lives. No redirect is followed and no content coding is asked for.
class TARNIK_EXPORT UserAgent : public virtual Object {
 public:
  using Completion = std::function<void(Exception*, ClientResponse*, PendingRequestItem*)>;

  /// Sends `request` and returns at once. The completion runs exactly once, on an I/O thread, with
  /// exactly one of exception and response; both are valid only during the call. It must not block.
  /// When `timeoutMicroseconds` is not 0 and that time passes first, the exchange ends with a
  /// `TimeoutException`.
  virtual Ref<PendingRequestItem> SendAsync(ClientRequest* request, Completion completion,
                                            unsigned long timeoutMicroseconds) = 0;

  /// Waits until the exchange has ended and returns its response, or throws its exception. When
  /// `timeoutMicroseconds` pass first, cancels it and throws `TimeoutException`. Not to be called
  /// on an I/O thread.
  virtual Ref<ClientResponse> Wait(PendingRequestItem* item, unsigned long timeoutMicroseconds) = 0;
};

/// An agent that connects through `spec`, a `CustomConnectionSpec`. `cookies` may be null (no
/// cookies). Without a `pool` the agent keeps its idle connections to itself.
TARNIK_EXPORT Ref<UserAgent> CreateHttpUserAgent(ConnectionSpec* spec, CookieStore* cookies,
                                                 ConnectionPool* pool);

}  // namespace Tarnik::Http

#endif
