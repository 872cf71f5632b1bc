#ifndef SSOCLIENT_TOOL_DOCTOR_TIME_LIMIT_H
#define SSOCLIENT_TOOL_DOCTOR_TIME_LIMIT_H

#include <algorithm>
#include <chrono>

namespace SsoClient::Tool::Doctor {

/// The time of a whole examination, of which each step may take a third, so that a service that is
/// silent in one stage does not take the time of the others.
class TimeLimit {
 public:
  using Clock = std::chrono::steady_clock;

  explicit TimeLimit(std::chrono::milliseconds total)
      : share_(total / 3), end_(Clock::now() + total) {}

  /// When a step that begins now ends at the latest.
  Clock::time_point ForStep() const { return std::min(Clock::now() + share_, end_); }
  bool IsOver() const { return Clock::now() >= end_; }
  /// Does not count time in which the program waited for its user.
  void Extend(Clock::duration time) { end_ += time; }

 private:
  std::chrono::milliseconds share_;
  Clock::time_point end_;
};

/// The milliseconds until then, at least 0.
inline int MillisecondsUntil(TimeLimit::Clock::time_point end) {
  const auto left = std::chrono::ceil<std::chrono::milliseconds>(end - TimeLimit::Clock::now());
  return static_cast<int>(std::clamp<long>(left.count(), 0, 24L * 3600 * 1000));
}

}  // namespace SsoClient::Tool::Doctor

#endif
