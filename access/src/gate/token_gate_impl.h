#ifndef SSOCLIENT_ACCESS_GATE_TOKEN_GATE_IMPL_H
#define SSOCLIENT_ACCESS_GATE_TOKEN_GATE_IMPL_H

#include <memory>
#include <string>

#include <ssoclient/access/token_gate.h>

#include "gate/checked_tokens.h"
#include "gate/gate_counters.h"
#include "per_process.h"
#include "trust/trust_store_impl.h"

namespace SsoClient::Access {

/// The gate, with a cache and counters for each process.
class TokenGateImpl final : public TokenGate {
 public:
  /// `config` has been checked.
  explicit TokenGateImpl(GateConfig config);

  Verdict Check(const std::string& token, const Presenter& presenter) const override;
  GateMetrics Metrics() const override;

 private:
  struct Process {
    explicit Process(const GateCacheConfig& cache) : tokens(cache) {}

    GateCounters counters;
    CheckedTokens tokens;
  };

  Process& Current() const;
  Tarnik::System::DateTime Now() const;

  std::shared_ptr<const GateConfig> config_;
  std::shared_ptr<const TrustStoreImpl> trust_;
  PerProcess<Process> process_;
};

}  // namespace SsoClient::Access

#endif
