#include <algorithm>
#include <chrono>
#include <cstdio>
#include <ctime>
#include <limits>

#include <tarnik/system/date_time.h>

namespace Tarnik::System {
namespace {

using std::chrono::days;
using std::chrono::floor;
using std::chrono::microseconds;
using std::chrono::sys_days;
using std::chrono::year_month_day;

constexpr long kMicrosecondsPerSecond = 1'000'000;
constexpr long kMicrosecondsPerMinute = 60 * kMicrosecondsPerSecond;

constexpr long StartOf(int year) {
  using namespace std::chrono;
  return microseconds(sys_days(std::chrono::year(year) / January / 1).time_since_epoch()).count();
}

constexpr long kFirst = StartOf(1);
constexpr long kLast = StartOf(10000) - 1;

int LocalBias(long utcMicroseconds) {
  const std::time_t seconds = utcMicroseconds / kMicrosecondsPerSecond;
  std::tm local{};
  if (localtime_r(&seconds, &local) == nullptr) {
    return 0;
  }
  return static_cast<int>(local.tm_gmtoff / 60);
}

}  // namespace

DateTime::DateTime(long utcMicroseconds, int biasMinutes) noexcept
    : utcMicroseconds_(std::clamp(utcMicroseconds, kFirst, kLast)), biasMinutes_(biasMinutes) {
  const long local = utcMicroseconds_ + biasMinutes_ * kMicrosecondsPerMinute;
  if (local < kFirst || local > kLast) {
    biasMinutes_ = 0;
  }
}

DateTime::Fields DateTime::GetFields() const noexcept {
  const microseconds local(utcMicroseconds_ + biasMinutes_ * kMicrosecondsPerMinute);
  const days sinceEpoch = floor<days>(local);
  const year_month_day date{sys_days(sinceEpoch)};
  const long inDay = (local - sinceEpoch).count();
  const long second = inDay / kMicrosecondsPerSecond;
  const auto fraction = static_cast<int>(inDay % kMicrosecondsPerSecond);
  const int year = static_cast<int>(date.year());
  return {year / 100,
          year % 100,
          static_cast<int>(static_cast<unsigned>(date.month())),
          static_cast<int>(static_cast<unsigned>(date.day())),
          static_cast<int>(second / 3600),
          static_cast<int>(second / 60 % 60),
          static_cast<int>(second % 60),
          fraction / 1000,
          fraction % 1000};
}

std::string DateTime::ToString() const {
  const Fields fields = GetFields();
  char text[48];
  int length = std::snprintf(text, sizeof text, "%02d%02d-%02d-%02dT%02d:%02d:%02d.%03d",
                             fields.century, fields.yearOfCentury, fields.month, fields.day,
                             fields.hour, fields.minute, fields.second, fields.millisecond);
  std::string result(text, static_cast<std::size_t>(length));
  if (fields.microsecond != 0) {
    length = std::snprintf(text, sizeof text, "%03d", fields.microsecond);
    result.append(text, static_cast<std::size_t>(length));
  }
  return result + ToShortStringBias();
}

std::string DateTime::ToShortStringBias() const {
  if (biasMinutes_ == 0) {
    return "Z";
  }
  const int minutes = biasMinutes_ < 0 ? -biasMinutes_ : biasMinutes_;
  char text[16];
  const int length = std::snprintf(text, sizeof text, "%c%02d:%02d", biasMinutes_ < 0 ? '-' : '+',
                                   minutes / 60, minutes % 60);
  return {text, static_cast<std::size_t>(length)};
}

DateTime DateTimeFromUtc(long utcMicroseconds, bool inLocalZone) {
  return {utcMicroseconds, inLocalZone ? LocalBias(utcMicroseconds) : 0};
}

DateTime GetUtcDateTime() {
  const auto now = std::chrono::system_clock::now().time_since_epoch();
  return DateTimeFromUtc(std::chrono::duration_cast<microseconds>(now).count(), false);
}

long SaturatingAdd(long a, long b) noexcept {
  long result = 0;
  if (!__builtin_add_overflow(a, b, &result)) {
    return result;
  }
  return b > 0 ? std::numeric_limits<long>::max() : std::numeric_limits<long>::min();
}

long SaturatingMultiply(long a, long b) noexcept {
  long result = 0;
  if (!__builtin_mul_overflow(a, b, &result)) {
    return result;
  }
  return (a > 0) == (b > 0) ? std::numeric_limits<long>::max() : std::numeric_limits<long>::min();
}

}  // namespace Tarnik::System
