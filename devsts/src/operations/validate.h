#ifndef DEVSTS_OPERATIONS_VALIDATE_H
#define DEVSTS_OPERATIONS_VALIDATE_H

#include <optional>
#include <string>

#include <libxml/tree.h>

#include "operations/operations.h"
#include "operations/token_store.h"
#include "soap/presented_token.h"

namespace DevSts {

// The state of a presented token, the most serious first.
enum class TokenState {
  Forged,
  Unknown,
  Revoked,
  NotYetValid,
  Expired,
  Valid,
};

struct TokenVerdict {
  TokenState state = TokenState::Forged;
  // The reason, a phrase that follows the token's name; empty for a valid token.
  std::string problem;
  // The token that was issued with this ID; present for NotYetValid, Expired and Valid.
  std::optional<IssuedToken> issued;
};

// Checks that an assertion is completely signed by this service, known, not revoked and within its
// validity period. The ids of its document must be registered.
TokenVerdict CheckToken(xmlNode* assertion, const PresentedToken& token,
                        const std::string& signingPem, const TokenStore& store, Time now);

// The same, but throws Fault for any token that is not valid; `place` names the token in it.
IssuedToken RequireValidToken(xmlNode* assertion, const PresentedToken& token,
                              const std::string& place, const std::string& signingPem,
                              const TokenStore& store, Time now);

// The Validate operation. Returns the envelope of the answer or throws Fault.
std::string Validate(const CheckedRequest& request, const ServiceParts& parts);

}  // namespace DevSts

#endif
