#ifndef SSOCLIENT_ACCESS_INSTANT_H
#define SSOCLIENT_ACCESS_INSTANT_H

#include <chrono>

namespace SsoClient::Access {

/// Thirty years: more than anybody waits for, and a multiple of it still fits the clocks. Longer
/// durations count as this.
inline constexpr std::chrono::hours kLongestDuration{24 * 365 * 30};

/// One moment on two clocks. Waiting and spacing use the steady clock. The wall clock counts as
/// well for the end of a token, since the steady clock does not run while a machine is suspended.
struct Instant {
  using Steady = std::chrono::steady_clock::time_point;
  using Wall = std::chrono::system_clock::time_point;

  Steady steady;
  Wall wall;

  static Instant Now() {
    return {std::chrono::steady_clock::now(), std::chrono::system_clock::now()};
  }
};

}  // namespace SsoClient::Access

#endif
