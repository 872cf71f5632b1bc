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
  Instant usableUntil;  ///< the end less the margin
  Instant end;
  std::chrono::microseconds granted{0};  ///< what was left when the token was received
  /// The token that it was exchanged for set its end.
  bool endsWithBase = false;

  /// True when the token may be handed out to a caller that needs it for `minimumLife`; zero means
  /// the margin.
  bool IsUsable(const Instant& now, std::chrono::seconds minimumLife) const noexcept {
    if (minimumLife == std::chrono::seconds(0)) {
      return now.steady < usableUntil.steady && now.wall < usableUntil.wall;
    }
    return end.steady - now.steady >= minimumLife && end.wall - now.wall >= minimumLife;
  }
  bool HasEnded(const Instant& now) const noexcept {
    return now.steady >= end.steady || now.wall >= end.wall;
  }
  bool IsDue(const Instant& now) const noexcept { return now.steady >= refreshAt; }
};

/// Plans the life of a token that was received at `now`. An offset with which the token would not
/// be valid now is ignored, since the token has just been issued. The life of a token that has
/// ended has `granted` zero. `draw` is random, at least 0 and below 1.
TokenLife PlanTokenLife(const RefreshConfig& config, const GrantedPeriod& period,
                        const Instant& now, double draw);

}  // namespace SsoClient::Access

#endif
