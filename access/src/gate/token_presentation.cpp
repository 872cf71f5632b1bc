#include "gate/token_presentation.h"

#include <utility>

#include <tarnik/core/exception.h>
#include <tarnik/crypto/digest.h>

#include "gate/ledger_texts.h"
#include "gate/policy_checks.h"
#include "gate/token_reader.h"

namespace SsoClient::Access {

namespace {

PresenterFacts FactsOf(const Presenter& presenter) {
  PresenterFacts facts;
  facts.certificate = presenter.Certificate();
  facts.dataLength = presenter.Data().size();
  facts.kind = presenter.GetKind();
  facts.algorithm = presenter.Algorithm();
  return facts;
}

// None if the token can be neither found nor kept.
std::optional<CheckedTokens::Key> KeyOf(const std::string& text, const CheckedTokens& remembered) {
  if (!remembered.IsUsed()) {
    return std::nullopt;
  }
  try {
    return Tarnik::Crypto::Sha256(text);
  } catch (const Tarnik::Exception&) {
    return std::nullopt;
  }
}

}  // namespace

TokenPresentation::TokenPresentation(const std::shared_ptr<const GateConfig>& config,
                                     const TrustStoreImpl& trust, CheckedTokens& remembered,
                                     const Tarnik::System::DateTime& now)
    : config_(config),
      trust_(trust),
      remembered_(remembered),
      clock_(now, config->clockTolerance),
      facts_(std::make_shared<VerdictFacts>()) {
  facts_->now = now;
}

std::shared_ptr<const VerdictFacts> TokenPresentation::Check(const std::string& text,
                                                             const Presenter& presenter) {
  facts_->length = text.size();
  facts_->presenter = FactsOf(presenter);
  const CheckResult result = CheckAll(text, presenter);
  facts_->failed = result.check;
  facts_->reason = result.reason;
  if (facts_->checked == nullptr) {
    facts_->config = config_;
  }
  facts_->message = MessageText(*facts_);
  return facts_;
}

CheckResult TokenPresentation::CheckAll(const std::string& text, const Presenter& presenter) {
  if (text.size() > config_->largestToken) {
    return {CheckKind::kSize, Reason::kTooLarge};
  }
  const Key key = KeyOf(text, remembered_);
  facts_->checked = Recall(key);
  facts_->isRemembered = facts_->checked != nullptr;
  if (!facts_->isRemembered) {
    if (const CheckResult result = Read(text); result.reason != Reason::kNone) {
      return result;
    }
  }
  if (const CheckResult result = CheckTrust(key); result.reason != Reason::kNone) {
    return result;
  }
  const CheckResult result = CheckPolicy(*facts_->checked, presenter, facts_->detail);
  if (result.reason == Reason::kNone && !facts_->isRemembered && key) {
    remembered_.Insert(*key, read_->trust->Version(), facts_->checked, MemoryOf(text));
  }
  return result;
}

std::shared_ptr<const CheckedToken> TokenPresentation::Recall(const Key& key) {
  if (!key) {
    return nullptr;
  }
  std::shared_ptr<const CheckedToken> known = remembered_.Find(*key, trust_.Version());
  if (known == nullptr || CheckSignerAgain(*known->signer, clock_).reason == Reason::kNone) {
    return known;
  }
  // Another signer with the same key may be valid: the token is read again.
  remembered_.Remove(*key, *known);
  return nullptr;
}

CheckResult TokenPresentation::Read(const std::string& text) {
  hasRead_ = true;
  ReadFailure failure;
  read_ = ReadToken(text, config_, facts_->now, failure);
  if (read_ == nullptr) {
    facts_->detail = std::move(failure.detail);
    const bool isXml = failure.reason == Reason::kBadLayout;
    return {isXml ? CheckKind::kLayout : CheckKind::kWellFormed, failure.reason};
  }
  read_->trust = trust_.Current();
  facts_->checked = read_;
  return {CheckKind::kLayout, Reason::kNone};
}

CheckResult TokenPresentation::CheckTrust(const Key& key) {
  const CheckedToken& checked = *facts_->checked;
  if (const Reason reason = CheckValidity(checked, clock_); reason != Reason::kNone) {
    if (key && facts_->isRemembered && reason == Reason::kExpired) {
      remembered_.Remove(*key, checked);
    }
    return {CheckKind::kValidity, reason};
  }
  if (facts_->isRemembered) {
    return {CheckKind::kSignature, Reason::kNone};  // `Recall` has checked the signer
  }
  return CheckSigner(*read_, clock_, facts_->detail);
}

}  // namespace SsoClient::Access
