#include "gate/claimed_signer.h"
#include "gate/clock_rules.h"
#include "gate/ledger_texts.h"
#include "gate/shown_text.h"
#include "gate/signer_rules.h"

namespace SsoClient::Access {

namespace {

ClockRules ClockOf(const VerdictFacts& facts) {
  return {facts.now, facts.Config()->clockTolerance};
}

// "from ... to ..., now ..., tolerance ..."
std::string PeriodText(const VerdictFacts& facts, const Tarnik::System::DateTime& start,
                       const Tarnik::System::DateTime& end) {
  return "from " + start.ToString() + " to " + end.ToString() + ", now " + facts.now.ToString() +
         ", tolerance " + ShownDuration(facts.Config()->clockTolerance);
}

// The signer that has signed, or those that the check has looked at.
Signers SignersOf(const VerdictFacts& facts, CheckKind check) {
  const CheckedToken& checked = *facts.checked;
  if (checked.signer != nullptr) {
    return {checked.signer};
  }
  Signers signers = SelectSigners(*checked.trust, *checked.token);
  if (check > CheckKind::kSignerValid) {
    KeepValid(signers, ClockOf(facts));
  }
  if (check > CheckKind::kSignerRevoked) {
    KeepUnrevoked(signers, ClockOf(facts));
    KeepTried(signers);
  }
  return signers;
}

std::string NamesOf(const Signers& signers) {
  return ShownList(signers, [](const Signer* signer) { return signer->name; });
}

std::string RevocationText(const VerdictFacts& facts, const Signer& signer) {
  if (!signer.isRevocationChecked) {
    return signer.name + ": revocation is not checked";
  }
  if (signer.revokedSince) {
    return signer.name + ": revoked since " + signer.revokedSince->ToString();
  }
  if (!signer.listFrom || !signer.listUntil) {
    return signer.name + ": covered by no list";
  }
  return signer.name + ": not on the list " +
         PeriodText(facts, *signer.listFrom, *signer.listUntil);
}

}  // namespace

std::string ValidityText(const VerdictFacts& facts) {
  const SamlToken& token = *facts.checked->token;
  const std::string period = PeriodText(facts, token.StartTime(), token.ExpirationTime());
  const auto& end = facts.checked->traits.confirmationEnd;
  return end < token.ExpirationTime()
             ? period + "; its subject can be confirmed until " + end.ToString()
             : period;
}

std::string OtherIssuersText(const VerdictFacts& facts) {
  const std::string issuers = ShownList(facts.checked->trust->Issuers(), ShownText);
  return ShownText(facts.checked->token->Issuer()) +
         (issuers.empty() ? "; no signer is trusted" : "; signers are trusted for " + issuers);
}

std::string SignerKnownText(const VerdictFacts& facts) {
  const CheckedToken& checked = *facts.checked;
  const std::string& name = checked.token->Issuer();
  const IssuerTrust* const issuer = checked.trust->Find(name);
  if (issuer == nullptr) {
    return "issuer " + OtherIssuersText(facts);
  }
  const Signers signers = SelectSigners(*checked.trust, *checked.token);
  return "issuer " + ShownText(name) + "; of " + std::to_string(issuer->signers.size()) +
         " that may sign for it, the token may mean " +
         (signers.empty()
              ? "none; it names " + ClaimedSigner(checked.token->GetSignature()->KeyInfo())
              : NamesOf(signers));
}

std::string SignerValidText(const VerdictFacts& facts) {
  return ShownList(SignersOf(facts, CheckKind::kSignerValid), [&](const Signer* signer) {
    return signer->name + " " + PeriodText(facts, signer->notBefore, signer->notAfter);
  });
}

std::string SignerRevokedText(const VerdictFacts& facts) {
  return ShownList(SignersOf(facts, CheckKind::kSignerRevoked),
                   [&](const Signer* signer) { return RevocationText(facts, *signer); });
}

std::string SignatureText(const VerdictFacts& facts) {
  const CheckedToken& checked = *facts.checked;
  const std::string method = ShownText(checked.token->GetSignature()->SignatureMethod());
  const std::string names = NamesOf(SignersOf(facts, CheckKind::kSignature));
  if (checked.signer == nullptr) {
    return method + " with the key of " + names + ": " + facts.detail;
  }
  return method + " with the key of " + names +
         (facts.isRemembered ? ", verified at " + checked.readAt.ToString() : std::string());
}

}  // namespace SsoClient::Access
