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
    return Covers(end.steady - now.steady, minimumLife) && Covers(end.wall - now.wall, minimumLife);
  }
  /// True when the service has granted at least `minimumLife`.
  bool IsGranted(std::chrono::seconds minimumLife) const noexcept {
    return Covers(granted, minimumLife);
  }
  bool HasEnded(const Instant& now) const noexcept {
    return now.steady >= end.steady || now.wall >= end.wall;
  }
  bool IsDue(const Instant& now) const noexcept { return now.steady >= refreshAt; }

 private:
  // In whole seconds, since a minimum of any size need not fit a finer unit.
  template <class Duration>
  static bool Covers(Duration left, std::chrono::seconds minimumLife) noexcept {
    return std::chrono::floor<std::chrono::seconds>(left) >= minimumLife;
  }
};

/// Plans the life of a token that was received at `now`. The token has just been issued, so an
/// offset with which it would have ended, or would begin more than two minutes from now, is
/// ignored. With an offset below zero, the life ends after the token's end by this system's clock:
/// by at most the offset, and at most as long as the token's start is past. The life of a token
/// that has ended has `granted` zero. `draw` is random, at least 0 and below 1.
TokenLife PlanTokenLife(const RefreshConfig& config, const GrantedPeriod& period,
                        const Instant& now, double draw);

}  // namespace SsoClient::Access

#endif
