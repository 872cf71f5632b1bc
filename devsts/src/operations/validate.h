#ifndef DEVSTS_OPERATIONS_VALIDATE_H
#define DEVSTS_OPERATIONS_VALIDATE_H

#include <libxml/tree.h>

#include <optional>
#include <string>

#include "operations/operations.h"
#include "operations/token_store.h"
#include "soap/presented_token.h"

namespace DevSts {

// What a token is that somebody presents, the worst first.
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
  // Follows the token's name in a sentence; empty for a good one.
  std::string problem;
  // What was issued under the token's ID; of every state from NotYetValid on.
  std::optional<IssuedToken> issued;
};

// Judges an assertion in a document whose ids are registered: signed by this service over all of
// it, known, not revoked, current.
TokenVerdict CheckToken(xmlNode* assertion, const PresentedToken& token,
                        const std::string& signingPem, const TokenStore& store, Time now);

// The same; anything but a good token is a Fault in which `place` names it.
IssuedToken RequireValidToken(xmlNode* assertion, const PresentedToken& token,
                              const std::string& place, const std::string& signingPem,
                              const TokenStore& store, Time now);

// The operation: gives the envelope of the answer. Throws Fault.
std::string Validate(const CheckedRequest& request, const ServiceParts& parts);

}  // namespace DevSts

#endif
