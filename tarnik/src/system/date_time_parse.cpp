#include <chrono>

#include <tarnik/core/exception.h>
#include <tarnik/system/date_time.h>

#include "support/ascii.h"

namespace Tarnik::System {
namespace {

constexpr long kMinuteInMicroseconds = 60'000'000;
constexpr int kMaxBiasMinutes = 14 * 60;

[[noreturn]] void Refuse(const char* reason) {
  throw DateTimeFormatException(std::string("Not a date and time: ") + reason);
}

// Reads text from front to back; unexpected characters are errors.
class Scanner {
 public:
  explicit Scanner(std::string_view text) : rest_(text) {}

  bool IsAtEnd() const { return rest_.empty(); }
  bool Skip(char c) {
    if (rest_.empty() || rest_.front() != c) {
      return false;
    }
    rest_.remove_prefix(1);
    return true;
  }
  void Expect(char c, const char* reason) {
    if (!Skip(c)) {
      Refuse(reason);
    }
  }
  bool IsAtDigit() const { return !rest_.empty() && IsDigit(rest_.front()); }
  int Digit(const char* reason) {
    if (!IsAtDigit()) {
      Refuse(reason);
    }
    const int digit = rest_.front() - '0';
    rest_.remove_prefix(1);
    return digit;
  }
  int TwoDigits(const char* reason) {
    const int tens = Digit(reason);
    return 10 * tens + Digit(reason);
  }

 private:
  std::string_view rest_;
};

long ReadDate(Scanner& scanner) {
  const int century = scanner.TwoDigits("the year must have four digits.");
  const int year = 100 * century + scanner.TwoDigits("the year must have four digits.");
  scanner.Expect('-', "a hyphen must follow the year.");
  const int month = scanner.TwoDigits("the month must have two digits.");
  scanner.Expect('-', "a hyphen must follow the month.");
  const int day = scanner.TwoDigits("the day must have two digits.");
  const std::chrono::year_month_day date{std::chrono::year(year),
                                         std::chrono::month(static_cast<unsigned>(month)),
                                         std::chrono::day(static_cast<unsigned>(day))};
  if (year == 0) {
    Refuse("there is no year 0000.");
  }
  if (!date.ok()) {
    Refuse("there is no such day.");
  }
  return std::chrono::microseconds(std::chrono::sys_days(date).time_since_epoch()).count();
}

int ReadFraction(Scanner& scanner) {
  if (!scanner.Skip('.')) {
    return 0;
  }
  int fraction = scanner.Digit("digits must follow the decimal point.") * 100'000;
  for (int unit = 10'000; scanner.IsAtDigit(); unit /= 10) {
    fraction += scanner.Digit("digits must follow the decimal point.") * unit;
  }
  return fraction;
}

long ReadTime(Scanner& scanner) {
  const int hour = scanner.TwoDigits("the hour must have two digits.");
  scanner.Expect(':', "a colon must follow the hour.");
  const int minute = scanner.TwoDigits("the minute must have two digits.");
  scanner.Expect(':', "a colon must follow the minute.");
  const int second = scanner.TwoDigits("the second must have two digits.");
  const int microsecond = ReadFraction(scanner);
  const bool isEndOfDay = hour == 24 && minute == 0 && second == 0 && microsecond == 0;
  if (minute > 59 || second > 59 || (hour > 23 && !isEndOfDay)) {
    Refuse("there is no such time of day.");
  }
  return ((hour * 60L + minute) * 60L + second) * 1'000'000L + microsecond;
}

int ReadBias(Scanner& scanner) {
  if (scanner.IsAtEnd() || scanner.Skip('Z')) {
    return 0;
  }
  const bool isNegative = scanner.Skip('-');
  if (!isNegative) {
    scanner.Expect('+', "the zone must be Z, +hh:mm or -hh:mm.");
  }
  const int hours = scanner.TwoDigits("the zone must be Z, +hh:mm or -hh:mm.");
  scanner.Expect(':', "the zone must be Z, +hh:mm or -hh:mm.");
  const int minutes = scanner.TwoDigits("the zone must be Z, +hh:mm or -hh:mm.");
  const int bias = hours * 60 + minutes;
  if (minutes > 59 || bias > kMaxBiasMinutes) {
    Refuse("zones reach from -14:00 to +14:00.");
  }
  return isNegative ? -bias : bias;
}

}  // namespace

DateTime DateTime::Parse(std::string_view text) {
  Scanner scanner(text);
  const long date = ReadDate(scanner);
  scanner.Expect('T', "the letter T must follow the date.");
  const long time = ReadTime(scanner);
  const int bias = ReadBias(scanner);
  if (!scanner.IsAtEnd()) {
    Refuse("something follows it.");
  }
  const long utc = date + time - bias * kMinuteInMicroseconds;
  const DateTime result(utc, bias);
  if (result.GetUtcTime() != utc) {
    Refuse("in UTC it lies outside the years 0001 to 9999.");
  }
  return result;
}

}  // namespace Tarnik::System
