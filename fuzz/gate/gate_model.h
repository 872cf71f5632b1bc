#ifndef FUZZ_GATE_GATE_MODEL_H
#define FUZZ_GATE_GATE_MODEL_H

#include <ssoclient/access/token_gate.h>
#include <ssoclient/saml_token.h>

#include "gate/gate_case.h"

namespace Fuzz {

/// All that decides about the presentation of a token. `seconds` is the time of the check.
struct Presented {
  const SsoClient::Access::GateConfig& config;
  const TrustCase& trust;
  PredicateCase predicate;
  Sender sender;
  long seconds;
};

/// The reason of the first check of the signer that fails, for a token that nobody has edited;
/// `kNone` when the signature verifies.
SsoClient::Access::Reason SignerReason(const Presented& now, const GateToken& token);
/// The same for the checks of the policy, of a token whose signature verifies.
SsoClient::Access::Reason PolicyReason(const Presented& now, const SsoClient::SamlToken& token);
/// For the validity of the token.
SsoClient::Access::Reason ValidityReason(const Presented& now, const SsoClient::SamlToken& token);

/// True if the gate looks at every trusted signer at that time.
bool AreAllUsable(const Presented& now);

}  // namespace Fuzz

#endif
