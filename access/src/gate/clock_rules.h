#ifndef SSOCLIENT_ACCESS_GATE_CLOCK_RULES_H
#define SSOCLIENT_ACCESS_GATE_CLOCK_RULES_H

#include <chrono>

#include <tarnik/system/date_time.h>

namespace SsoClient::Access {

/// The time of a check, and the tolerance for clocks that differ. The core compares the validity of
/// tokens in the same way.
class ClockRules {
 public:
  ClockRules(const Tarnik::System::DateTime& now, std::chrono::seconds tolerance) noexcept
      : now_(now.GetUtcTime()), tolerance_(std::chrono::microseconds(tolerance).count()) {}

  /// From `start` on, which is the first instant.
  bool HasBegun(const Tarnik::System::DateTime& start) const noexcept {
    return Tarnik::System::SaturatingAdd(start.GetUtcTime(), -tolerance_) <= now_;
  }
  /// From `end` on, which is the first instant after a period.
  bool HasEnded(const Tarnik::System::DateTime& end) const noexcept {
    return Tarnik::System::SaturatingAdd(end.GetUtcTime(), tolerance_) <= now_;
  }
  /// After `last`, which is the last instant of a period.
  bool IsAfter(const Tarnik::System::DateTime& last) const noexcept {
    return Tarnik::System::SaturatingAdd(last.GetUtcTime(), tolerance_) < now_;
  }

 private:
  long now_;
  long tolerance_;
};

}  // namespace SsoClient::Access

#endif
