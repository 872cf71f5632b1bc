#ifndef SSOCLIENT_ACCESS_ATTEMPT_H
#define SSOCLIENT_ACCESS_ATTEMPT_H

#include <chrono>
#include <exception>
#include <memory>
#include <string>
#include <vector>

#include <boost/optional.hpp>

#include <ssoclient/access/listener.h>
#include <ssoclient/access/token_source.h>
#include <tarnik/core/exception.h>
#include <tarnik/http/bounded_user_agent.h>

namespace SsoClient::Access {

/// What one attempt asks for. The references are valid during the attempt.
struct AttemptRequest {
  AttemptOperation operation = AttemptOperation::kLogin;
  const TokenSpec& spec;
  /// The token to renew or to exchange; null for a login.
  std::shared_ptr<const SamlToken> base;
  /// The password of a `PasswordLogin`; empty otherwise.
  const std::string& secret;
};

/// What came of it.
struct AttemptOutcome {
  /// Null exactly if `failure` is set.
  std::shared_ptr<const SamlToken> token;
  /// The exception for the callers: one of the core's, or of the login's function.
  std::exception_ptr failure;
  FailureKind kind = FailureKind::kNone;
  std::string message;  ///< of the failure
  /// For `kRefusedLogin`: the secret is the reason, and not perhaps the act-as token.
  bool isAuthenticationRefused = false;
  int httpStatus = 0;  ///< of the last answer; 0 without one
  std::chrono::milliseconds retryAfter{0};
  /// The service's clock minus this system's, from the `Date` of the last answer.
  boost::optional<std::chrono::milliseconds> clockOffset;
  /// What differs between the token and the spec; `source` and `endpoint` are left empty.
  std::vector<DeviationRecord> deviations;
};

/// Makes attempts at one endpoint. Thread-safe.
class EndpointClient {
 public:
  virtual ~EndpointClient() = default;

  virtual const Endpoint& Where() const = 0;
  /// Blocks until the attempt has ended, at the latest at the deadline of `limit` or when it is
  /// cancelled. Does not throw, except `std::bad_alloc`.
  virtual AttemptOutcome Attempt(const AttemptRequest& request, Tarnik::Http::CallLimit& limit) = 0;
};

/// A client of `endpoint` over the client library, with kept connections. Throws
/// `Tarnik::InvalidArgumentException` as `CreateTokenSource` does.
std::unique_ptr<EndpointClient> CreateEndpointClient(
    const std::shared_ptr<const TokenSourceConfig>& config, const Endpoint& endpoint);

}  // namespace SsoClient::Access

#endif
