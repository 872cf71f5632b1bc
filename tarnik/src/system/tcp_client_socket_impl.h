#ifndef TARNIK_SYSTEM_TCP_CLIENT_SOCKET_IMPL_H
#define TARNIK_SYSTEM_TCP_CLIENT_SOCKET_IMPL_H

#include <chrono>
#include <functional>
#include <string>

#include <tarnik/system/tcp_client_socket.h>

#include "system/connect_race.h"
#include "system/host_lookup.h"
#include "system/thread_pool_impl.h"

namespace Tarnik::System {

/// How a socket finds and tries the addresses of a host.
struct ConnectRules {
  using LookUp = std::function<HostAddresses(const std::string& host, int port)>;
  /// Runs a look-up, which may block.
  using RunLookUp = std::function<void(std::function<void()> lookUp)>;

  /// Called on a thread for look-ups; on the connecting thread for an address literal.
  LookUp lookUp = LookUpHost;
  /// Empty for the pool's own threads.
  RunLookUp runLookUp = {};
  std::chrono::milliseconds attemptDelay = kConnectAttemptDelay;
};

Ref<TCPClientSocket> CreateTCPClientSocket(ThreadPoolImpl& pool, ConnectRules rules);

}  // namespace Tarnik::System

#endif
