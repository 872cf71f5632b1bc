#ifndef TARNIK_HTTP_IDLE_CONNECTIONS_H
#define TARNIK_HTTP_IDLE_CONNECTIONS_H

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include <tarnik/core/ref.h>
#include <tarnik/http/connection_spec.h>
#include <tarnik/system/cancellable_item.h>

#include "http/connection.h"
#include "support/fork.h"

namespace Tarnik::Http {

/// How long a connection is kept without use. Short, since the peer may close it at the moment of
/// the next request, and a POST that is lost that way is not repeated (RFC 9110, section 9.2.2).
inline constexpr unsigned long kMaxIdleMicroseconds = 5000000;
inline constexpr std::size_t kMaxIdlePerEndpoint = 8;
inline constexpr std::size_t kMaxIdle = 64;

/// The other end of a connection. The spec is part of it, since two specs with the same key may
/// trust different peers.
struct Endpoint {
  Ref<CustomConnectionSpec> spec;
  std::string key;  ///< as `CustomConnectionSpec::EndpointKey` returns it

  friend bool operator==(const Endpoint& a, const Endpoint& b) noexcept {
    return a.spec == b.spec && a.key == b.key;
  }
};

/// Connections that are currently not in use. The destructor closes them. A forked child begins
/// without connections. Thread-safe.
class IdleConnections final : public std::enable_shared_from_this<IdleConnections> {
 public:
  IdleConnections() = default;
  ~IdleConnections();
  IdleConnections(const IdleConnections&) = delete;
  IdleConnections& operator=(const IdleConnections&) = delete;

  /// The connection to `endpoint` that was used last, or null.
  Ref<Connection> Take(const Endpoint& endpoint);
  /// Keeps a connection on which no read or write is under way. When it throws, the connection is
  /// not kept.
  void Put(const Endpoint& endpoint, Ref<Connection> connection);

 private:
  struct Entry {
    std::uint64_t id;
    Endpoint endpoint;
    Ref<Connection> connection;
    Ref<System::CancellableItem> expiry;
  };

  /// Closes the connection of a removed entry. Called without the lock.
  static void Discard(const Entry& entry) noexcept;

  /// Removes the connections of a parent process with the lock held, and returns them, to be
  /// released without it.
  std::vector<Entry> ForgetParent();
  std::uint64_t NextId();
  void Drop(std::uint64_t id);
  /// The entry to remove before one to `endpoint` is added; the end if there is room.
  std::vector<Entry>::iterator FindSurplus(const Endpoint& endpoint);

  // All under `ObjectLock(this)`.
  std::vector<Entry> entries_;  // the one that has been idle longest first
  ForkMark mark_;
  std::uint64_t lastId_ = 0;
};

}  // namespace Tarnik::Http

#endif
