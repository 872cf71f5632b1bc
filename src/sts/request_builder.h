#ifndef SSOCLIENT_STS_REQUEST_BUILDER_H
#define SSOCLIENT_STS_REQUEST_BUILDER_H

#include <string>

#include <ssoclient/token_spec.h>

#include "transport/soap_request.h"

namespace SsoClient {

/// Makes the requests of a service's operations. Safe from many threads.
class RequestBuilder {
 public:
  /// A request for a token by user name and password. `request` is assigned only on success.
  /// Throws `Tarnik::InvalidArgumentException` when the lifetime is not positive, and when a text
  /// cannot be sent: the message then names its element, never the text.
  virtual void BuildAcquireTokenRequest(const std::string& userName, const std::string& password,
                                        const TokenSpec& spec, SoapRequest& request) const = 0;

 protected:
  ~RequestBuilder() = default;
};

}  // namespace SsoClient

#endif
