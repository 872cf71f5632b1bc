#include "service/service_address.h"

#include <tarnik/http/connection_specs.h>
#include <tarnik/http/http_url.h>

namespace SsoClient::Tool {

ServiceAddress ParseServiceAddress(const std::string& url) {
  ServiceAddress address;
  Tarnik::Http::ParseHttpURL(url, address.isHttps, address.host, address.port, address.target);
  return address;
}

Tarnik::Ref<Tarnik::Http::ConnectionSpec> MakeConnectionSpec(const ServiceAddress& address,
                                                             Tarnik::Ssl::SSLContext* sslContext,
                                                             const std::string& peerName) {
  if (!address.isHttps) {
    return Tarnik::Http::CreateTCPConnectionSpec(address.host, address.port);
  }
  return Tarnik::Http::CreateTLSConnectionSpec(address.host, address.port, sslContext, peerName);
}

}  // namespace SsoClient::Tool
