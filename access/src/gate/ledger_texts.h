#ifndef SSOCLIENT_ACCESS_GATE_LEDGER_TEXTS_H
#define SSOCLIENT_ACCESS_GATE_LEDGER_TEXTS_H

#include <string>

#include "gate/verdict_facts.h"

namespace SsoClient::Access {

/// What `check`, which was reached, has compared with what: `CheckRecord::compared`.
std::string ComparedText(const VerdictFacts& facts, CheckKind check);

/// `Verdict::Message` for the reason of `facts`; empty without one.
std::string MessageText(const VerdictFacts& facts);

/// The parts of `ComparedText` that are about time, the signer and the signature, not yet limited.
/// The token has been read.
std::string ValidityText(const VerdictFacts& facts);
/// The token's issuer, for whom nobody may sign, and those for whom somebody may.
std::string OtherIssuersText(const VerdictFacts& facts);
std::string SignerKnownText(const VerdictFacts& facts);
std::string SignerValidText(const VerdictFacts& facts);
std::string SignerRevokedText(const VerdictFacts& facts);
std::string SignatureText(const VerdictFacts& facts);

/// The parts that are about the policy of the gate.
std::string AudienceText(const VerdictFacts& facts);
std::string OwnAudiencesText(const VerdictFacts& facts);
std::string OtherAudiencesText(const VerdictFacts& facts);
std::string ConfirmationText(const VerdictFacts& facts);
std::string PossessionText(const VerdictFacts& facts);
std::string LifetimeText(const VerdictFacts& facts);
std::string DelegationText(const VerdictFacts& facts);
std::string GroupsText(const VerdictFacts& facts);
std::string PredicateText(const VerdictFacts& facts);

}  // namespace SsoClient::Access

#endif
