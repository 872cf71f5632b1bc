#include "http/cookie_date.h"

#include <array>
#include <chrono>

#include "support/ascii.h"

namespace Tarnik::Http {
namespace {

struct TimeOfDay {
  int hour;
  int minute;
  int second;
};

bool IsDelimiter(char c) noexcept {
  const auto code = static_cast<unsigned char>(c);
  return code == 0x09 || (code >= 0x20 && code <= 0x2F) || (code >= 0x3B && code <= 0x40) ||
         (code >= 0x5B && code <= 0x60) || (code >= 0x7B && code <= 0x7E);
}

/// Removes a number of `least` to `most` digits from the front of `text`.
std::optional<int> TakeNumber(std::string_view& text, std::size_t least, std::size_t most) {
  std::size_t length = 0;
  int value = 0;
  while (length < text.size() && IsDigit(text[length])) {
    if (length == most) {
      return std::nullopt;
    }
    value = value * 10 + (text[length] - '0');
    ++length;
  }
  if (length < least) {
    return std::nullopt;
  }
  text.remove_prefix(length);
  return value;
}

std::optional<TimeOfDay> ParseTime(std::string_view token) {
  const auto hour = TakeNumber(token, 1, 2);
  if (!hour || token.empty() || token.front() != ':') {
    return std::nullopt;
  }
  token.remove_prefix(1);
  const auto minute = TakeNumber(token, 1, 2);
  if (!minute || token.empty() || token.front() != ':') {
    return std::nullopt;
  }
  token.remove_prefix(1);
  const auto second = TakeNumber(token, 1, 2);
  if (!second) {
    return std::nullopt;
  }
  return TimeOfDay{*hour, *minute, *second};
}

std::optional<int> ParseMonth(std::string_view token) {
  constexpr std::array<std::string_view, 12> kMonths = {"jan", "feb", "mar", "apr", "may", "jun",
                                                        "jul", "aug", "sep", "oct", "nov", "dec"};
  for (std::size_t i = 0; i < kMonths.size(); ++i) {
    if (EqualsIgnoringCase(token.substr(0, 3), kMonths[i])) {
      return static_cast<int>(i) + 1;
    }
  }
  return std::nullopt;
}

/// The fields of a date read so far. The first token that fits a field sets it.
class DateFields {
 public:
  void Take(std::string_view token) {
    if (!time_ && (time_ = ParseTime(token))) {
      return;
    }
    std::string_view rest = token;
    if (!day_ && (day_ = TakeNumber(rest, 1, 2))) {
      return;
    }
    if (!month_ && (month_ = ParseMonth(token))) {
      return;
    }
    rest = token;
    if (!year_) {
      year_ = TakeNumber(rest, 2, 4);
    }
  }

  std::optional<System::DateTime> ToDateTime() const {
    if (!time_ || !day_ || !month_ || !year_) {
      return std::nullopt;
    }
    const std::chrono::year_month_day date{std::chrono::year{FullYear()},
                                           std::chrono::month{static_cast<unsigned>(*month_)},
                                           std::chrono::day{static_cast<unsigned>(*day_)}};
    constexpr int kFirstYear = 1601;
    if (!date.ok() || FullYear() < kFirstYear || time_->hour > 23 || time_->minute > 59 ||
        time_->second > 59) {
      return std::nullopt;
    }
    const auto instant = std::chrono::sys_days{date} + std::chrono::hours{time_->hour} +
                         std::chrono::minutes{time_->minute} + std::chrono::seconds{time_->second};
    const std::chrono::microseconds sinceEpoch = instant.time_since_epoch();
    return System::DateTimeFromUtc(sinceEpoch.count(), false);
  }

 private:
  int FullYear() const noexcept {
    if (*year_ >= 70 && *year_ <= 99) {
      return *year_ + 1900;
    }
    return *year_ <= 69 ? *year_ + 2000 : *year_;
  }

  std::optional<TimeOfDay> time_;
  std::optional<int> day_;
  std::optional<int> month_;
  std::optional<int> year_;
};

}  // namespace

std::optional<System::DateTime> ParseCookieDate(std::string_view text) {
  DateFields fields;
  std::size_t position = 0;
  while (position < text.size()) {
    if (IsDelimiter(text[position])) {
      ++position;
      continue;
    }
    const std::size_t start = position;
    while (position < text.size() && !IsDelimiter(text[position])) {
      ++position;
    }
    fields.Take(text.substr(start, position - start));
  }
  return fields.ToDateTime();
}

}  // namespace Tarnik::Http
