#ifndef SSOCLIENT_ACCESS_GATE_TRUST_CHECKS_H
#define SSOCLIENT_ACCESS_GATE_TRUST_CHECKS_H

#include "gate/clock_rules.h"
#include "gate/signer_rules.h"
#include "gate/verdict_facts.h"

namespace SsoClient::Access {

/// A check that failed, or the last one if the reason is `kNone`.
struct CheckResult {
  CheckKind check = CheckKind::kSize;
  Reason reason = Reason::kNone;
};

/// NotBefore and NotOnOrAfter of the Conditions, and the end of the confirmation.
Reason CheckValidity(const CheckedToken& checked, const ClockRules& clock);

/// The checks of the signer and the signature of a token that has just been read, with its `trust`.
/// Sets its `signer` when the signature verifies, and otherwise may set `detail`.
CheckResult CheckSigner(CheckedToken& checked, const ClockRules& clock, std::string& detail);

/// What has to be checked again of a signer whose signature has been verified before.
CheckResult CheckSignerAgain(const Signer& signer, const ClockRules& clock) noexcept;

}  // namespace SsoClient::Access

#endif
