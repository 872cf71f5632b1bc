#include "output/duration_text.h"

#include <array>
#include <charconv>
#include <cstddef>

namespace SsoClient::Tool {
namespace {

struct Unit {
  const char* name;
  long seconds;
};

constexpr std::array<Unit, 4> kUnits{{{"d", 86400}, {"h", 3600}, {"min", 60}, {"s", 1}}};
constexpr long kLongestSeconds = 36500L * 86400;

std::string Part(long count, const Unit& unit) {
  return std::to_string(count) + " " + unit.name;
}

// Zero for an unknown name.
long SecondsOf(std::string_view unit) {
  if (unit.empty()) {
    return 1;
  }
  for (const Unit& each : kUnits) {
    if (unit == each.name || (unit == "m" && each.seconds == 60)) {
      return each.seconds;
    }
  }
  return 0;
}

}  // namespace

std::string DurationText(std::chrono::seconds duration) {
  const long total = duration.count() < 0 ? -duration.count() : duration.count();
  for (std::size_t i = 0; i < kUnits.size(); ++i) {
    const long count = total / kUnits[i].seconds;
    if (count == 0) {
      continue;
    }
    const long rest = i + 1 < kUnits.size() ? total % kUnits[i].seconds / kUnits[i + 1].seconds : 0;
    return Part(count, kUnits[i]) + (rest == 0 ? "" : " " + Part(rest, kUnits[i + 1]));
  }
  return "0 s";
}

std::optional<std::chrono::seconds> ParseDuration(std::string_view text) {
  long count = 0;
  const char* const end = text.data() + text.size();
  const auto [rest, error] = std::from_chars(text.data(), end, count);
  if (error != std::errc() || count < 0) {
    return std::nullopt;
  }
  const long unit = SecondsOf({rest, static_cast<std::size_t>(end - rest)});
  if (unit == 0 || count > kLongestSeconds / unit) {
    return std::nullopt;
  }
  return std::chrono::seconds(count * unit);
}

std::string TimeText(const Tarnik::System::DateTime& time) {
  // "2026-11-22T16:30:00.000Z" in the order of its fields.
  const std::string text = Tarnik::System::DateTimeFromUtc(time.GetUtcTime(), false).ToString();
  return text.substr(0, 10) + " " + text.substr(11, 8) + " UTC";
}

std::chrono::seconds SecondsBetween(const Tarnik::System::DateTime& from,
                                    const Tarnik::System::DateTime& to) {
  return std::chrono::floor<std::chrono::seconds>(
      std::chrono::microseconds(to.GetUtcTime() - from.GetUtcTime()));
}

}  // namespace SsoClient::Tool
