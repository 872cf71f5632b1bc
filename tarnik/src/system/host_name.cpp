#include "system/host_name.h"

#include <arpa/inet.h>
#include <tarnik/core/exception.h>

#include <algorithm>

namespace Tarnik::System {
namespace {

constexpr std::size_t kMaxHostLength = 253;

bool IsAllowed(char character) {
  return character > ' ' && character < '\x7f' &&
         std::string_view("[]/\\@\"<>").find(character) == std::string_view::npos;
}

}  // namespace

void RequireHostName(std::string_view host) {
  if (host.empty()) {
    throw InvalidArgumentException("The host name is empty.");
  }
  if (host.size() > kMaxHostLength) {
    throw InvalidArgumentException("The host name is longer than 253 characters.");
  }
  if (host.front() == '.') {
    throw InvalidArgumentException("The host name begins with a full stop.");
  }
  if (!std::all_of(host.begin(), host.end(), IsAllowed)) {
    throw InvalidArgumentException("The host name holds a character that no host name may hold.");
  }
}

bool IsAddressLiteral(const std::string& host) {
  unsigned char address[sizeof(in6_addr)];
  return inet_pton(AF_INET, host.c_str(), address) == 1 ||
         inet_pton(AF_INET6, host.substr(0, host.find('%')).c_str(), address) == 1;
}

std::string DescribeEndpoint(const std::string& host, int port) {
  const bool needsBrackets = host.find(':') != std::string::npos;
  return (needsBrackets ? "[" + host + "]" : host) + ":" + std::to_string(port);
}

}  // namespace Tarnik::System
