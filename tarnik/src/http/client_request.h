#ifndef TARNIK_HTTP_CLIENT_REQUEST_H
#define TARNIK_HTTP_CLIENT_REQUEST_H

#include <atomic>
#include <string>
#include <utility>
#include <vector>

#include <tarnik/core/object_impl.h>
#include <tarnik/http/http_request.h>

#include "support/sensitive_text.h"

namespace Tarnik::Http {

/// What a request says about where it goes; the agent's part of it.
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

class ClientRequestImpl final : public ClientRequest, public ObjectImpl {
 public:
  ClientRequestImpl(Method method, std::string target);

  void SetHeader(const std::string& name, const std::string& value) override;
  Ref<Writer> BodyWriter() override;

  const std::string& Target() const noexcept { return target_; }
  /// Throws `InvalidStateException` from the second time on.
  void MarkSent();
  /// Writes head and body (RFC 9112, section 3) into `wire` and forgets the body.
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
