#ifndef SSOCLIENT_ACCESS_GATE_TOKEN_PRESENTATION_H
#define SSOCLIENT_ACCESS_GATE_TOKEN_PRESENTATION_H

#include <memory>
#include <optional>
#include <string>

#include <ssoclient/access/presenter.h>

#include "gate/checked_tokens.h"
#include "gate/clock_rules.h"
#include "gate/trust_checks.h"
#include "gate/verdict_facts.h"
#include "trust/trust_store_impl.h"

namespace SsoClient::Access {

/// One token that is presented and checked. The other arguments outlive it.
class TokenPresentation {
 public:
  TokenPresentation(const std::shared_ptr<const GateConfig>& config, const TrustStoreImpl& trust,
                    CheckedTokens& remembered, const Tarnik::System::DateTime& now);

  /// Called once.
  std::shared_ptr<const VerdictFacts> Check(const std::string& text, const Presenter& presenter);
  /// Whether the check has read the token.
  bool HasRead() const noexcept { return hasRead_; }

 private:
  using Key = std::optional<CheckedTokens::Key>;

  CheckResult CheckAll(const std::string& text, const Presenter& presenter);
  /// The token if it is remembered, the trust is unchanged and its signer may still sign.
  std::shared_ptr<const CheckedToken> Recall(const Key& key);
  CheckResult Read(const std::string& text);
  CheckResult CheckTrust(const Key& key);

  std::shared_ptr<const GateConfig> config_;
  const TrustStoreImpl& trust_;
  CheckedTokens& remembered_;
  ClockRules clock_;
  std::shared_ptr<VerdictFacts> facts_;
  /// The token, if it was read here.
  std::shared_ptr<CheckedToken> read_;
  bool hasRead_ = false;
};

}  // namespace SsoClient::Access

#endif
