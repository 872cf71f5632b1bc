#include "attempts/answer_headers.h"

#include <algorithm>
#include <array>
#include <cstddef>
#include <string>

#include <tarnik/system/date_time.h>

namespace SsoClient::Access {

namespace {

using std::chrono::milliseconds;
using std::chrono::seconds;

constexpr std::array<std::string_view, 12> kMonths = {"Jan", "Feb", "Mar", "Apr", "May", "Jun",
                                                      "Jul", "Aug", "Sep", "Oct", "Nov", "Dec"};
constexpr std::array<std::string_view, 7> kLongDays = {
    "Monday", "Tuesday", "Wednesday", "Thursday", "Friday", "Saturday", "Sunday"};
constexpr std::size_t kShortDay = 3;

bool IsDigit(char c) noexcept {
  return c >= '0' && c <= '9';
}

struct Calendar {
  int year = 0;
  unsigned month = 0;
  int day = 0;
  int hour = 0;
  int minute = 0;
  int second = 0;
};

/// Reads the parts of a date from front to back. After a part that is missing, it has failed.
class DateCursor {
 public:
  explicit DateCursor(std::string_view text) : rest_(text) {}

  bool HasEnded() const noexcept { return !hasFailed_ && rest_.empty(); }

  void Skip(std::string_view expected) {
    if (!rest_.starts_with(expected)) {
      hasFailed_ = true;
      return;
    }
    rest_.remove_prefix(expected.size());
  }

  int Number(std::size_t digits) {
    if (rest_.size() < digits ||
        !std::all_of(rest_.begin(), rest_.begin() + static_cast<std::ptrdiff_t>(digits), IsDigit)) {
      hasFailed_ = true;
      return 0;
    }
    int value = 0;
    for (const char digit : rest_.substr(0, digits)) {
      value = 10 * value + (digit - '0');
    }
    rest_.remove_prefix(digits);
    return value;
  }

  /// A number of two digits whose first may be a blank.
  int PaddedNumber() {
    if (rest_.starts_with(' ')) {
      rest_.remove_prefix(1);
      return Number(1);
    }
    return Number(2);
  }

  unsigned Month() {
    const auto found = std::find(kMonths.begin(), kMonths.end(), rest_.substr(0, 3));
    if (found == kMonths.end()) {
      hasFailed_ = true;
      return 0;
    }
    rest_.remove_prefix(3);
    return static_cast<unsigned>(found - kMonths.begin()) + 1;
  }

  void Time(Calendar& calendar) {
    calendar.hour = Number(2);
    Skip(":");
    calendar.minute = Number(2);
    Skip(":");
    calendar.second = Number(2);
  }

 private:
  std::string_view rest_;
  bool hasFailed_ = false;
};

// "Sun, 06 Nov 1994 08:49:37 GMT", after the day's name.
bool ReadFixed(DateCursor cursor, Calendar& calendar) {
  cursor.Skip(", ");
  calendar.day = cursor.Number(2);
  cursor.Skip(" ");
  calendar.month = cursor.Month();
  cursor.Skip(" ");
  calendar.year = cursor.Number(4);
  cursor.Skip(" ");
  cursor.Time(calendar);
  cursor.Skip(" GMT");
  return cursor.HasEnded();
}

// "Sun Nov  6 08:49:37 1994", after the day's name.
bool ReadAsctime(DateCursor cursor, Calendar& calendar) {
  cursor.Skip(" ");
  calendar.month = cursor.Month();
  cursor.Skip(" ");
  calendar.day = cursor.PaddedNumber();
  cursor.Skip(" ");
  cursor.Time(calendar);
  cursor.Skip(" ");
  calendar.year = cursor.Number(4);
  return cursor.HasEnded();
}

int YearOf(WallTime time) {
  return static_cast<int>(
      std::chrono::year_month_day(std::chrono::floor<std::chrono::days>(time)).year());
}

// "Sunday, 06-Nov-94 08:49:37 GMT", after the day's name.
bool ReadRfc850(DateCursor cursor, int yearNow, Calendar& calendar) {
  constexpr int kCentury = 100;
  constexpr int kFarthestFuture = 50;
  cursor.Skip(", ");
  calendar.day = cursor.Number(2);
  cursor.Skip("-");
  calendar.month = cursor.Month();
  cursor.Skip("-");
  calendar.year = yearNow - yearNow % kCentury + cursor.Number(2);
  if (calendar.year > yearNow + kFarthestFuture) {
    calendar.year -= kCentury;
  }
  cursor.Skip(" ");
  cursor.Time(calendar);
  cursor.Skip(" GMT");
  return cursor.HasEnded();
}

bool Read(std::string_view text, int yearNow, Calendar& calendar) {
  for (const std::string_view day : kLongDays) {
    if (text.starts_with(day)) {
      return ReadRfc850(DateCursor(text.substr(day.size())), yearNow, calendar);
    }
  }
  for (const std::string_view day : kLongDays) {
    if (text.starts_with(day.substr(0, kShortDay))) {
      const DateCursor cursor(text.substr(kShortDay));
      return ReadFixed(cursor, calendar) || ReadAsctime(cursor, calendar);
    }
  }
  return false;
}

}  // namespace

std::optional<WallTime> ParseHttpDate(std::string_view text, WallTime now) {
  constexpr int kLeapSecond = 60;
  Calendar calendar;
  if (!Read(text, YearOf(now), calendar)) {
    return std::nullopt;
  }
  const std::chrono::year_month_day date(std::chrono::year(calendar.year),
                                         std::chrono::month(calendar.month),
                                         std::chrono::day(static_cast<unsigned>(calendar.day)));
  if (!date.ok() || calendar.hour > 23 || calendar.minute > 59 || calendar.second > kLeapSecond) {
    return std::nullopt;
  }
  return std::chrono::sys_days(date) + std::chrono::hours(calendar.hour) +
         std::chrono::minutes(calendar.minute) + seconds(calendar.second);
}

milliseconds ParseRetryAfter(std::string_view text, WallTime peerNow) {
  constexpr seconds kLongest = std::chrono::hours(24 * 365);
  constexpr std::size_t kMostDigits = 8;  // more than a year
  if (!text.empty() && std::all_of(text.begin(), text.end(), IsDigit)) {
    text.remove_prefix(std::min(text.find_first_not_of('0'), text.size()));
    return text.size() > kMostDigits
               ? kLongest
               : std::min(kLongest, seconds(DateCursor(text).Number(text.size())));
  }
  const auto date = ParseHttpDate(text, peerNow);
  const milliseconds wait = date ? *date - peerNow : milliseconds(0);
  return std::clamp(wait, milliseconds(0), milliseconds(kLongest));
}

milliseconds EstimateClockOffset(WallTime date, WallTime sent, WallTime received) {
  // The peer's clock was at `date` or less than a second later, this system's between the two.
  const milliseconds least = date - received;
  const milliseconds most = date + seconds(1) - sent;
  if (least > milliseconds(0)) {
    return least;
  }
  return std::min(most, milliseconds(0));
}

std::string FormatWallTime(WallTime time) {
  constexpr long kMicroseconds = 1000;
  const long milliseconds = time.time_since_epoch().count();
  return Tarnik::System::DateTimeFromUtc(milliseconds * kMicroseconds, false).ToString();
}

}  // namespace SsoClient::Access
