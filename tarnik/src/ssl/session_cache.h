#ifndef TARNIK_SSL_SESSION_CACHE_H
#define TARNIK_SSL_SESSION_CACHE_H

#include <chrono>
#include <cstddef>
#include <list>
#include <string>

#include "support/fork.h"
#include "support/openssl.h"

namespace Tarnik::Ssl {

/// TLS sessions for resumption, stored by peer. The number of sessions is limited; the oldest is
/// removed first. A forked child begins without sessions, since a ticket that both processes use
/// links their connections. Thread-safe.
class SessionCache {
 public:
  using Clock = std::chrono::steady_clock;

  static constexpr std::size_t kMaxSessions = 64;
  static constexpr std::size_t kMaxSessionsOfPeer = 4;
  /// How long the result of verifying the peer in a full handshake is trusted.
  static constexpr std::chrono::minutes kMaxAge{60};

  void Put(const std::string& peer, OpenSsl::OwnedSslSession session, Clock::time_point now);
  /// The newest session of `peer`, or null. A TLS 1.3 session is removed: its ticket is used only
  /// once, so that observers cannot link connections (RFC 8446, appendix C.4).
  OpenSsl::OwnedSslSession Take(const std::string& peer, Clock::time_point now);

  std::size_t Size() const;

 private:
  struct Entry {
    std::string peer;
    OpenSsl::OwnedSslSession session;
    Clock::time_point made;
  };

  void ForgetParent();

  // Both under `ObjectLock(this)`.
  std::list<Entry> entries_;  // the newest first
  ForkMark mark_;
};

}  // namespace Tarnik::Ssl

#endif
