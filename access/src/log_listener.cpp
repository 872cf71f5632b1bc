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

bool IsRefused(FailureKind kind) noexcept {
  return kind == FailureKind::kRefusedLogin || kind == FailureKind::kExpiredPassword;
}

int LevelOf(const AttemptRecord& attempt) noexcept {
  if (attempt.failure == FailureKind::kNone || attempt.failure == FailureKind::kAbandoned) {
    return kTraceLevel;
  }
  return IsRefused(attempt.failure) ? kRefusedLevel : kFailureLevel;
}

// Such as "Source 'orders'"; a source does not need a name.
template <typename Record>
std::string SourceOf(const Record& record) {
  return record.source.empty() ? "Source" : "Source '" + record.source + "'";
}

// Such as "renewal at https://sts.example.com"; an attempt may have no endpoint.
std::string Describe(const AttemptRecord& attempt) {
  const std::string operation = NameOf(attempt.operation);
  return attempt.endpoint.empty() ? operation : operation + " at " + attempt.endpoint;
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
    LogInternal(Logger(), kTraceLevel, "%1: attempt %2 begun: %3, number %4%5",
                {SourceOf(attempt), attempt.id, Describe(attempt), attempt.number,
                 attempt.isRefresh ? ", a refresh" : ""});
  }

  void OnAttemptEnded(const AttemptRecord& attempt) override {
    const auto elapsed =
        std::chrono::duration_cast<std::chrono::milliseconds>(attempt.duration).count();
    const int level = LevelOf(attempt);
    if (attempt.failure == FailureKind::kNone) {
      LogInternal(Logger(), level, "%1: attempt %2 has succeeded: %3 in %4 ms",
                  {SourceOf(attempt), attempt.id, Describe(attempt), elapsed});
      return;
    }
    const std::string status =
        attempt.httpStatus == 0 ? "" : ", HTTP status " + std::to_string(attempt.httpStatus);
    LogInternal(Logger(), level, "%1: attempt %2 has failed: %3 in %4 ms%5: %6: %7",
                {SourceOf(attempt), attempt.id, Describe(attempt), elapsed, status,
                 NameOf(attempt.failure), attempt.message});
  }

  void OnRefreshFailed(const RefreshFailureRecord& refresh) override {
    const int level = IsRefused(refresh.failure) ? kRefusedLevel : kFailureLevel;
    const std::string end = refresh.usableUntil
                                ? "the token is usable until " + refresh.usableUntil->ToString()
                                : std::string("there is no token");
    LogInternal(Logger(), level, "%1: refresh has failed, next one in %2 ms, %3: %4: %5",
                {SourceOf(refresh), refresh.nextAttempt.count(), end, NameOf(refresh.failure),
                 refresh.message});
  }

  void OnCircuit(const CircuitRecord& circuit) override {
    const std::string probe =
        circuit.state == CircuitState::kOpen
            ? ", next probe in " + std::to_string(circuit.retryAfter.count()) + " ms"
            : std::string();
    LogInternal(Logger(), kWarningLevel, "%1: circuit of %2 is %3%4",
                {SourceOf(circuit), circuit.endpoint, NameOf(circuit.state), probe});
  }

  void OnClock(const ClockRecord& clock) override {
    LogInternal(Logger(), kWarningLevel, "%1: the clock of %2 %3",
                {SourceOf(clock), clock.endpoint, Compare(clock.offset)});
  }

  void OnDeviation(const DeviationRecord& deviation) override {
    LogInternal(Logger(), kWarningLevel,
                "%1: %2 has issued a token with another %3 than asked: '%4' for '%5'",
                {SourceOf(deviation), deviation.endpoint, deviation.field, deviation.issued,
                 deviation.requested});
  }
};

}  // namespace

std::shared_ptr<AccessListener> CreateLogListener() {
  return std::make_shared<LogListener>();
}

}  // namespace SsoClient::Access
