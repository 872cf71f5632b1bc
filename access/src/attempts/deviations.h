#ifndef SSOCLIENT_ACCESS_ATTEMPTS_DEVIATIONS_H
#define SSOCLIENT_ACCESS_ATTEMPTS_DEVIATIONS_H

#include <chrono>
#include <string>
#include <vector>

#include <boost/optional.hpp>

#include <ssoclient/access/listener.h>
#include <ssoclient/holder_of_key_config.h>
#include <ssoclient/principal_id.h>
#include <ssoclient/saml_token.h>
#include <ssoclient/token_spec.h>

#include "attempts/answer_headers.h"

namespace SsoClient::Access {

/// What a request has asked for.
struct RequestedToken {
  const TokenSpec& spec;
  /// Whom the token has to be about, if the request says so.
  boost::optional<PrincipalId> subject;
  /// The key that the token has to be bound to; null for a bearer token.
  const HolderOfKeyConfig* key = nullptr;
};

/// When a token was received, by the service's clock.
struct Reception {
  WallTime serviceNow;
  std::chrono::milliseconds duration;  ///< of the exchange
};

/// The subject that `userName` names in the form "name@domain"; none for any other form.
boost::optional<PrincipalId> SubjectOf(const std::string& userName);

/// The fields of `token` that are not as requested, with empty `source` and `endpoint`. Lifetimes
/// that differ by no more than two seconds, a hundredth and the duration of the exchange are equal.
std::vector<DeviationRecord> FindDeviations(const RequestedToken& requested, const SamlToken& token,
                                            const Reception& reception);

}  // namespace SsoClient::Access

#endif
