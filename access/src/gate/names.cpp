#include <ssoclient/access/verdict.h>

namespace SsoClient::Access {

const char* NameOf(CheckKind check) noexcept {
  switch (check) {
    case CheckKind::kSize:
      return "size";
    case CheckKind::kWellFormed:
      return "well-formed";
    case CheckKind::kLayout:
      return "layout";
    case CheckKind::kValidity:
      return "validity";
    case CheckKind::kSignerKnown:
      return "signer-known";
    case CheckKind::kSignerValid:
      return "signer-valid";
    case CheckKind::kSignerRevoked:
      return "signer-revoked";
    case CheckKind::kSignature:
      return "signature";
    case CheckKind::kAudience:
      return "audience";
    case CheckKind::kConfirmation:
      return "confirmation";
    case CheckKind::kPossession:
      return "possession";
    case CheckKind::kLifetime:
      return "lifetime";
    case CheckKind::kDelegation:
      return "delegation";
    case CheckKind::kGroups:
      return "groups";
    case CheckKind::kPredicate:
      return "predicate";
  }
  return "unknown";
}

const char* NameOf(CheckOutcome outcome) noexcept {
  switch (outcome) {
    case CheckOutcome::kPassed:
      return "passed";
    case CheckOutcome::kFailed:
      return "failed";
    case CheckOutcome::kNotReached:
      return "not-reached";
  }
  return "unknown";
}

const char* NameOf(Reason reason) noexcept {
  switch (reason) {
    case Reason::kNone:
      return "none";
    case Reason::kTooLarge:
      return "too-large";
    case Reason::kNotWellFormed:
      return "not-well-formed";
    case Reason::kBadLayout:
      return "bad-layout";
    case Reason::kNotYetValid:
      return "not-yet-valid";
    case Reason::kExpired:
      return "expired";
    case Reason::kUnknownIssuer:
      return "unknown-issuer";
    case Reason::kUnknownSigner:
      return "unknown-signer";
    case Reason::kSignerNotYetValid:
      return "signer-not-yet-valid";
    case Reason::kSignerExpired:
      return "signer-expired";
    case Reason::kSignerRevoked:
      return "signer-revoked";
    case Reason::kRevocationUnknown:
      return "revocation-unknown";
    case Reason::kBadSignature:
      return "bad-signature";
    case Reason::kWrongAudience:
      return "wrong-audience";
    case Reason::kUnrestricted:
      return "unrestricted";
    case Reason::kBearerRefused:
      return "bearer-refused";
    case Reason::kNoProof:
      return "no-proof";
    case Reason::kWrongProof:
      return "wrong-proof";
    case Reason::kTooLongLived:
      return "too-long-lived";
    case Reason::kTooDeeplyDelegated:
      return "too-deeply-delegated";
    case Reason::kNotInGroup:
      return "not-in-group";
    case Reason::kRefusedByPredicate:
      return "refused-by-predicate";
    case Reason::kPredicateFailed:
      return "predicate-failed";
  }
  return "unknown";
}

Remedy RemedyOf(Reason reason) noexcept {
  switch (reason) {
    case Reason::kNone:
      return Remedy::kNone;
    case Reason::kNotInGroup:
    case Reason::kRefusedByPredicate:
      return Remedy::kAccess;
    case Reason::kRevocationUnknown:
    case Reason::kPredicateFailed:
      return Remedy::kService;
    default:
      return Remedy::kNewToken;
  }
}

}  // namespace SsoClient::Access
