#ifndef DEVSTS_TOKEN_JUDGE_H
#define DEVSTS_TOKEN_JUDGE_H

#include <libxml/tree.h>

#include <optional>
#include <string>

#include "presented_token.h"
#include "token_store.h"

namespace DevSts {

// What a token is that somebody presents, the worst first.
enum class TokenState {
  Forged,
  Unknown,
  Revoked,
  NotYetValid,
  Expired,
  Good,
};

struct TokenVerdict {
  TokenState state = TokenState::Forged;
  // Follows the token's name in a sentence; empty for a good one.
  std::string complaint;
  // What was issued under the token's ID; of every state from NotYetValid on.
  std::optional<IssuedToken> issued;
};

// Judges an assertion in a document whose ids are registered: signed by this service over all of
// it, known, not revoked, current.
TokenVerdict JudgeToken(xmlNode* assertion, const PresentedToken& token,
                        const std::string& signingPem, const TokenStore& store, Time now);

// The same; anything but a good token is a Fault in which `place` names it.
IssuedToken RequireGoodToken(xmlNode* assertion, const PresentedToken& token,
                             const std::string& place, const std::string& signingPem,
                             const TokenStore& store, Time now);

}  // namespace DevSts

#endif
