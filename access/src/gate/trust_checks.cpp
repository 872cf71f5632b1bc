#include "gate/trust_checks.h"

#include <cstddef>

#include <tarnik/core/exception.h>
#include <tarnik/text/display_text.h>

namespace SsoClient::Access {

namespace {

constexpr std::size_t kMaxFailure = 300;

bool IsMadeBy(const Signer& signer, const Tarnik::Xml::Security::Signature& signature,
              std::string& detail) {
  try {
    if (signature.Verify(signer.resolver.get())) {
      return true;
    }
    detail = "the signature or a digest has another value";
  } catch (const Tarnik::Exception& e) {
    detail = Tarnik::ToDisplayText(e.Message(), kMaxFailure);
  }
  return false;
}

Reason CheckSignature(CheckedToken& checked, const Signers& signers, std::string& detail) {
  const auto signature = checked.token->GetSignature();
  for (const Signer* signer : signers) {
    if (IsMadeBy(*signer, *signature, detail)) {
      checked.signer = signer;
      detail.clear();
      return Reason::kNone;
    }
  }
  return Reason::kBadSignature;
}

Reason CheckSignerKnown(const CheckedToken& checked, Signers& signers) {
  if (checked.trust->Find(checked.token->Issuer()) == nullptr) {
    return Reason::kUnknownIssuer;
  }
  signers = SelectSigners(*checked.trust, *checked.token);
  return signers.empty() ? Reason::kUnknownSigner : Reason::kNone;
}

}  // namespace

Reason CheckValidity(const CheckedToken& checked, const ClockRules& clock) {
  const SamlToken& token = *checked.token;
  if (!clock.HasBegun(token.StartTime())) {
    return Reason::kNotYetValid;
  }
  const bool hasEnded =
      clock.HasEnded(token.ExpirationTime()) || clock.HasEnded(checked.traits.confirmationEnd);
  return hasEnded ? Reason::kExpired : Reason::kNone;
}

CheckResult CheckSigner(CheckedToken& checked, const ClockRules& clock, std::string& detail) {
  Signers signers;
  if (const Reason reason = CheckSignerKnown(checked, signers); reason != Reason::kNone) {
    return {CheckKind::kSignerKnown, reason};
  }
  if (const Reason reason = KeepValid(signers, clock); reason != Reason::kNone) {
    return {CheckKind::kSignerValid, reason};
  }
  if (const Reason reason = KeepUnrevoked(signers, clock); reason != Reason::kNone) {
    return {CheckKind::kSignerRevoked, reason};
  }
  KeepTried(signers);
  return {CheckKind::kSignature, CheckSignature(checked, signers, detail)};
}

CheckResult CheckSignerAgain(const Signer& signer, const ClockRules& clock) noexcept {
  if (const Reason reason = ValidityOf(signer, clock); reason != Reason::kNone) {
    return {CheckKind::kSignerValid, reason};
  }
  return {CheckKind::kSignerRevoked, RevocationOf(signer, clock)};
}

}  // namespace SsoClient::Access
