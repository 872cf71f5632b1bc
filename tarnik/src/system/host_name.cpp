#include "system/host_name.h"

#include <algorithm>

#include <arpa/inet.h>

#include <tarnik/core/exception.h>

#include "support/ascii.h"

namespace Tarnik::System {
namespace {

constexpr std::size_t kMaxNameLength = 253;
constexpr std::size_t kMaxLabelLength = 63;

bool IsAllowed(char character) {
  return character > ' ' && character < '\x7f' &&
         std::string_view("[]/\\@\"<>").find(character) == std::string_view::npos;
}

bool IsAddress(int family, std::string_view host) noexcept {
  if (host.empty() || host.size() >= INET6_ADDRSTRLEN ||
      host.find('\0') != std::string_view::npos) {
    return false;
  }
  char text[INET6_ADDRSTRLEN] = {};
  std::copy(host.begin(), host.end(), text);
  in6_addr address;
  return inet_pton(family, text, &address) == 1;
}

bool IsLabel(std::string_view label) noexcept {
  if (label.empty() || label.size() > kMaxLabelLength) {
    return false;
  }
  if (label.front() == '-' || label.back() == '-') {
    return false;
  }
  return std::all_of(label.begin(), label.end(),
                     [](char c) { return IsDigit(c) || IsLetter(c) || c == '-' || c == '_'; });
}

bool IsNumber(std::string_view label) noexcept {
  if (AreDigits(label)) {
    return true;
  }
  const bool hasHexPrefix =
      label.size() >= 2 && label[0] == '0' && (label[1] == 'x' || label[1] == 'X');
  return hasHexPrefix && std::all_of(label.begin() + 2, label.end(), IsHexDigit);
}

}  // namespace

void RequireHostName(std::string_view host) {
  if (host.empty()) {
    throw InvalidArgumentException("The host name is empty.");
  }
  if (WithoutRootDot(host).size() > kMaxNameLength) {
    throw InvalidArgumentException("The host name is longer than 253 characters.");
  }
  if (host.front() == '.') {
    throw InvalidArgumentException("The host name begins with a full stop.");
  }
  if (!std::all_of(host.begin(), host.end(), IsAllowed)) {
    throw InvalidArgumentException("The host name holds a character that no host name may hold.");
  }
}

bool IsIPv4Address(std::string_view host) noexcept {
  return IsAddress(AF_INET, host);
}

bool IsIPv6Address(std::string_view host) noexcept {
  return IsAddress(AF_INET6, host);
}

bool IsAddressLiteral(std::string_view host) noexcept {
  return IsIPv4Address(host) || IsIPv6Address(host.substr(0, host.find('%')));
}

std::string_view WithoutRootDot(std::string_view host) noexcept {
  return host.size() > 1 && host.back() == '.' ? host.substr(0, host.size() - 1) : host;
}

bool IsDnsName(std::string_view host) noexcept {
  host = WithoutRootDot(host);
  if (host.empty() || host.size() > kMaxNameLength) {
    return false;
  }
  while (true) {
    const auto dot = host.find('.');
    const std::string_view label = host.substr(0, dot);
    if (!IsLabel(label)) {
      return false;
    }
    if (dot == std::string_view::npos) {
      return !IsNumber(label);
    }
    host.remove_prefix(dot + 1);
  }
}

std::string BracketIPv6(const std::string& host) {
  const bool isIPv6 = host.find(':') != std::string::npos;
  return isIPv6 ? "[" + host + "]" : host;
}

std::string DescribeEndpoint(const std::string& host, int port) {
  return BracketIPv6(host) + ":" + std::to_string(port);
}

}  // namespace Tarnik::System
