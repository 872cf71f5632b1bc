#ifndef SSOCLIENT_TOOL_DOCTOR_ADDRESS_H
#define SSOCLIENT_TOOL_DOCTOR_ADDRESS_H

#include <string>

#include <sys/socket.h>

namespace SsoClient::Tool::Doctor {

/// An address and a port of the service.
struct Address {
  sockaddr_storage octets{};
  socklen_t size = 0;
  /// Without the port, as people write it.
  std::string text{};

  bool IsIpv6() const noexcept { return octets.ss_family == AF_INET6; }
};

}  // namespace SsoClient::Tool::Doctor

#endif
