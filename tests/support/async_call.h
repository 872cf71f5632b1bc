#ifndef SSOCLIENT_TESTS_SUPPORT_ASYNC_CALL_H
#define SSOCLIENT_TESTS_SUPPORT_ASYNC_CALL_H

#include <future>
#include <memory>
#include <string>
#include <typeinfo>

#include <ssoclient/saml_token.h>
#include <ssoclient/security_token_service.h>
#include <tarnik/core/exception.h>

namespace SsoClient::Testing {

/// What a callback received.
struct Report {
  std::shared_ptr<const SamlToken> token;
  std::string errorType;
  std::string message;
};

/// One asynchronous call to wait for.
class AsyncCall {
 public:
  SecurityTokenService::TokenCallback Callback() {
    return [promise = promise_](const std::shared_ptr<const SamlToken>& token,
                                const Tarnik::Exception* error) {
      promise->set_value({token, error != nullptr ? typeid(*error).name() : "",
                          error != nullptr ? error->Message() : ""});
    };
  }
  Report Wait() { return promise_->get_future().get(); }

 private:
  std::shared_ptr<std::promise<Report>> promise_ = std::make_shared<std::promise<Report>>();
};

}  // namespace SsoClient::Testing

#endif
