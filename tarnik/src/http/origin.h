#ifndef TARNIK_HTTP_ORIGIN_H
#define TARNIK_HTTP_ORIGIN_H

#include <string>

#include <tarnik/core/ref.h>
#include <tarnik/http/cookie_store.h>

#include "http/http_request_impl.h"
#include "http/http_response_impl.h"

namespace Tarnik::Http {

/// The origin server of a request (RFC 9110, section 4.3.1), and the cookies that belong to it.
/// Immutable.
class Origin {
 public:
  struct Parts {
    std::string host;
    /// "host:port", as `CustomConnectionSpec::EndpointKey` returns it.
    std::string endpointKey;
    std::string cookieHost;
    bool isProxy;
    /// May be null.
    Ref<CookieStore> cookies;
    /// The target of the request.
    std::string target;
  };

  explicit Origin(Parts parts);

  /// What the agent adds to a request over a connection that is TLS if `isSecure`.
  RequestRoute Route(bool isSecure) const;
  /// Stores the cookies of an answer.
  void StoreCookies(const ClientResponseImpl& response, bool isSecure) const;

 private:
  std::string HostField(bool isSecure) const;

  const Parts parts_;
  const std::string cookiePath_;
};

}  // namespace Tarnik::Http

#endif
