#ifndef SSOCLIENT_ACCESS_VERDICT_H
#define SSOCLIENT_ACCESS_VERDICT_H

#include <memory>
#include <string>
#include <vector>

#include <ssoclient/access/export.h>
#include <ssoclient/saml_token.h>

namespace SsoClient::Access {

/// The checks of a token, in the order in which they are made. Later versions may add some.
enum class CheckKind {
  kSize,           ///< the length of the text
  kWellFormed,     ///< XML, as `Tarnik::Xml::XMLParser` accepts it
  kLayout,         ///< one assertion of the accepted structure (`CreateSamlToken`)
  kValidity,       ///< NotBefore and NotOnOrAfter of its Conditions, and NotOnOrAfter of its
                   ///< SubjectConfirmationData
  kSignerKnown,    ///< its KeyInfo names a certificate that is trusted for its issuer
  kSignerValid,    ///< the validity of that certificate
  kSignerRevoked,  ///< that certificate is not revoked
  kSignature,      ///< made with the key of that certificate, and covers the assertion
  kAudience,       ///< its audiences
  kConfirmation,   ///< bearer or holder-of-key
  kPossession,     ///< the presenter's proof that it has the key of a holder-of-key token
  kLifetime,       ///< the length of its validity
  kDelegation,     ///< the length of its delegation chain
  kGroups,         ///< the groups of its subject
  kPredicate,      ///< `GateConfig::predicate`
};

/// The result of a check.
enum class CheckOutcome {
  kPassed,      ///< the token fulfils the rule
  kFailed,      ///< it does not, which decides the verdict
  kNotReached,  ///< an earlier check has failed
};

/// Why a token was refused, for programs. Later versions may add some.
enum class Reason {
  kNone,                ///< it was not refused
  kTooLarge,            ///< its text is longer than `GateConfig::largestToken`
  kNotWellFormed,       ///< its text is not XML that is accepted
  kBadLayout,           ///< it is not an assertion of the accepted structure
  kNotYetValid,         ///< NotBefore is in the future
  kExpired,             ///< NotOnOrAfter has passed
  kUnknownIssuer,       ///< nobody is trusted to sign tokens of its issuer
  kUnknownSigner,       ///< it names no certificate that is trusted for its issuer
  kSignerNotYetValid,   ///< the validity of its signer's certificate has not begun
  kSignerExpired,       ///< the validity of its signer's certificate has ended
  kSignerRevoked,       ///< its signer's certificate is on a revocation list
  kRevocationUnknown,   ///< no current list covers its signer's certificate, but one must
  kBadSignature,        ///< its signature does not verify with its signer's key
  kWrongAudience,       ///< it is restricted to other audiences
  kUnrestricted,        ///< it is not restricted to audiences, but must be
  kBearerRefused,       ///< it is a bearer token, which the gate refuses
  kNoProof,             ///< its key was not proved, since the presenter is `Presenter::Nobody`
  kWrongProof,          ///< the presenter proved another key, or nothing
  kTooLongLived,        ///< its lifetime is longer than `GateConfig::longestLifetime`
  kTooDeeplyDelegated,  ///< it has more delegates than `GateConfig::deepestDelegation`
  kNotInGroup,          ///< its subject is in none of `GateConfig::allowedGroups`
  kRefusedByPredicate,  ///< `GateConfig::predicate` returned false
  kPredicateFailed,     ///< `GateConfig::predicate` threw
};

/// Who can do something about a refusal.
enum class Remedy {
  kNone,      ///< nobody has to: it was accepted
  kNewToken,  ///< the caller, with another token, or with the proof that it left out (HTTP 401)
  kAccess,    ///< whoever grants access: another token of the subject will not help (HTTP 403)
  kService,   ///< the operator of this service; the token may be good (HTTP 503)
};

/// `kService` for `kRevocationUnknown` and `kPredicateFailed`, `kAccess` for `kNotInGroup` and
/// `kRefusedByPredicate`, and `kNewToken` for all other refusals.
SSOCLIENT_ACCESS_EXPORT Remedy RemedyOf(Reason reason) noexcept;

/// The names in lower case with hyphens, such as "signer-known" and "wrong-audience"; valid for the
/// lifetime of the process.
SSOCLIENT_ACCESS_EXPORT const char* NameOf(CheckKind check) noexcept;
/// The same for outcomes, such as "not-reached".
SSOCLIENT_ACCESS_EXPORT const char* NameOf(CheckOutcome outcome) noexcept;
/// The same for reasons.
SSOCLIENT_ACCESS_EXPORT const char* NameOf(Reason reason) noexcept;

/// A line of the ledger.
struct CheckRecord {
  CheckKind check = CheckKind::kSize;                ///< which check
  CheckOutcome outcome = CheckOutcome::kNotReached;  ///< its result
  /// What was compared with what, without control characters, and at most 1000 bytes long; empty
  /// when the check was not reached. Names people and certificates, but contains neither the text
  /// of the token nor a signature. Before the signature has been verified, it is what the token
  /// claims.
  std::string compared{};
};

struct VerdictFacts;

/// What a gate has decided about a token. A value, whose copies share their content; thread-safe as
/// one. References that it returns are valid as long as any copy. One that was moved from may only
/// be assigned to and destroyed.
class [[nodiscard]] Verdict {
 public:
  /// True when every check has passed.
  SSOCLIENT_ACCESS_EXPORT bool IsAccepted() const noexcept;
  /// The accepted token; null when it was refused. Its `ExpirationTimeWithTolerance` has the
  /// tolerance of the gate (`GateConfig::clockTolerance`).
  SSOCLIENT_ACCESS_EXPORT const std::shared_ptr<const SamlToken>& Token() const noexcept;
  /// `Reason::kNone` for an accepted token.
  SSOCLIENT_ACCESS_EXPORT Reason Refusal() const noexcept;
  /// Why the token was refused, in one line for people, with the rules of `CheckRecord::compared`,
  /// and without the name of the reason; empty for an accepted token. It says which audiences and
  /// signers this service knows: for its log, not for its answer to the presenter.
  SSOCLIENT_ACCESS_EXPORT const std::string& Message() const noexcept;
  /// A record for each `CheckKind`, in order. The texts are made by this call.
  SSOCLIENT_ACCESS_EXPORT std::vector<CheckRecord> Ledger() const;
  /// The verdict as a text of several lines for people, which ends in a line feed: first the
  /// decision, with the name of the reason and the message of a refusal, and then the ledger.
  SSOCLIENT_ACCESS_EXPORT std::string ToString() const;

  /// Verdicts for implementations of `TokenGate` of a program's own. In their ledgers, all checks
  /// have passed, or none has been reached, and `compared` is empty. Throw
  /// `Tarnik::InvalidArgumentException` for null and for `Reason::kNone`.
  SSOCLIENT_ACCESS_EXPORT static Verdict Accept(std::shared_ptr<const SamlToken> token);
  /// The same for a refusal.
  SSOCLIENT_ACCESS_EXPORT static Verdict Refuse(Reason reason, const std::string& message);

  /// For the library.
  SSOCLIENT_ACCESS_EXPORT explicit Verdict(std::shared_ptr<const VerdictFacts> facts) noexcept;

 private:
  std::shared_ptr<const VerdictFacts> facts_;
};

}  // namespace SsoClient::Access

#endif
