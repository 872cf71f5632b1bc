#ifndef SSOCLIENT_SUPPORT_CLOCK_TOLERANCE_H
#define SSOCLIENT_SUPPORT_CLOCK_TOLERANCE_H

namespace SsoClient {

/// Seconds that two clocks may differ where a caller says nothing.
inline constexpr long kDefaultClockToleranceSec = 600;

}  // namespace SsoClient

#endif
