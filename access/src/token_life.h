#ifndef SSOCLIENT_ACCESS_TOKEN_LIFE_H
#define SSOCLIENT_ACCESS_TOKEN_LIFE_H

#include <chrono>

#include <ssoclient/access/token_source.h>

#include "instant.h"

namespace SsoClient::Access {

/// The validity period of a token that has just been received, by the service's clock.
struct GrantedPeriod {
  std::chrono::microseconds start;  ///< since 1970
  std::chrono::microseconds end;    ///< since 1970
  /// The service's clock minus this system's.
  std::chrono::milliseconds clockOffset{0};
};

/// When a token is replaced, and how long it is handed out.
struct TokenLife {
  Instant::Steady refreshAt;
  Instant usableUntil;

  bool IsUsable(const Instant& now) const noexcept {
    return now.steady < usableUntil.steady && now.wall < usableUntil.wall;
  }
  bool IsDue(const Instant& now) const noexcept { return now.steady >= refreshAt; }
};

/// Plans the life of a token that was received at `now`. `draw` is random, at least 0 and below 1.
TokenLife PlanTokenLife(const RefreshConfig& config, const GrantedPeriod& period,
                        const Instant& now, double draw);

}  // namespace SsoClient::Access

#endif
