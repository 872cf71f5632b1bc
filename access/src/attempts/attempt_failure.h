#ifndef SSOCLIENT_ACCESS_ATTEMPTS_ATTEMPT_FAILURE_H
#define SSOCLIENT_ACCESS_ATTEMPTS_ATTEMPT_FAILURE_H

#include <exception>
#include <string>

#include <ssoclient/access/failure_kind.h>
#include <tarnik/http/bounded_user_agent.h>

#include "attempt.h"
#include "attempts/exchange_observer.h"

namespace SsoClient::Access {

/// What is known about an attempt when its operation has thrown an exception.
struct AttemptEvidence {
  const Observation& seen;
  const Tarnik::Http::CallLimit& limit;
  /// How the token factory has failed.
  FailureKind tokenFailure = FailureKind::kNone;
  /// Whether a function or handler of the login has failed.
  bool hasLoginFailed = false;
  /// The password, which messages must not contain.
  const std::string& secret;
};

/// Sets the failure, its kind and its message in `outcome`. `exception` is not null.
void SetFailure(AttemptOutcome& outcome, const std::exception_ptr& exception,
                const AttemptEvidence& evidence);

}  // namespace SsoClient::Access

#endif
