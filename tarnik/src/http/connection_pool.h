#ifndef TARNIK_HTTP_CONNECTION_POOL_H
#define TARNIK_HTTP_CONNECTION_POOL_H

#include <cstdint>
#include <memory>
#include <mutex>
#include <string>
#include <vector>

#include <tarnik/core/object_impl.h>
#include <tarnik/http/connection_spec.h>
#include <tarnik/http/http_user_agent.h>
#include <tarnik/system/cancellable_item.h>

#include "http/connection.h"

namespace Tarnik::Http {

/// How long a connection is kept without use. Short, since the peer may close it at the moment of
/// the next request, and a POST that is lost that way is not repeated (RFC 9110, section 9.2.2).
inline constexpr unsigned long kMaxIdleMicroseconds = 5000000;
inline constexpr std::size_t kMaxIdlePerPlace = 8;
inline constexpr std::size_t kMaxIdle = 64;

/// Where a connection leads. The spec counts besides its endpoint: another one may trust other
/// peers, or none.
struct Place {
  Ref<CustomConnectionSpec> spec;
  std::string endpointKey;

  friend bool operator==(const Place& a, const Place& b) noexcept {
    return a.spec == b.spec && a.endpointKey == b.endpointKey;
  }
};

/// The connections that nobody uses at the moment. Closes them when it dies.
class IdleConnections final : public std::enable_shared_from_this<IdleConnections> {
 public:
  IdleConnections() = default;
  ~IdleConnections();
  IdleConnections(const IdleConnections&) = delete;
  IdleConnections& operator=(const IdleConnections&) = delete;

  /// The connection to `place` that was used last, or null.
  Ref<Connection> Take(const Place& place);
  /// Keeps a connection on which no read or write is under way.
  void Put(const Place& place, Ref<Connection> connection);

 private:
  struct Entry {
    std::uint64_t id;
    Place place;
    Ref<Connection> connection;
    Ref<System::CancellableItem> expiry;
  };

  /// What is taken out ends here, outside the lock.
  static void Discard(const Entry& entry) noexcept;

  std::uint64_t NextId();
  void Drop(std::uint64_t id);
  /// The entry that must go for one more to `place`, if any.
  std::vector<Entry>::iterator Superfluous(const Place& place);

  std::mutex mutex_;
  /// The one idle for longest first.
  std::vector<Entry> entries_;
  std::uint64_t lastId_ = 0;
};

class ConnectionPoolImpl final : public ConnectionPool, public ObjectImpl {
 public:
  ConnectionPoolImpl() : idle_(std::make_shared<IdleConnections>()) {}

  /// For an exchange, which may outlive the pool.
  std::weak_ptr<IdleConnections> Idle() const noexcept { return idle_; }

 private:
  ~ConnectionPoolImpl() override = default;

  const std::shared_ptr<IdleConnections> idle_;
};

}  // namespace Tarnik::Http

#endif
