#include "gate/gate_counters.h"

#include <utility>

namespace SsoClient::Access {

namespace {

std::size_t NumberOfThread() noexcept {
  static std::atomic<std::size_t> next{0};
  thread_local const std::size_t own = next.fetch_add(1, std::memory_order_relaxed);
  return own;
}

}  // namespace

GateCounters::Group& GateCounters::Own() noexcept {
  return groups_[NumberOfThread() % groups_.size()];
}

void GateCounters::AddTo(GateMetrics& metrics) const {
  std::vector<std::uint64_t> verdicts(kReasons);
  for (const Group& group : groups_) {
    for (std::size_t reason = 0; reason < kReasons; ++reason) {
      verdicts[reason] += group.verdicts[reason].Value();
    }
    metrics.cacheHits += group.hits.Value();
    metrics.cacheMisses += group.misses.Value();
  }
  metrics.accepted = std::exchange(verdicts.front(), 0);
  metrics.refused = std::move(verdicts);
}

}  // namespace SsoClient::Access
