#ifndef SSOCLIENT_ACCESS_COUNTERS_H
#define SSOCLIENT_ACCESS_COUNTERS_H

#include <array>
#include <atomic>
#include <cstddef>
#include <cstdint>

#include <ssoclient/access/token_source.h>

namespace SsoClient::Access {

/// Counts one kind of event; read at any time.
class Counter {
 public:
  void Add(std::uint64_t count = 1) noexcept { value_.fetch_add(count, std::memory_order_relaxed); }
  std::uint64_t Value() const noexcept { return value_.load(std::memory_order_relaxed); }

 private:
  std::atomic<std::uint64_t> value_{0};
};

/// The counters of `TokenSourceMetrics`, except the hits, which the cache counts.
struct Counters {
  static constexpr std::size_t kKinds = static_cast<std::size_t>(FailureKind::kLocal) + 1;

  Counter misses;
  Counter shared;
  Counter refusedFromMemory;
  Counter evictions;
  Counter logins;
  Counter renewals;
  Counter exchanges;
  Counter refreshFailures;
  Counter deviations;
  std::array<Counter, kKinds> attempts;

  void CountAttempt(FailureKind kind) noexcept { attempts[static_cast<std::size_t>(kind)].Add(); }
  void CountSuccess(AttemptOperation operation) noexcept {
    switch (operation) {
      case AttemptOperation::kLogin:
        return logins.Add();
      case AttemptOperation::kRenewal:
        return renewals.Add();
      case AttemptOperation::kExchange:
        return exchanges.Add();
    }
  }
  void CopyTo(TokenSourceMetrics& metrics) const {
    metrics.misses = misses.Value();
    metrics.shared = shared.Value();
    metrics.refusedFromMemory = refusedFromMemory.Value();
    metrics.evictions = evictions.Value();
    metrics.logins = logins.Value();
    metrics.renewals = renewals.Value();
    metrics.exchanges = exchanges.Value();
    metrics.refreshFailures = refreshFailures.Value();
    metrics.deviations = deviations.Value();
    for (const Counter& counter : attempts) {
      metrics.attempts.push_back(counter.Value());
    }
  }
};

}  // namespace SsoClient::Access

#endif
