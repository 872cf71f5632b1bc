#ifndef TARNIK_HTTP_HOST_NAME_H
#define TARNIK_HTTP_HOST_NAME_H

#include <string_view>

namespace Tarnik::Http {

/// True for an IPv4 address in its dotted form of four decimal numbers.
bool IsIPv4Address(std::string_view host) noexcept;
/// True for an IPv6 address without brackets or zone.
bool IsIPv6Address(std::string_view host) noexcept;
/// True for a DNS name: labels of letters, digits, hyphens and underscores (RFC 1123, section 2.1)
/// whose last is not a number, so that no resolver takes it for an address (an "inet_aton" form).
bool IsDnsName(std::string_view host) noexcept;

/// True for any of the three.
inline bool IsHost(std::string_view host) noexcept {
  return IsDnsName(host) || IsIPv4Address(host) || IsIPv6Address(host);
}

}  // namespace Tarnik::Http

#endif
