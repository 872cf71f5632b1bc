#ifndef SSOCLIENT_TRANSPORT_CONNECTION_SPECS_H
#define SSOCLIENT_TRANSPORT_CONNECTION_SPECS_H

#include <string>

#include <tarnik/core/ref.h>
#include <tarnik/http/connection_spec.h>
#include <tarnik/ssl/ssl_context.h>

namespace SsoClient {

/// Makes a spec of plain TCP connections to `host` and `port`. With `flag` a replacement host is
/// looked for before each connection.
void CreateSsoConnectionSpec(const std::string& host, int port, bool flag,
                             Tarnik::Ref<Tarnik::Http::ConnectionSpec>& spec);

/// Makes a spec of TLS connections over the same. The peer must be `serverName`, or the host
/// connected to if that is empty. `sslContext` must not be null; the spec keeps a reference to it.
void CreateSsoSSLConnectionSpec(const std::string& host, int port,
                                Tarnik::Ssl::SSLContext* sslContext, const std::string& serverName,
                                bool flag, Tarnik::Ref<Tarnik::Http::ConnectionSpec>& spec);

}  // namespace SsoClient

#endif
