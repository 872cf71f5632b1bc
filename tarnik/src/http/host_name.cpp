#include "http/host_name.h"

#include <arpa/inet.h>

#include <algorithm>
#include <string>

#include "http/characters.h"

namespace Tarnik::Http {
namespace {

constexpr std::size_t kMaxNameLength = 253;
constexpr std::size_t kMaxLabelLength = 63;

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

bool IsIPv4Address(std::string_view host) noexcept {
  return IsAddress(AF_INET, host);
}

bool IsIPv6Address(std::string_view host) noexcept {
  return IsAddress(AF_INET6, host);
}

bool IsDnsName(std::string_view host) noexcept {
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

}  // namespace Tarnik::Http
