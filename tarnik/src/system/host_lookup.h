#ifndef TARNIK_SYSTEM_HOST_LOOKUP_H
#define TARNIK_SYSTEM_HOST_LOOKUP_H

#include <string>
#include <vector>

#include <sys/socket.h>

namespace Tarnik::System {

/// A socket address of any family.
struct SocketAddress {
  sockaddr_storage storage;
  socklen_t length;
};

/// The result of a lookup: addresses in the order in which to try them, or why there are none.
struct HostAddresses {
  std::vector<SocketAddress> addresses;
  std::string error;
};

/// Calls the system's resolver; blocks unless `host` is an address literal.
HostAddresses LookUpHost(const std::string& host, int port);

}  // namespace Tarnik::System

#endif
