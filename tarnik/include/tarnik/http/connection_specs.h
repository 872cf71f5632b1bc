#ifndef TARNIK_HTTP_CONNECTION_SPECS_H
#define TARNIK_HTTP_CONNECTION_SPECS_H

#include <string>

#include <tarnik/core/ref.h>
#include <tarnik/http/connection_spec.h>
#include <tarnik/ssl/ssl_context.h>

namespace Tarnik::Http {

/// A spec of plain TCP connections to `port` of `host`, a DNS name or a literal IPv4 or IPv6
/// address without brackets; `ParseHttpURL` splits a URL into the two. Throws
/// `InvalidArgumentException` for any other host and for a port outside 1 to 65535.
TARNIK_EXPORT Ref<ConnectionSpec> CreateTCPConnectionSpec(const std::string& host, int port);

/// A spec of TLS connections to the same, with the trust and the client's identity of `sslContext`,
/// of which it keeps a reference. The peer's certificate must name `serverName`, or `host` if
/// `serverName` is empty, as `SSLStream::HandshakeClientAsync` describes. Throws
/// `InvalidArgumentException` also when `sslContext` is null or `serverName` is neither empty, nor
/// a DNS name, nor an address.
TARNIK_EXPORT Ref<ConnectionSpec> CreateTLSConnectionSpec(const std::string& host, int port,
                                                          Ssl::SSLContext* sslContext,
                                                          const std::string& serverName);

}  // namespace Tarnik::Http

#endif
