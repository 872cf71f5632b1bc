#include "doctor/clock.h"

#include <array>
#include <cmath>
#include <cstdio>
#include <string>

#include "service/clock_offset.h"

namespace SsoClient::Tool::Doctor {
namespace {

constexpr double kMicroseconds = 1e6;

std::string Seconds(double value) {
  std::array<char, 40> text{};
  std::snprintf(text.data(), text.size(), "%.1f s", value);
  return text.data();
}

}  // namespace

ClockOffset OffsetOf(long serviceTime, long sentAt, long receivedAt) {
  constexpr double kHalfSecond = 0.5;
  const double sent = static_cast<double>(sentAt) / kMicroseconds;
  const double received = static_cast<double>(receivedAt) / kMicroseconds;
  const double service = static_cast<double>(serviceTime) + kHalfSecond;
  return {service - (sent + received) / 2, (received - sent) / 2 + kHalfSecond};
}

Finding FindingOfClock(const ClockOffset& offset) {
  const double distance = std::abs(offset.seconds);
  const std::string message = "the clock of the service is " + Seconds(distance) +
                              (offset.seconds < 0 ? " earlier than" : " later than") +
                              " this machine's, to within " + Seconds(offset.uncertainty);
  const char* remedy = "synchronise the clocks of both machines, with NTP for example";
  const double least = distance - offset.uncertainty;
  if (least > kTokenTolerance) {
    return Failure(ExitStatus::kLocal, "clock-far-off", message + "; tokens are not accepted",
                   remedy);
  }
  if (least > static_cast<double>(kLargeClockOffsetSec)) {
    return Warning(ExitStatus::kLocal, "clock-off", message + "; many services refuse requests",
                   remedy);
  }
  return Fine(distance <= offset.uncertainty
                  ? "the clocks agree to within " + Seconds(offset.uncertainty)
                  : message);
}

}  // namespace SsoClient::Tool::Doctor
