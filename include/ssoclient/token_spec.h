#ifndef SSOCLIENT_TOKEN_SPEC_H
#define SSOCLIENT_TOKEN_SPEC_H

#include <boost/optional.hpp>
#include <cstdint>
#include <memory>
#include <set>
#include <string>
#include <vector>

#include <ssoclient/advice.h>
#include <ssoclient/confirmation_type.h>

namespace SsoClient {

class SamlToken;

/// What token a caller asks the security token service for. A plain value.
struct TokenSpec {
  /// Requested lifetime in seconds from now on; must be positive. One that leaves the calendar ends
  /// with the year 9999.
  std::int64_t tokenLifetimeSec = 0;
  /// Audiences that the token is to be restricted to; none if empty.
  std::set<std::string> audienceRestriction;
  /// Advice that the token is to carry.
  std::vector<Advice> advice;
  /// Ask for a token that may be delegated.
  bool delegable = false;
  /// The principal to whom the token is to be delegated.
  boost::optional<std::string> delegateTo;
  /// A token on whose behalf the request is made; must not be null if set.
  boost::optional<std::shared_ptr<const SamlToken>> actAsToken;
  /// Ask for a token that may be renewed.
  bool renewable = false;
  /// How the token's subject is to be confirmed.
  ConfirmationType confirmation = CONFIRMATION_DEFAULT;
};

}  // namespace SsoClient

#endif
