#include <ssoclient/access/listener.h>

namespace SsoClient::Access {

const char* NameOf(AttemptOperation operation) noexcept {
  switch (operation) {
    case AttemptOperation::kLogin:
      return "login";
    case AttemptOperation::kRenewal:
      return "renewal";
    case AttemptOperation::kExchange:
      return "exchange";
  }
  return "unknown";
}

const char* NameOf(CircuitState state) noexcept {
  switch (state) {
    case CircuitState::kClosed:
      return "closed";
    case CircuitState::kOpen:
      return "open";
    case CircuitState::kHalfOpen:
      return "half-open";
  }
  return "unknown";
}

AccessListener::~AccessListener() = default;
void AccessListener::OnAttemptBegun(const AttemptRecord&) {}
void AccessListener::OnAttemptEnded(const AttemptRecord&) {}
void AccessListener::OnRefreshFailed(const RefreshFailureRecord&) {}
void AccessListener::OnCircuit(const CircuitRecord&) {}
void AccessListener::OnClock(const ClockRecord&) {}
void AccessListener::OnDeviation(const DeviationRecord&) {}

}  // namespace SsoClient::Access
