#ifndef SSOCLIENT_TOOL_SERVICE_SERVICE_ADDRESS_H
#define SSOCLIENT_TOOL_SERVICE_SERVICE_ADDRESS_H

#include <string>

#include <tarnik/core/ref.h>
#include <tarnik/http/connection_spec.h>
#include <tarnik/ssl/ssl_context.h>

namespace SsoClient::Tool {

/// The parts of a service's URL.
struct ServiceAddress {
  std::string host{};    ///< a name or an address, without brackets
  std::string target{};  ///< path and query
  int port = 0;
  bool isHttps = false;
};

/// Throws `Tarnik::InvalidArgumentException` for a malformed URL, which it does not repeat.
ServiceAddress ParseServiceAddress(const std::string& url);

/// Connections to the service. `sslContext` may be null for http. With a `peerName`, the service's
/// certificate must have that name instead of the host.
Tarnik::Ref<Tarnik::Http::ConnectionSpec> MakeConnectionSpec(const ServiceAddress& address,
                                                             Tarnik::Ssl::SSLContext* sslContext,
                                                             const std::string& peerName);

}  // namespace SsoClient::Tool

#endif
