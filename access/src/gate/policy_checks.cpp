#include "gate/policy_checks.h"

#include <algorithm>
#include <chrono>
#include <cstddef>
#include <exception>

#include <cxxabi.h>

#include <tarnik/core/exception.h>
#include <tarnik/crypto/certificate.h>
#include <tarnik/crypto/data_signature.h>
#include <tarnik/text/display_text.h>

#include "secret_text.h"

namespace SsoClient::Access {

namespace {

constexpr std::size_t kMaxProofFailure = 300;

// A presentation of a token.
struct Presentation {
  const GateConfig& config;
  const CheckedToken& checked;
  const SamlToken& token;
  const Presenter& presenter;
  std::string& detail;

  bool IsBearer() const { return token.ConfirmationType() == BEARER; }
};

Reason CheckAudience(const Presentation& presented) {
  if (!presented.checked.traits.isRestricted) {
    return presented.config.acceptsUnrestrictedTokens ? Reason::kNone : Reason::kUnrestricted;
  }
  return presented.checked.traits.audience != nullptr ? Reason::kNone : Reason::kWrongAudience;
}

Reason CheckConfirmation(const Presentation& presented) {
  const bool isWelcome =
      !presented.IsBearer() || presented.config.bearerTokens == BearerTokens::kAccept;
  return isWelcome ? Reason::kNone : Reason::kBearerRefused;
}

bool ProvesBySignature(const Presenter& presenter, const Tarnik::Crypto::Certificate& holder,
                       std::string& detail) {
  // Nobody has chosen empty data for this exchange.
  if (presenter.Data().empty()) {
    detail = "the data is empty";
    return false;
  }
  const bool isVerified = Tarnik::Crypto::VerifyData(holder, presenter.Algorithm(),
                                                     presenter.Data(), presenter.Signature());
  if (!isVerified) {
    detail = presenter.Signature().empty() ? "the signature is empty"
                                           : "it does not verify with that key";
  }
  return isVerified;
}

bool Proves(const Presenter& presenter, const Tarnik::Crypto::Certificate& holder,
            std::string& detail) {
  if (presenter.GetKind() == Presenter::Kind::kTlsCertificate) {
    return Tarnik::Crypto::IsSameCertificate(*presenter.Certificate(), holder);
  }
  return presenter.GetKind() == Presenter::Kind::kSignature &&
         ProvesBySignature(presenter, holder, detail);
}

Reason CheckPossession(const Presentation& presented) {
  if (presented.IsBearer()) {
    return Reason::kNone;
  }
  if (presented.presenter.GetKind() == Presenter::Kind::kNobody) {
    return Reason::kNoProof;
  }
  try {
    const auto holder = presented.token.HolderOfKeyCertificate();
    const bool isProved =
        holder != nullptr && Proves(presented.presenter, *holder, presented.detail);
    return isProved ? Reason::kNone : Reason::kWrongProof;
  } catch (const Tarnik::Exception& e) {
    presented.detail = Tarnik::ToDisplayText(e.Message(), kMaxProofFailure);
    return Reason::kWrongProof;
  }
}

Reason CheckLifetime(const Presentation& presented) {
  // Both are in the range of `DateTime`, so that their difference does not overflow.
  const std::chrono::microseconds lifetime(presented.token.ExpirationTime().GetUtcTime() -
                                           presented.token.StartTime().GetUtcTime());
  return lifetime <= presented.config.longestLifetime ? Reason::kNone : Reason::kTooLongLived;
}

Reason CheckDelegation(const Presentation& presented) {
  return presented.checked.traits.delegates <= presented.config.deepestDelegation
             ? Reason::kNone
             : Reason::kTooDeeplyDelegated;
}

Reason CheckGroups(const Presentation& presented) {
  return presented.config.allowedGroups.empty() || presented.checked.traits.group != nullptr
             ? Reason::kNone
             : Reason::kNotInGroup;
}

Reason CallPredicate(const Presentation& presented) {
  std::string why;
  if (presented.config.predicate(presented.token, why)) {
    return Reason::kNone;
  }
  presented.detail = ToRecordText(why);
  return Reason::kRefusedByPredicate;
}

Reason CheckPredicate(const Presentation& presented) {
  if (!presented.config.predicate) {
    return Reason::kNone;
  }
  try {
    return CallPredicate(presented);
  } catch (const std::exception& e) {
    const char* const what = e.what();
    presented.detail = ToRecordText(what != nullptr ? what : "");
  } catch (const abi::__forced_unwind&) {
    throw;  // the thread is being cancelled
  } catch (...) {
    presented.detail = "one that is not a std::exception";
  }
  return Reason::kPredicateFailed;
}

struct PolicyCheck {
  CheckKind kind;
  Reason (*check)(const Presentation&);
};

constexpr PolicyCheck kPolicyChecks[] = {
    {CheckKind::kAudience, CheckAudience},     {CheckKind::kConfirmation, CheckConfirmation},
    {CheckKind::kPossession, CheckPossession}, {CheckKind::kLifetime, CheckLifetime},
    {CheckKind::kDelegation, CheckDelegation}, {CheckKind::kGroups, CheckGroups},
    {CheckKind::kPredicate, CheckPredicate},
};

}  // namespace

CheckResult CheckPolicy(const CheckedToken& checked, const Presenter& presenter,
                        std::string& detail) {
  const Presentation presented{*checked.config, checked, *checked.token, presenter, detail};
  for (const PolicyCheck& policy : kPolicyChecks) {
    if (const Reason reason = policy.check(presented); reason != Reason::kNone) {
      return {policy.kind, reason};
    }
  }
  return {CheckKind::kPredicate, Reason::kNone};
}

}  // namespace SsoClient::Access
