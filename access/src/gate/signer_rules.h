#ifndef SSOCLIENT_ACCESS_GATE_SIGNER_RULES_H
#define SSOCLIENT_ACCESS_GATE_SIGNER_RULES_H

#include <vector>

#include <ssoclient/access/verdict.h>
#include <ssoclient/saml_token.h>

#include "gate/clock_rules.h"
#include "trust/trust_snapshot.h"

namespace SsoClient::Access {

using Signers = std::vector<const Signer*>;

/// The signers that may have signed the token, by its issuer and its KeyInfo. Both are only what
/// the token claims.
Signers SelectSigners(const TrustSnapshot& trust, const SamlToken& token);

/// `Reason::kNone`, `kSignerNotYetValid` or `kSignerExpired`. RFC 5280, section 4.1.2.5: a
/// certificate is valid through notAfter.
Reason ValidityOf(const Signer& signer, const ClockRules& clock) noexcept;
/// `Reason::kNone`, `kSignerRevoked` or `kRevocationUnknown`. RFC 5280, section 5.1.2.5: a list is
/// current before its nextUpdate. A certificate on it is revoked even if the date is in the future,
/// and also after the list is out of date.
Reason RevocationOf(const Signer& signer, const ClockRules& clock) noexcept;

/// Removes the signers that are not valid now, or are revoked. Returns the reason of the first one
/// when none is left.
Reason KeepValid(Signers& signers, const ClockRules& clock);
Reason KeepUnrevoked(Signers& signers, const ClockRules& clock);
/// Removes those after the first `kMostTried`, so that a token cannot cost the time of verifying
/// its signature with any number of keys.
void KeepTried(Signers& signers);

}  // namespace SsoClient::Access

#endif
