#include <set>
#include <vector>

#include "gate/ledger_texts.h"
#include "gate/shown_text.h"

namespace SsoClient::Access {

namespace {

const char* NameOfAlgorithm(Tarnik::Crypto::SignatureAlgorithm algorithm) noexcept {
  using Tarnik::Crypto::SignatureAlgorithm;
  switch (algorithm) {
    case SignatureAlgorithm::kRsaPkcs1Sha256:
      return "RSA PKCS#1 with SHA-256";
    case SignatureAlgorithm::kRsaPkcs1Sha384:
      return "RSA PKCS#1 with SHA-384";
    case SignatureAlgorithm::kRsaPkcs1Sha512:
      return "RSA PKCS#1 with SHA-512";
    case SignatureAlgorithm::kRsaPssSha256:
      return "RSA-PSS with SHA-256";
    case SignatureAlgorithm::kRsaPssSha384:
      return "RSA-PSS with SHA-384";
    case SignatureAlgorithm::kRsaPssSha512:
      return "RSA-PSS with SHA-512";
    case SignatureAlgorithm::kEcdsaSha256:
      return "ECDSA with SHA-256";
    case SignatureAlgorithm::kEcdsaSha384:
      return "ECDSA with SHA-384";
    case SignatureAlgorithm::kEcdsaSha512:
      return "ECDSA with SHA-512";
  }
  return "an unknown algorithm";
}

std::string HolderText(const SamlToken& token) {
  const auto holder = token.HolderOfKeyCertificate();
  return holder == nullptr ? std::string("nobody") : ShownCertificate(*holder);
}

std::string ProofText(const PresenterFacts& presenter) {
  switch (presenter.kind) {
    case Presenter::Kind::kNobody:
      return "the presenter proved nothing";
    case Presenter::Kind::kTlsCertificate:
      return "the presenter's TLS certificate is " + ShownCertificate(*presenter.certificate);
    case Presenter::Kind::kSignature:
      return std::string("the presenter's signature is one of ") +
             NameOfAlgorithm(presenter.algorithm) + " over " +
             std::to_string(presenter.dataLength) + " bytes";
  }
  return {};
}

std::string VerifiedText(const PresenterFacts& presenter) {
  return presenter.kind == Presenter::Kind::kSignature ? ", which verifies with that key" : "";
}

std::string Ending(const VerdictFacts& facts) {
  return facts.detail.empty() ? std::string() : ": " + facts.detail;
}

}  // namespace

std::string AudienceText(const VerdictFacts& facts) {
  if (!facts.checked->traits.isRestricted) {
    return "not restricted; " + OwnAudiencesText(facts);
  }
  if (facts.checked->traits.audience != nullptr) {
    return "restricted to " + ShownText(*facts.checked->traits.audience) +
           ", which this service is";
  }
  return "restricted to " + OtherAudiencesText(facts);
}

std::string OwnAudiencesText(const VerdictFacts& facts) {
  return "this service is " + ShownList(facts.Config()->audiences, ShownText);
}

std::string OtherAudiencesText(const VerdictFacts& facts) {
  std::set<std::string> audiences;
  facts.checked->token->GetAudiences(audiences);
  return ShownList(audiences, ShownText) + "; " + OwnAudiencesText(facts);
}

std::string ConfirmationText(const VerdictFacts& facts) {
  if (facts.checked->token->ConfirmationType() != BEARER) {
    return "holder-of-key";
  }
  if (facts.Config()->bearerTokens != BearerTokens::kAccept) {
    return "bearer, which this service refuses";
  }
  return facts.presenter.kind == Presenter::Kind::kNobody
             ? "bearer, which this service accepts"
             : "bearer, which this service accepts from anybody: the presenter's proof was not "
               "compared with anything";
}

std::string PossessionText(const VerdictFacts& facts) {
  const SamlToken& token = *facts.checked->token;
  if (token.ConfirmationType() == BEARER) {
    return "a bearer token has no key";
  }
  const bool hasFailed = facts.reason != Reason::kNone && facts.failed == CheckKind::kPossession;
  return "the token's key is that of " + HolderText(token) + "; " + ProofText(facts.presenter) +
         (hasFailed ? Ending(facts) : VerifiedText(facts.presenter));
}

std::string LifetimeText(const VerdictFacts& facts) {
  const SamlToken& token = *facts.checked->token;
  const std::chrono::microseconds lifetime(token.ExpirationTime().GetUtcTime() -
                                           token.StartTime().GetUtcTime());
  return ShownDuration(std::chrono::ceil<std::chrono::seconds>(lifetime)) + ", at most " +
         ShownDuration(facts.Config()->longestLifetime);
}

std::string DelegationText(const VerdictFacts& facts) {
  std::vector<Delegate> chain;
  facts.checked->token->GetDelegationChain(chain);
  const std::string counts = std::to_string(chain.size()) +
                             (chain.size() == 1 ? " delegate, at most " : " delegates, at most ") +
                             std::to_string(facts.Config()->deepestDelegation);
  return chain.empty() ? counts : counts + ": " + ShownList(chain, [](const Delegate& delegate) {
                                    return ShownName(delegate.delegate);
                                  });
}

std::string GroupsText(const VerdictFacts& facts) {
  const std::vector<PrincipalId>& allowed = facts.Config()->allowedGroups;
  if (allowed.empty()) {
    return "no group is required";
  }
  if (facts.checked->traits.group != nullptr) {
    return "in " + ShownName(*facts.checked->traits.group);
  }
  std::vector<PrincipalId> groups;
  facts.checked->token->GetGroups(groups);
  return "in " + (groups.empty() ? std::string("no group") : ShownList(groups, ShownName)) +
         "; allowed are " + ShownList(allowed, ShownName);
}

std::string PredicateText(const VerdictFacts& facts) {
  if (!facts.Config()->predicate) {
    return "no predicate";
  }
  switch (facts.reason) {
    case Reason::kRefusedByPredicate:
      return facts.detail.empty() ? "refused without a reason" : "refused" + Ending(facts);
    case Reason::kPredicateFailed:
      return "threw an exception" + Ending(facts);
    default:
      return "accepted";
  }
}

}  // namespace SsoClient::Access
