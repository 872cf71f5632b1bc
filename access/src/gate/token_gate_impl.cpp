#include "gate/token_gate_impl.h"

#include <utility>

#include "gate/gate_config_check.h"
#include "gate/token_presentation.h"

namespace SsoClient::Access {

TokenGate::~TokenGate() = default;

TokenGateImpl::TokenGateImpl(GateConfig config)
    : config_(std::make_shared<const GateConfig>(std::move(config))),
      trust_(std::dynamic_pointer_cast<const TrustStoreImpl>(config_->trust)) {
  Current();
}

TokenGateImpl::Process& TokenGateImpl::Current() const {
  return process_.Get([this] { return Process(config_->cache); });
}

Tarnik::System::DateTime TokenGateImpl::Now() const {
  return config_->clock ? config_->clock() : Tarnik::System::GetUtcDateTime();
}

Verdict TokenGateImpl::Check(const std::string& token, const Presenter& presenter) const {
  Process& process = Current();
  TokenPresentation presentation(config_, *trust_, process.tokens, Now());
  std::shared_ptr<const VerdictFacts> facts = presentation.Check(token, presenter);
  if (presentation.HasRead()) {
    process.counters.CountMiss();
  }
  if (facts->isRemembered) {
    process.counters.CountHit();
  }
  process.counters.CountVerdict(facts->reason);
  return Verdict(std::move(facts));
}

GateMetrics TokenGateImpl::Metrics() const {
  const Process& process = Current();
  GateMetrics metrics;
  process.counters.AddTo(metrics);
  process.tokens.AddTo(metrics);
  return metrics;
}

std::shared_ptr<TokenGate> CreateTokenGate(GateConfig config) {
  CheckGateConfig(config);
  LimitGateDurations(config);
  return std::make_shared<TokenGateImpl>(std::move(config));
}

}  // namespace SsoClient::Access
