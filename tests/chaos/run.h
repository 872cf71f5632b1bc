#ifndef SSOCLIENT_TESTS_CHAOS_RUN_H
#define SSOCLIENT_TESTS_CHAOS_RUN_H

#include <chrono>
#include <cstddef>
#include <cstdint>
#include <optional>
#include <random>
#include <string>

namespace SsoClient::Testing {

/// One run of a campaign: its random choices, which a seed repeats, and its time. A case that
/// violates an expectation, or takes longer than a minute, ends the process with status 1 and a
/// message that names the campaign, the seed and the case.
class Run {
 public:
  Run(std::string campaign, std::uint64_t seed, std::chrono::seconds time);

  /// True until the time of the run is over. It begins with the first call of this function, after
  /// the preparations of a campaign, so one case runs in any time.
  bool HasTime();
  /// True when the run is long enough to wait for threads that end after being idle.
  bool IsLong() const { return time_ >= std::chrono::seconds(30); }

  /// A number less than `bound`, which is at least 1.
  std::size_t Below(std::size_t bound);
  template <class Container>
  const auto& OneOf(const Container& container) {
    return container[Below(std::size(container))];
  }
  std::chrono::microseconds TimeBelow(std::chrono::microseconds bound) {
    return std::chrono::microseconds(Below(static_cast<std::size_t>(bound.count())));
  }

  /// Begins a case.
  void Begin(const std::string& description);
  std::size_t Cases() const { return cases_; }

  /// Ends the case, and the process, if `holds` is false. May be called on any thread and in forked
  /// children, which end with the same status.
  void Require(bool holds, const std::string& message) const;
  [[noreturn]] void Fail(const std::string& message) const;

 private:
  const std::string campaign_;
  const std::uint64_t seed_;
  const std::chrono::seconds time_;
  std::optional<std::chrono::steady_clock::time_point> begin_;
  std::mt19937_64 random_;
  std::string case_;
  std::size_t cases_ = 0;
};

}  // namespace SsoClient::Testing

#endif
