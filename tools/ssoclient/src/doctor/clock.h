#ifndef SSOCLIENT_TOOL_DOCTOR_CLOCK_H
#define SSOCLIENT_TOOL_DOCTOR_CLOCK_H

#include "doctor/report.h"

namespace SsoClient::Tool::Doctor {

/// By how much the clock of the service is ahead of this machine's.
struct ClockOffset {
  double seconds = 0;
  /// The true offset differs by at most this: half of the round trip, and half of the second that
  /// the Date does not divide.
  double uncertainty = 0;
};

/// The offset when a request sent at `sentAt` and answered at `receivedAt`, both in microseconds of
/// Unix time on this machine, has the Date `serviceTime` in seconds of Unix time.
ClockOffset OffsetOf(long serviceTime, long sentAt, long receivedAt);

/// More than this is a failure, and more than `kLargeClockOffsetSec` a warning: the library
/// tolerates 600 s when it checks the validity of a token.
inline constexpr double kTokenTolerance = 600;

/// What the offset means.
Finding FindingOfClock(const ClockOffset& offset);

}  // namespace SsoClient::Tool::Doctor

#endif
