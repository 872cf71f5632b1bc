#ifndef SSOCLIENT_ACCESS_CIRCUIT_H
#define SSOCLIENT_ACCESS_CIRCUIT_H

#include <chrono>

#include <ssoclient/access/listener.h>
#include <ssoclient/access/token_source.h>

#include "instant.h"

namespace SsoClient::Access {

/// Whether one endpoint may be asked. Closed, it may. After `RetryConfig::failuresToOpen`
/// consecutive failures it opens: nobody asks the endpoint until a back-off has passed. Then it is
/// half open: one caller probes the endpoint, and the outcome closes the circuit or opens it for a
/// longer back-off. Not thread-safe.
class Circuit {
 public:
  explicit Circuit(const RetryConfig& config) : config_(config) {}

  CircuitState State() const noexcept { return state_; }
  /// When the endpoint may be asked again; in the past for a closed circuit.
  Instant::Steady RetryAt() const noexcept { return retryAt_; }

  /// True when `Admit` would be.
  bool CanAdmit(Instant::Steady now) const noexcept {
    return state_ != CircuitState::kHalfOpen && now >= retryAt_;
  }
  /// True when the caller may ask the endpoint. It must then report the outcome.
  bool Admit(Instant::Steady now);
  /// The endpoint has answered, also with a refusal.
  void OnAnswer();
  /// No service has decided the attempt. `retryAfter` is what the endpoint asked for, or zero.
  void OnFailure(Instant::Steady now, std::chrono::milliseconds retryAfter, double draw);
  /// The endpoint may or may not work. `retryAfter` as above.
  void OnUnclear(Instant::Steady now, std::chrono::milliseconds retryAfter, double draw);
  /// The attempt ended without an outcome, since nobody waited for it any longer.
  void OnAbandoned();

 private:
  /// What another attempt was asked to wait for still counts.
  void PutOff(Instant::Steady until) noexcept;

  const RetryConfig config_;
  CircuitState state_ = CircuitState::kClosed;
  int failures_ = 0;
  Instant::Steady retryAt_ = Instant::Steady::min();
};

}  // namespace SsoClient::Access

#endif
