#include <chrono>
#include <string>

#include <ssoclient/access/listener.h>
#include <tarnik/service/log.h>

namespace SsoClient::Access {

namespace {

using Tarnik::Service::LogInternal;

constexpr int kRefusedLevel = 2;
constexpr int kFailureLevel = 3;
constexpr int kWarningLevel = 4;
constexpr int kTraceLevel = 6;

const Tarnik::Service::StaticLogger& Logger() {
  static const Tarnik::Service::StaticLogger logger("TokenSource");
  return logger;
}

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

bool IsRefused(FailureKind kind) noexcept {
  return kind == FailureKind::kRefusedLogin || kind == FailureKind::kExpiredPassword;
}

int LevelOf(const AttemptRecord& attempt) noexcept {
  if (attempt.failure == FailureKind::kNone || attempt.failure == FailureKind::kAbandoned) {
    return kTraceLevel;
  }
  return IsRefused(attempt.failure) ? kRefusedLevel : kFailureLevel;
}

// Such as "is slow by 90 s", to the nearest second.
std::string Compare(std::chrono::milliseconds offset) {
  const auto seconds = std::chrono::round<std::chrono::seconds>(offset).count();
  if (seconds == 0) {
    return "agrees with this system's";
  }
  return seconds < 0 ? "is slow by " + std::to_string(-seconds) + " s"
                     : "is fast by " + std::to_string(seconds) + " s";
}

class LogListener final : public AccessListener {
 public:
  void OnAttemptBegun(const AttemptRecord& attempt) override {
    LogInternal(Logger(), kTraceLevel, "Source '%1': attempt %2 begun: %3 at %4, number %5%6",
                {attempt.source, attempt.id, NameOf(attempt.operation), attempt.endpoint,
                 attempt.number, attempt.isRefresh ? ", a refresh" : ""});
  }

  void OnAttemptEnded(const AttemptRecord& attempt) override {
    const auto elapsed =
        std::chrono::duration_cast<std::chrono::milliseconds>(attempt.duration).count();
    const int level = LevelOf(attempt);
    if (attempt.failure == FailureKind::kNone) {
      LogInternal(
          Logger(), level, "Source '%1': attempt %2 has succeeded: %3 at %4 in %5 ms",
          {attempt.source, attempt.id, NameOf(attempt.operation), attempt.endpoint, elapsed});
      return;
    }
    LogInternal(Logger(), level,
                "Source '%1': attempt %2 has failed: %3 at %4 in %5 ms, HTTP status %6: %7: %8",
                {attempt.source, attempt.id, NameOf(attempt.operation), attempt.endpoint, elapsed,
                 attempt.httpStatus, Access::NameOf(attempt.failure), attempt.message});
  }

  void OnRefreshFailed(const RefreshFailureRecord& refresh) override {
    const int level = IsRefused(refresh.failure) ? kRefusedLevel : kFailureLevel;
    const std::string end = refresh.usableUntil
                                ? "the token is usable until " + refresh.usableUntil->ToString()
                                : std::string("there is no token");
    LogInternal(Logger(), level, "Source '%1': refresh has failed, next one in %2 ms, %3: %4: %5",
                {refresh.source, refresh.nextAttempt.count(), end, Access::NameOf(refresh.failure),
                 refresh.message});
  }

  void OnCircuit(const CircuitRecord& circuit) override {
    const std::string probe =
        circuit.state == CircuitState::kOpen
            ? ", next probe in " + std::to_string(circuit.retryAfter.count()) + " ms"
            : std::string();
    LogInternal(Logger(), kWarningLevel, "Source '%1': circuit of %2 is %3%4",
                {circuit.source, circuit.endpoint, NameOf(circuit.state), probe});
  }

  void OnClock(const ClockRecord& clock) override {
    LogInternal(Logger(), kWarningLevel, "Source '%1': the clock of %2 %3",
                {clock.source, clock.endpoint, Compare(clock.offset)});
  }

  void OnDeviation(const DeviationRecord& deviation) override {
    LogInternal(Logger(), kWarningLevel,
                "Source '%1': %2 has issued a token with another %3 than asked: '%4' for '%5'",
                {deviation.source, deviation.endpoint, deviation.field, deviation.issued,
                 deviation.requested});
  }
};

}  // namespace

AccessListener::~AccessListener() = default;
void AccessListener::OnAttemptBegun(const AttemptRecord&) {}
void AccessListener::OnAttemptEnded(const AttemptRecord&) {}
void AccessListener::OnRefreshFailed(const RefreshFailureRecord&) {}
void AccessListener::OnCircuit(const CircuitRecord&) {}
void AccessListener::OnClock(const ClockRecord&) {}
void AccessListener::OnDeviation(const DeviationRecord&) {}

std::shared_ptr<AccessListener> CreateLogListener() {
  return std::make_shared<LogListener>();
}

}  // namespace SsoClient::Access
