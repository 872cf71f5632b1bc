#include "gate/signer_rules.h"

#include <algorithm>

#include <tarnik/core/exception.h>

namespace SsoClient::Access {

namespace {

template <class Rule>
Reason KeepPassing(Signers& signers, const ClockRules& clock, const Rule& rule) {
  Reason first = Reason::kNone;
  std::erase_if(signers, [&](const Signer* signer) {
    const Reason reason = rule(*signer, clock);
    if (first == Reason::kNone) {
      first = reason;
    }
    return reason != Reason::kNone;
  });
  return signers.empty() ? first : Reason::kNone;
}

}  // namespace

Signers SelectSigners(const TrustSnapshot& trust, const SamlToken& token) {
  const IssuerTrust* const issuer = trust.Find(token.Issuer());
  if (issuer == nullptr) {
    return {};
  }
  try {
    const auto signature = token.GetSignature();
    return issuer->Select(signature->KeyInfo(), signature->SignatureMethod());
  } catch (const Tarnik::Exception&) {
    return {};  // the only certificate that was selected has a key that cannot be used
  }
}

Reason ValidityOf(const Signer& signer, const ClockRules& clock) noexcept {
  if (!clock.HasBegun(signer.notBefore)) {
    return Reason::kSignerNotYetValid;
  }
  return clock.IsAfter(signer.notAfter) ? Reason::kSignerExpired : Reason::kNone;
}

Reason RevocationOf(const Signer& signer, const ClockRules& clock) noexcept {
  if (!signer.isRevocationChecked) {
    return Reason::kNone;
  }
  if (signer.revokedSince) {
    return Reason::kSignerRevoked;
  }
  const bool isCovered = signer.listFrom && signer.listUntil && clock.HasBegun(*signer.listFrom) &&
                         !clock.HasEnded(*signer.listUntil);
  return isCovered ? Reason::kNone : Reason::kRevocationUnknown;
}

Reason KeepValid(Signers& signers, const ClockRules& clock) {
  return KeepPassing(signers, clock, ValidityOf);
}

Reason KeepUnrevoked(Signers& signers, const ClockRules& clock) {
  return KeepPassing(signers, clock, RevocationOf);
}

void KeepTried(Signers& signers) {
  signers.resize(std::min(signers.size(), kMostTried));
}

}  // namespace SsoClient::Access
