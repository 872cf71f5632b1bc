#ifndef TARNIK_SYSTEM_HOST_NAME_H
#define TARNIK_SYSTEM_HOST_NAME_H

#include <string>
#include <string_view>

namespace Tarnik::System {

/// Throws `InvalidArgumentException` unless `host` can be a host's name or address: not empty, at
/// most 253 characters, printable ASCII without blanks, brackets, "/", "@" or a leading full stop.
void RequireHostName(std::string_view host);

/// True for a literal IPv4 address in four decimal parts or an IPv6 address, also with a zone
/// ("fe80::1%eth0").
bool IsAddressLiteral(const std::string& host);

/// "host:port", an IPv6 address in brackets.
std::string DescribeEndpoint(const std::string& host, int port);

}  // namespace Tarnik::System

#endif
