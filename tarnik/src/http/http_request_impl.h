#ifndef TARNIK_HTTP_HTTP_REQUEST_IMPL_H
#define TARNIK_HTTP_HTTP_REQUEST_IMPL_H

#include <atomic>
#include <string>
#include <utility>
#include <vector>

#include <tarnik/core/object_impl.h>
#include <tarnik/http/http_request.h>

#include "support/sensitive_text.h"

namespace Tarnik::Http {

/// The parts of a request that the agent adds for the connection in use.
struct RequestRoute {
  /// The Host field: host, and port unless it is the scheme's own (RFC 9110, section 7.2).
  std::string hostField;
  /// What precedes the path in the request target: "scheme://authority" for a proxy, else empty
  /// (RFC 9112, section 3.2).
  std::string targetPrefix;
  /// The Cookie field; empty for none.
  std::string cookies;
};

class RequestBody;

/// The only implementation of `ClientRequest`.
class ClientRequestImpl final : public ClientRequest, public ObjectImpl {
 public:
  ClientRequestImpl(Method method, std::string target);

  void SetHeader(const std::string& name, const std::string& value) override;
  Ref<Writer> BodyWriter() override;

  const std::string& Target() const noexcept { return target_; }
  /// Throws `InvalidStateException` from the second call on.
  void MarkSent();
  /// Appends head and body (RFC 9112, section 3) to `wire` and clears the body.
  void MoveTo(const RequestRoute& route, SensitiveText& wire);

 private:
  ~ClientRequestImpl() override;

  const Method method_;
  const std::string target_;
  std::vector<std::pair<std::string, std::string>> headers_;
  const Ref<RequestBody> body_;
  std::atomic<bool> isSent_{false};
};

}  // namespace Tarnik::Http

#endif
