#include "circuit.h"

#include <algorithm>

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
  const bool isFromBefore = state_ == CircuitState::kOpen;
  if (!isFromBefore) {
    ++failures_;
    if (state_ == CircuitState::kHalfOpen || failures_ >= config_.failuresToOpen) {
      state_ = CircuitState::kOpen;
      PutOff(now + Backoff(config_, failures_, retryAfter, draw));
      return;
    }
  }
  if (retryAfter > std::chrono::milliseconds(0)) {
    PutOff(now + Backoff(config_, failures_, retryAfter, draw));
  }
}

void Circuit::OnUnclear(Instant::Steady now, std::chrono::milliseconds retryAfter, double draw) {
  OnAbandoned();
  if (retryAfter > std::chrono::milliseconds(0)) {
    PutOff(now + Backoff(config_, failures_ + 1, retryAfter, draw));
  }
}

void Circuit::OnAbandoned() {
  if (state_ == CircuitState::kHalfOpen) {
    state_ = CircuitState::kOpen;
  }
}

void Circuit::PutOff(Instant::Steady until) noexcept {
  retryAt_ = std::max(retryAt_, until);
}

}  // namespace SsoClient::Access
