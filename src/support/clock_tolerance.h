#ifndef SSOCLIENT_SUPPORT_CLOCK_TOLERANCE_H
#define SSOCLIENT_SUPPORT_CLOCK_TOLERANCE_H

#include <tarnik/system/date_time.h>

namespace SsoClient {

inline constexpr long kMicrosecondsPerSecond = 1'000'000;

/// Seconds that two clocks may differ when the caller does not say.
inline constexpr long kDefaultClockToleranceSec = 600;

/// A clock tolerance in microseconds, limited to the range of `long`.
inline long ToleranceMicroseconds(long clockToleranceSec) noexcept {
  return Tarnik::System::SaturatingMultiply(clockToleranceSec, kMicrosecondsPerSecond);
}

/// The UTC time `seconds` after `time`, or before it when negative, limited to the range of
/// `DateTime`.
inline Tarnik::System::DateTime AddSeconds(const Tarnik::System::DateTime& time, long seconds) {
  return Tarnik::System::DateTimeFromUtc(
      Tarnik::System::SaturatingAdd(time.GetUtcTime(), ToleranceMicroseconds(seconds)), false);
}

}  // namespace SsoClient

#endif
