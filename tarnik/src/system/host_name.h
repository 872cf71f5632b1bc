#ifndef TARNIK_SYSTEM_HOST_NAME_H
#define TARNIK_SYSTEM_HOST_NAME_H

#include <string>
#include <string_view>

namespace Tarnik::System {

/// Throws `InvalidArgumentException` unless `host` can be a host name or an address: not empty, at
/// most 253 characters without the full stop of the DNS root, printable ASCII without blanks and
/// []/\@"<>, and without a leading full stop.
void RequireHostName(std::string_view host);

/// True for an IPv4 address in its dotted form of four decimal numbers.
bool IsIPv4Address(std::string_view host) noexcept;
/// True for an IPv6 address without brackets or zone.
bool IsIPv6Address(std::string_view host) noexcept;
/// True for an IPv4 or IPv6 address, the latter also with a zone ("fe80::1%eth0").
bool IsAddressLiteral(std::string_view host) noexcept;

/// `host` without the full stop of the DNS root at its end ("sts.example."). Certificates, SNI
/// (RFC 6066, section 3) and cookies do not have it.
std::string_view WithoutRootDot(std::string_view host) noexcept;

/// True for a DNS name: labels of letters, digits, hyphens and underscores (RFC 1123, section 2.1),
/// and possibly the full stop of the DNS root. The last label must not be a number, since resolvers
/// may read such a name as an address (an "inet_aton" form).
bool IsDnsName(std::string_view host) noexcept;

/// `host` as URIs and messages write it: an IPv6 address in brackets (RFC 3986, section 3.2.2).
std::string BracketIPv6(const std::string& host);
/// "host:port", an IPv6 address in brackets.
std::string DescribeEndpoint(const std::string& host, int port);

}  // namespace Tarnik::System

#endif
