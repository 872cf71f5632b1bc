#ifndef SSOCLIENT_TOKEN_SPEC_H
#define SSOCLIENT_TOKEN_SPEC_H

#include <cstdint>
#include <memory>
#include <set>
#include <string>
#include <vector>

#include <boost/optional.hpp>

#include <ssoclient/advice.h>
#include <ssoclient/confirmation_type.h>

namespace SsoClient {

class SamlToken;

/// The token that a caller requests from the security token service. A plain value.
struct TokenSpec {
  /// The requested lifetime in seconds from now; must be positive. The expiration time is limited
  /// to the year 9999.
  std::int64_t tokenLifetimeSec = 0;
  /// The audiences that the token is to be restricted to; not restricted if empty.
  std::set<std::string> audienceRestriction;
  /// The advice that the token is to contain.
  std::vector<Advice> advice;
  /// Whether the token may be delegated.
  bool delegable = false;
  /// The principal to whom the token is to be delegated.
  boost::optional<std::string> delegateTo;
  /// The token on behalf of whose subject the request is made; must not be null if set.
  boost::optional<std::shared_ptr<const SamlToken>> actAsToken;
  /// Whether the token may be renewed.
  bool renewable = false;
  /// How the token's subject is to be confirmed.
  ConfirmationType confirmation = CONFIRMATION_DEFAULT;
};

}  // namespace SsoClient

#endif
