#ifndef SSOCLIENT_ACCESS_ENDPOINT_H
#define SSOCLIENT_ACCESS_ENDPOINT_H

#include <string>

namespace SsoClient::Access {

/// One address of the security token service.
struct Endpoint {
  /// http or https.
  std::string url{};
  /// The name that the service's TLS certificate must have; the URL's host if empty.
  std::string sslPeerName{};
};

}  // namespace SsoClient::Access

#endif
