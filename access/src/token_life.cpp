#include "token_life.h"

#include <algorithm>

namespace SsoClient::Access {

namespace {

using std::chrono::microseconds;

constexpr int kMarginDivisor = 20;
constexpr double kEarliestFraction = 0.1;
// How far the start of a token may be ahead of the service's clock.
constexpr microseconds kLargestLead = std::chrono::minutes(2);

microseconds SinceEpoch(Instant::Wall time) {
  return std::chrono::duration_cast<microseconds>(time.time_since_epoch());
}

// What is left of the period now. The start may be set back to allow for slow clocks.
microseconds LifetimeLeft(const GrantedPeriod& period, microseconds serviceNow) {
  return std::max(period.end - std::max(period.start, serviceNow), microseconds(0));
}

// A proxy may have set the `Date` that the offset comes from. If it is slow, the token is handed
// out past its end by this system's clock, so the token's start has to agree that the service's
// clock is slow: what is left is never longer than the token's own period.
microseconds LifetimeGranted(const GrantedPeriod& period, Instant::Wall now) {
  const microseconds serviceNow = SinceEpoch(now) + period.clockOffset;
  const bool isPlausible = serviceNow < period.end && serviceNow + kLargestLead >= period.start;
  return LifetimeLeft(period, isPlausible ? serviceNow : SinceEpoch(now));
}

// A large jitter must not cause refreshes one after the other.
double FractionBefore(const RefreshConfig& config, double draw) {
  const double earliest = std::min(kEarliestFraction, config.fraction);
  return std::clamp(config.fraction + config.jitter * (2 * draw - 1), earliest, 1.0);
}

}  // namespace

TokenLife PlanTokenLife(const RefreshConfig& config, const GrantedPeriod& period,
                        const Instant& now, double draw) {
  // The clocks reach further than any token needs, but not as far as a token may state.
  const microseconds lifetime =
      std::min<microseconds>(LifetimeGranted(period, now.wall), kLongestDuration);
  const microseconds margin =
      std::min(lifetime / kMarginDivisor, microseconds(config.longestMargin));
  const microseconds usable = lifetime - margin;
  const auto refreshAfter = microseconds(static_cast<microseconds::rep>(
      FractionBefore(config, draw) * static_cast<double>(lifetime.count())));
  const auto at = [&now](microseconds after) {
    return Instant{now.steady + after, now.wall + after};
  };
  return {now.steady + std::min(refreshAfter, usable), at(usable), at(lifetime), lifetime, false};
}

}  // namespace SsoClient::Access
