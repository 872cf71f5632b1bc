#ifndef SSOCLIENT_ACCESS_STEP_H
#define SSOCLIENT_ACCESS_STEP_H

#include <memory>

#include <ssoclient/access/listener.h>
#include <tarnik/http/bounded_user_agent.h>

#include "attempt.h"
#include "endpoint_set.h"
#include "failure.h"
#include "instant.h"
#include "secret.h"

namespace SsoClient::Access {

/// One attempt of a request, in preparation and under way.
struct Step {
  AttemptOperation operation = AttemptOperation::kLogin;
  /// The token to renew or to exchange.
  std::shared_ptr<const SamlToken> base;
  SecretTagger::Tag tag = 0;  ///< of the password; zero for other logins
  EndpointSet::Order order = EndpointSet::Order::kPreferredFirst;
  EndpointSet::Index endpoint = 0;
  Tarnik::Ref<Tarnik::Http::CallLimit> limit;
  AttemptRecord record;
  Instant::Steady begun;
  /// The service has refused `base`, which its source must replace.
  bool isBaseRefused = false;
};

/// What came of an attempt. Moving and copying the failures needs no memory.
struct Result {
  AttemptOutcome outcome;
  Reason reason;
  Failure failure;  ///< not set for a token
  /// A refusal of the login as it is remembered, without the password; not set otherwise.
  Failure refusal;
};

}  // namespace SsoClient::Access

#endif
