#include "gate/ledger_texts.h"

#include "gate/shown_text.h"
#include "secret_text.h"

namespace SsoClient::Access {

namespace {

std::string SizeText(const VerdictFacts& facts) {
  return std::to_string(facts.length) + " bytes, at most " +
         std::to_string(facts.Config()->largestToken);
}

std::string WellFormedText(const VerdictFacts& facts) {
  return facts.checked != nullptr || facts.reason == Reason::kBadLayout
             ? "XML that the parser accepts"
             : facts.detail;
}

std::string LayoutText(const VerdictFacts& facts) {
  if (facts.checked == nullptr) {
    return facts.detail;
  }
  const SamlToken& token = *facts.checked->token;
  return "assertion " + ShownText(token.Id()) + " of " + ShownText(token.Issuer()) + " about " +
         ShownName(token.Subject());
}

std::string WholeText(const VerdictFacts& facts, CheckKind check) {
  switch (check) {
    case CheckKind::kSize:
      return SizeText(facts);
    case CheckKind::kWellFormed:
      return WellFormedText(facts);
    case CheckKind::kLayout:
      return LayoutText(facts);
    case CheckKind::kValidity:
      return ValidityText(facts);
    case CheckKind::kSignerKnown:
      return SignerKnownText(facts);
    case CheckKind::kSignerValid:
      return SignerValidText(facts);
    case CheckKind::kSignerRevoked:
      return SignerRevokedText(facts);
    case CheckKind::kSignature:
      return SignatureText(facts);
    case CheckKind::kAudience:
      return AudienceText(facts);
    case CheckKind::kConfirmation:
      return ConfirmationText(facts);
    case CheckKind::kPossession:
      return PossessionText(facts);
    case CheckKind::kLifetime:
      return LifetimeText(facts);
    case CheckKind::kDelegation:
      return DelegationText(facts);
    case CheckKind::kGroups:
      return GroupsText(facts);
    case CheckKind::kPredicate:
      return PredicateText(facts);
  }
  return {};
}

const char* SentenceOf(Reason reason) noexcept {
  switch (reason) {
    case Reason::kNone:
      return "";
    case Reason::kTooLarge:
      return "The token is too large";
    case Reason::kNotWellFormed:
      return "The token is not well-formed XML";
    case Reason::kBadLayout:
      return "The token does not have the accepted structure";
    case Reason::kNotYetValid:
      return "The token is not valid yet";
    case Reason::kExpired:
      return "The token has expired";
    case Reason::kUnknownIssuer:
      return "Nobody is trusted to sign tokens of this issuer";
    case Reason::kUnknownSigner:
      return "The token names no certificate that is trusted for its issuer";
    case Reason::kSignerNotYetValid:
      return "The certificate of the token's signer is not valid yet";
    case Reason::kSignerExpired:
      return "The certificate of the token's signer has expired";
    case Reason::kSignerRevoked:
      return "The certificate of the token's signer is revoked";
    case Reason::kRevocationUnknown:
      return "No current revocation list covers the certificate of the token's signer";
    case Reason::kBadSignature:
      return "The token's signature does not verify";
    case Reason::kWrongAudience:
      return "The token is restricted to other audiences";
    case Reason::kUnrestricted:
      return "The token is not restricted to audiences";
    case Reason::kBearerRefused:
      return "The token is a bearer token, which this service refuses";
    case Reason::kNoProof:
      return "The presenter has given no proof of possession of the token's key";
    case Reason::kWrongProof:
      return "The presenter has not proved possession of the token's key";
    case Reason::kTooLongLived:
      return "The token is valid for too long";
    case Reason::kTooDeeplyDelegated:
      return "The token was delegated too often";
    case Reason::kNotInGroup:
      return "The token's subject is in none of the allowed groups";
    case Reason::kRefusedByPredicate:
      return "The service's own rule refuses the token";
    case Reason::kPredicateFailed:
      return "The service's own rule threw an exception";
  }
  return "The token is refused";
}

// What follows the sentence: the ledger's text, unless it says the same again.
std::string EndOfMessage(const VerdictFacts& facts) {
  switch (facts.reason) {
    case Reason::kUnknownIssuer:
      return ": " + OtherIssuersText(facts);
    case Reason::kWrongAudience:
      return ": " + OtherAudiencesText(facts);
    case Reason::kUnrestricted:
      return "; " + OwnAudiencesText(facts);
    case Reason::kPredicateFailed:
      return facts.detail.empty() ? std::string() : ": " + facts.detail;
    case Reason::kBearerRefused:
    case Reason::kRefusedByPredicate:
      return {};
    default:
      return ": " + WholeText(facts, facts.failed);
  }
}

}  // namespace

std::string ComparedText(const VerdictFacts& facts, CheckKind check) {
  return ToRecordText(WholeText(facts, check));
}

std::string MessageText(const VerdictFacts& facts) {
  if (facts.reason == Reason::kNone) {
    return {};
  }
  if (facts.reason == Reason::kRefusedByPredicate && !facts.detail.empty()) {
    return ToRecordText(facts.detail);
  }
  const std::string text = SentenceOf(facts.reason) + EndOfMessage(facts);
  // Messages of the platform are sentences themselves.
  return ToRecordText(text.back() == '.' ? text : text + ".");
}

}  // namespace SsoClient::Access
