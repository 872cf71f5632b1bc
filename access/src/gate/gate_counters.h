#ifndef SSOCLIENT_ACCESS_GATE_GATE_COUNTERS_H
#define SSOCLIENT_ACCESS_GATE_GATE_COUNTERS_H

#include <array>
#include <atomic>
#include <cstddef>
#include <cstdint>

#include <ssoclient/access/token_gate.h>

namespace SsoClient::Access {

/// The counters of a gate. Each thread uses one of a few groups of them, so that threads on
/// different cores share no cache line that they write.
class GateCounters {
 public:
  static constexpr std::size_t kReasons = static_cast<std::size_t>(Reason::kPredicateFailed) + 1;

  void CountVerdict(Reason reason) noexcept { Own().verdicts[static_cast<std::size_t>(reason)]++; }
  void CountHit() noexcept { Own().hits++; }
  void CountMiss() noexcept { Own().misses++; }

  /// Sets the members of `metrics` that are counted here.
  void AddTo(GateMetrics& metrics) const;

 private:
  class Counter {
   public:
    void operator++(int) noexcept { value_.fetch_add(1, std::memory_order_relaxed); }
    std::uint64_t Value() const noexcept { return value_.load(std::memory_order_relaxed); }

   private:
    std::atomic<std::uint64_t> value_{0};
  };
  struct alignas(64) Group {
    std::array<Counter, kReasons> verdicts;  // accepted ones at `Reason::kNone`
    Counter hits;
    Counter misses;
  };

  Group& Own() noexcept;

  std::array<Group, 8> groups_;
};

}  // namespace SsoClient::Access

#endif
