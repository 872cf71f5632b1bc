#include "system/host_lookup.h"

#include <cerrno>
#include <cstring>
#include <memory>
#include <system_error>

#include <netdb.h>

#include "system/host_name.h"

namespace Tarnik::System {
namespace {

struct FreeAddressInfo {
  void operator()(addrinfo* info) const noexcept { freeaddrinfo(info); }
};

std::string DescribeError(int code, int systemError) {
  return code == EAI_SYSTEM ? std::system_category().message(systemError) : gai_strerror(code);
}

}  // namespace

HostAddresses LookUpHost(const std::string& host, int port) {
  addrinfo hints{};
  hints.ai_family = AF_UNSPEC;
  hints.ai_socktype = SOCK_STREAM;
  hints.ai_flags = AI_NUMERICSERV | (IsAddressLiteral(host) ? AI_NUMERICHOST : 0);
  addrinfo* found = nullptr;
  const int code = getaddrinfo(host.c_str(), std::to_string(port).c_str(), &hints, &found);
  if (code != 0) {
    return {{}, DescribeError(code, errno)};
  }
  const std::unique_ptr<addrinfo, FreeAddressInfo> owner(found);
  HostAddresses result;
  for (const addrinfo* info = found; info != nullptr; info = info->ai_next) {
    SocketAddress address{};
    address.length = info->ai_addrlen;
    std::memcpy(&address.storage, info->ai_addr, info->ai_addrlen);
    result.addresses.push_back(address);
  }
  return result;
}

}  // namespace Tarnik::System
