#ifndef SSOCLIENT_ACCESS_TESTS_SUPPORT_SCRIPTED_ENDPOINT_H
#define SSOCLIENT_ACCESS_TESTS_SUPPORT_SCRIPTED_ENDPOINT_H

#include <functional>
#include <memory>
#include <mutex>
#include <string>
#include <utility>
#include <vector>

#include "attempt.h"
#include "support/issued_token.h"

namespace SsoClient::Access::Testing {

/// What reached an endpoint.
struct SeenAttempt {
  AttemptOperation operation;
  std::string secret;
  std::string base;  ///< the id of the token to renew or to exchange
};

/// What an endpoint does with an attempt. The test may replace it at any time.
class Script {
 public:
  using Function = std::function<AttemptOutcome(const AttemptRequest&, Tarnik::Http::CallLimit&)>;

  void Set(Function function) {
    const std::lock_guard lock(mutex_);
    function_ = std::move(function);
  }
  AttemptOutcome Run(const AttemptRequest& request, Tarnik::Http::CallLimit& limit) {
    Function function;
    {
      const std::lock_guard lock(mutex_);
      seen_.push_back({request.operation, request.secret,
                       request.base == nullptr ? std::string() : request.base->Id()});
      function = function_;
    }
    return function(request, limit);
  }
  std::vector<SeenAttempt> Seen() const {
    const std::lock_guard lock(mutex_);
    return seen_;
  }
  std::size_t Count() const { return Seen().size(); }

 private:
  mutable std::mutex mutex_;
  Function function_;
  std::vector<SeenAttempt> seen_;
};

class ScriptedEndpoint final : public EndpointClient {
 public:
  ScriptedEndpoint(Endpoint endpoint, std::shared_ptr<Script> script)
      : endpoint_(std::move(endpoint)), script_(std::move(script)) {}

  const Endpoint& Where() const override { return endpoint_; }
  AttemptOutcome Attempt(const AttemptRequest& request, Tarnik::Http::CallLimit& limit) override {
    return script_->Run(request, limit);
  }

 private:
  const Endpoint endpoint_;
  const std::shared_ptr<Script> script_;
};

template <class Exception>
AttemptOutcome Failed(FailureKind kind, const std::string& message) {
  AttemptOutcome outcome;
  outcome.failure = std::make_exception_ptr(Exception(message));
  outcome.kind = kind;
  outcome.message = message;
  return outcome;
}

inline AttemptOutcome Unreachable() {
  return Failed<CommunicationException>(FailureKind::kUnreachable, "Connection refused.");
}
inline AttemptOutcome Refused() {
  return Failed<InvalidCredentialsException>(FailureKind::kRefusedLogin, "Wrong password.");
}
inline AttemptOutcome Expired() {
  return Failed<PasswordExpiredException>(FailureKind::kExpiredPassword, "Password expired.");
}
inline AttemptOutcome Fault() {
  return Failed<SsoException>(FailureKind::kFault, "The request was refused.");
}
inline AttemptOutcome Unavailable(std::chrono::milliseconds retryAfter) {
  auto outcome = Failed<CommunicationException>(FailureKind::kHttpStatus, "HTTP status 503.");
  outcome.httpStatus = 503;
  outcome.retryAfter = retryAfter;
  return outcome;
}
inline AttemptOutcome Issued(std::shared_ptr<const SamlToken> token) {
  AttemptOutcome outcome;
  outcome.token = std::move(token);
  outcome.httpStatus = 200;
  return outcome;
}

}  // namespace SsoClient::Access::Testing

#endif
