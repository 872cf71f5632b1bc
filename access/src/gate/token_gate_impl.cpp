#include "gate/token_gate_impl.h"

#include <memory>
#include <utility>

#include "gate/checked_tokens.h"
#include "gate/gate_config_check.h"
#include "gate/gate_counters.h"
#include "gate/token_presentation.h"
#include "process_hooks.h"

namespace SsoClient::Access {

struct TokenGateImpl::Process {
  Process(std::uint64_t ownGeneration, const GateCacheConfig& cache)
      : generation(ownGeneration), tokens(cache) {}

  GateCounters counters;
  std::uint64_t generation;
  CheckedTokens tokens;
};

TokenGate::~TokenGate() = default;

TokenGateImpl::TokenGateImpl(GateConfig config)
    : config_(std::make_shared<const GateConfig>(std::move(config))),
      trust_(std::dynamic_pointer_cast<const TrustStoreImpl>(config_->trust)),
      process_(new Process(ForkGeneration(), config_->cache)) {}

TokenGateImpl::~TokenGateImpl() {
  Process* const last = process_.load(std::memory_order_acquire);
  if (last->generation == ForkGeneration()) {
    delete last;
  }
}

TokenGateImpl::Process& TokenGateImpl::Current() const {
  Process* known = process_.load(std::memory_order_acquire);
  if (known->generation == ForkGeneration()) {
    return *known;
  }
  auto made = std::make_unique<Process>(ForkGeneration(), config_->cache);
  if (process_.compare_exchange_strong(known, made.get(), std::memory_order_acq_rel)) {
    return *made.release();
  }
  return *known;
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
