#include "circuit.h"

#include "backoff.h"

namespace SsoClient::Access {

bool Circuit::Admit(Instant::Steady now) {
  if (!CanAdmit(now)) {
    return false;
  }
  if (state_ == CircuitState::kOpen) {
    state_ = CircuitState::kHalfOpen;
  }
  return true;
}

void Circuit::OnAnswer() {
  state_ = CircuitState::kClosed;
  failures_ = 0;
  retryAt_ = Instant::Steady::min();
}

void Circuit::OnFailure(Instant::Steady now, std::chrono::milliseconds retryAfter, double draw) {
  if (state_ == CircuitState::kOpen) {
    return;  // an attempt from before
  }
  ++failures_;
  const bool opens = state_ == CircuitState::kHalfOpen || failures_ >= config_.failuresToOpen;
  if (opens) {
    state_ = CircuitState::kOpen;
    retryAt_ = now + Backoff(config_, failures_, retryAfter, draw);
    return;
  }
  if (retryAfter > std::chrono::milliseconds(0)) {
    retryAt_ = now + Backoff(config_, failures_, retryAfter, draw);
  }
}

void Circuit::OnUnclear(Instant::Steady now, std::chrono::milliseconds retryAfter, double draw) {
  OnAbandoned();
  if (retryAfter > std::chrono::milliseconds(0)) {
    retryAt_ = now + Backoff(config_, failures_ + 1, retryAfter, draw);
  }
}

void Circuit::OnAbandoned() {
  if (state_ == CircuitState::kHalfOpen) {
    state_ = CircuitState::kOpen;
  }
}

}  // namespace SsoClient::Access
