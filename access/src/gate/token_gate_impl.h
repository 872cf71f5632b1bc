#ifndef SSOCLIENT_ACCESS_GATE_TOKEN_GATE_IMPL_H
#define SSOCLIENT_ACCESS_GATE_TOKEN_GATE_IMPL_H

#include <atomic>
#include <cstdint>
#include <memory>
#include <string>

#include <ssoclient/access/token_gate.h>

#include "trust/trust_store_impl.h"

namespace SsoClient::Access {

/// The gate, with a cache and counters for each process: a forked child begins with new ones, since
/// locks of the parent's may be held by threads that do not exist in the child.
class TokenGateImpl final : public TokenGate {
 public:
  /// `config` has been checked.
  explicit TokenGateImpl(GateConfig config);
  ~TokenGateImpl() override;
  TokenGateImpl(const TokenGateImpl&) = delete;
  TokenGateImpl& operator=(const TokenGateImpl&) = delete;

  Verdict Check(const std::string& token, const Presenter& presenter) const override;
  GateMetrics Metrics() const override;

 private:
  struct Process;

  Process& Current() const;
  Tarnik::System::DateTime Now() const;

  std::shared_ptr<const GateConfig> config_;
  std::shared_ptr<const TrustStoreImpl> trust_;
  mutable std::atomic<Process*> process_;
};

}  // namespace SsoClient::Access

#endif
