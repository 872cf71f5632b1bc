#include "gate/gate_model.h"

#include <algorithm>
#include <set>
#include <vector>

namespace Fuzz {
namespace {

using SsoClient::Access::Reason;

constexpr long kMicrosecondsPerSecond = 1'000'000;

bool HasSameKey(std::size_t a, std::size_t b) {
  return a == b || (a >= kFirstRsaSigner && b >= kFirstRsaSigner);
}

// By the rules of the resolver of trusted certificates.
bool IsNamed(const TrustedCase& trusted, const GateToken& token, std::size_t trustedCount) {
  switch (token.keyInfo) {
    case DevSts::KeyInfoContent::X509Data:
      return trusted.signer == token.signer;
    case DevSts::KeyInfoContent::KeyValue:
      return trustedCount == 1 || HasSameKey(trusted.signer, token.signer);
    case DevSts::KeyInfoContent::None:
      return true;
  }
  return false;
}

Reason ValidityOf(const TrustedCase& trusted, const Presented& now) {
  const long tolerance = now.config.clockTolerance.count();
  if (now.seconds < trusted.notBefore - tolerance) {
    return Reason::kSignerNotYetValid;
  }
  return now.seconds > trusted.notAfter + tolerance ? Reason::kSignerExpired : Reason::kNone;
}

Reason RevocationOf(const TrustedCase& trusted, const Presented& now) {
  const long tolerance = now.config.clockTolerance.count();
  if (!trusted.isChecked) {
    return Reason::kNone;
  }
  if (trusted.isRevoked) {
    return Reason::kSignerRevoked;
  }
  const bool isCurrent = trusted.isCovered && now.seconds >= trusted.listFrom - tolerance &&
                         now.seconds < trusted.listUntil + tolerance;
  return isCurrent ? Reason::kNone : Reason::kRevocationUnknown;
}

using Candidates = std::vector<const TrustedCase*>;

// Those that pass a rule; the reason of the first that does not if none is left.
template <class Rule>
Reason Keep(Candidates& candidates, const Presented& now, Rule rule) {
  Candidates kept;
  for (const TrustedCase* candidate : candidates) {
    if (rule(*candidate, now) == Reason::kNone) {
      kept.push_back(candidate);
    }
  }
  if (kept.empty()) {
    return rule(*candidates.front(), now);
  }
  candidates = kept;
  return Reason::kNone;
}

Reason PossessionReason(const Presented& now) {
  switch (now.sender) {
    case Sender::kNobody:
      return Reason::kNoProof;
    case Sender::kHolderByTls:
    case Sender::kHolderBySignature:
      return Reason::kNone;
    case Sender::kOtherByTls:
    case Sender::kOtherBySignature:
    case Sender::kSignerOfOtherData:
      return Reason::kWrongProof;
  }
  return Reason::kWrongProof;
}

Reason AudienceReason(const Presented& now, const SsoClient::SamlToken& token) {
  std::set<std::string> audiences;
  token.GetAudiences(audiences);
  if (audiences.empty()) {
    return now.config.acceptsUnrestrictedTokens ? Reason::kNone : Reason::kUnrestricted;
  }
  const bool isOurs =
      std::any_of(now.config.audiences.begin(), now.config.audiences.end(),
                  [&](const std::string& audience) { return audiences.count(audience) != 0; });
  return isOurs ? Reason::kNone : Reason::kWrongAudience;
}

Reason PredicateReason(PredicateCase predicate) {
  switch (predicate) {
    case PredicateCase::kRefuses:
      return Reason::kRefusedByPredicate;
    case PredicateCase::kThrows:
      return Reason::kPredicateFailed;
    default:
      return Reason::kNone;
  }
}

}  // namespace

Reason SignerReason(const Presented& now, const GateToken& token) {
  if (now.trust.empty()) {
    return Reason::kUnknownIssuer;
  }
  Candidates candidates;
  for (const TrustedCase& trusted : now.trust) {
    if (IsNamed(trusted, token, now.trust.size())) {
      candidates.push_back(&trusted);
    }
  }
  if (candidates.empty()) {
    return Reason::kUnknownSigner;
  }
  if (const Reason reason = Keep(candidates, now, ValidityOf); reason != Reason::kNone) {
    return reason;
  }
  if (const Reason reason = Keep(candidates, now, RevocationOf); reason != Reason::kNone) {
    return reason;
  }
  const bool isSigned = std::any_of(
      candidates.begin(), candidates.end(),
      [&](const TrustedCase* candidate) { return HasSameKey(candidate->signer, token.signer); });
  return isSigned ? Reason::kNone : Reason::kBadSignature;
}

Reason PolicyReason(const Presented& now, const SsoClient::SamlToken& token) {
  const bool isBearer = token.ConfirmationType() == SsoClient::BEARER;
  if (const Reason reason = AudienceReason(now, token); reason != Reason::kNone) {
    return reason;
  }
  if (isBearer && now.config.bearerTokens != SsoClient::Access::BearerTokens::kAccept) {
    return Reason::kBearerRefused;
  }
  const Reason possession = isBearer ? Reason::kNone : PossessionReason(now);
  if (possession != Reason::kNone) {
    return possession;
  }
  const long lifetime = token.ExpirationTime().GetUtcTime() - token.StartTime().GetUtcTime();
  if (lifetime > now.config.longestLifetime.count() * kMicrosecondsPerSecond) {
    return Reason::kTooLongLived;
  }
  std::vector<SsoClient::Delegate> chain;
  token.GetDelegationChain(chain);
  if (chain.size() > now.config.deepestDelegation) {
    return Reason::kTooDeeplyDelegated;
  }
  return PredicateReason(now.predicate);
}

Reason ValidityReason(const Presented& now, const SsoClient::SamlToken& token) {
  const long time = AtSecond(now.seconds).GetUtcTime();
  const long tolerance = now.config.clockTolerance.count() * kMicrosecondsPerSecond;
  if (time < token.StartTime().GetUtcTime() - tolerance) {
    return Reason::kNotYetValid;
  }
  return time >= token.ExpirationTime().GetUtcTime() + tolerance ? Reason::kExpired : Reason::kNone;
}

bool AreAllUsable(const Presented& now) {
  return std::all_of(now.trust.begin(), now.trust.end(), [&now](const TrustedCase& trusted) {
    return ValidityOf(trusted, now) == Reason::kNone && RevocationOf(trusted, now) == Reason::kNone;
  });
}

}  // namespace Fuzz
