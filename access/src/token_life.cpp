#include "token_life.h"

#include <algorithm>

namespace SsoClient::Access {

namespace {

using std::chrono::microseconds;

constexpr int kMarginDivisor = 20;

microseconds SinceEpoch(Instant::Wall time) {
  return std::chrono::duration_cast<microseconds>(time.time_since_epoch());
}

// What is left of the period now. The start may be set back to allow for slow clocks.
microseconds LifetimeLeft(const GrantedPeriod& period, microseconds serviceNow) {
  return std::max(period.end - std::max(period.start, serviceNow), microseconds(0));
}

}  // namespace

TokenLife PlanTokenLife(const RefreshConfig& config, const GrantedPeriod& period,
                        const Instant& now, double draw) {
  const microseconds serviceNow = SinceEpoch(now.wall) + period.clockOffset;
  const microseconds lifetime = LifetimeLeft(period, serviceNow);
  const microseconds margin =
      std::min(lifetime / kMarginDivisor, microseconds(config.longestMargin));
  const microseconds usable = lifetime - margin;
  const double fraction = std::clamp(config.fraction + config.jitter * (2 * draw - 1), 0.0, 1.0);
  const auto refreshAfter = microseconds(
      static_cast<microseconds::rep>(fraction * static_cast<double>(lifetime.count())));
  return {now.steady + std::min(refreshAfter, usable), {now.steady + usable, now.wall + usable}};
}

}  // namespace SsoClient::Access
