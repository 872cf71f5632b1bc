#include "value_model.h"

#include <algorithm>
#include <array>
#include <limits>
#include <regex>
#include <string_view>

#include <openssl/evp.h>

namespace Fuzz {
namespace {

constexpr long kSecond = 1'000'000;
constexpr long kMinute = 60 * kSecond;
constexpr long kDay = 24 * 60 * kMinute;
constexpr std::size_t kPointPlace = 19;

bool IsLeapYear(int year) {
  return year % 4 == 0 && (year % 100 != 0 || year % 400 == 0);
}

int DaysOfMonth(int year, int month) {
  constexpr std::array kDays{31, 28, 31, 30, 31, 30, 31, 31, 30, 31, 30, 31};
  return month == 2 && IsLeapYear(year) ? 29 : kDays[static_cast<std::size_t>(month) - 1];
}

// Days from 0001-01-01 to the first day of the year.
long DaysBefore(int year) {
  const long past = year - 1;
  return past * 365 + past / 4 - past / 100 + past / 400;
}

// Days from 1970-01-01; the date exists.
long DayNumber(int year, int month, int day) {
  long days = DaysBefore(year) - DaysBefore(1970) + day - 1;
  for (int past = 1; past < month; ++past) {
    days += DaysOfMonth(year, past);
  }
  return days;
}

// The digits after a decimal point in its place; empty if there are none.
std::string FractionOf(const std::string& text) {
  if (text.size() <= kPointPlace || text[kPointPlace] != '.') {
    return "";
  }
  const std::size_t end = text.find_first_not_of("0123456789", kPointPlace + 1);
  return text.substr(kPointPlace + 1, end == std::string::npos ? end : end - kPointPlace - 1);
}

std::string WithoutFraction(std::string text) {
  const std::size_t digits = FractionOf(text).size();
  return digits == 0 ? text : text.erase(kPointPlace, digits + 1);
}

long MicrosecondsOf(std::string digits) {
  digits.resize(6, '0');
  return std::stol(digits);
}

std::optional<long> BiasOf(const std::smatch& parts) {
  if (parts[7].length() == 0) {
    return 0;
  }
  const int hours = std::stoi(parts[8]);
  const int minutes = std::stoi(parts[9]);
  if (hours > 14 || minutes > 59 || (hours == 14 && minutes > 0)) {
    return std::nullopt;
  }
  return (parts[7] == "-" ? -1 : 1) * (hours * 60 + minutes) * kMinute;
}

std::optional<long> TimeOf(const std::smatch& parts, long microseconds) {
  const int hour = std::stoi(parts[4]);
  const int minute = std::stoi(parts[5]);
  const int second = std::stoi(parts[6]);
  const long time = (hour * 60 + minute) * kMinute + second * kSecond + microseconds;
  const bool isInRange = minute < 60 && second < 60 && time <= kDay;
  return isInRange && (hour < 24 || time == kDay) ? std::optional(time) : std::nullopt;
}

}  // namespace

std::optional<long> DateOf(const std::string& text) {
  static const std::regex form(
      R"((\d{4})-(\d\d)-(\d\d)T(\d\d):(\d\d):(\d\d)(?:Z|([+-])(\d\d):(\d\d))?)");
  const std::string fraction = FractionOf(text);
  const std::string whole = WithoutFraction(text);
  std::smatch parts;
  if (whole.size() > 25 || !std::regex_match(whole, parts, form)) {
    return std::nullopt;
  }
  const int year = std::stoi(parts[1]);
  const int month = std::stoi(parts[2]);
  const int day = std::stoi(parts[3]);
  if (year < 1 || month < 1 || month > 12 || day < 1 || day > DaysOfMonth(year, month)) {
    return std::nullopt;
  }
  const auto time = TimeOf(parts, MicrosecondsOf(fraction));
  const auto bias = BiasOf(parts);
  if (!time || !bias) {
    return std::nullopt;
  }
  const long instant = DayNumber(year, month, day) * kDay + *time - *bias;
  const bool isInRange =
      instant >= DayNumber(1, 1, 1) * kDay && instant < DayNumber(10000, 1, 1) * kDay;
  return isInRange ? std::optional(instant) : std::nullopt;
}

std::optional<std::vector<unsigned char>> BytesOf(const std::string& text) {
  constexpr std::string_view kSymbols =
      "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/";
  std::vector<unsigned char> bytes;
  unsigned bits = 0;
  unsigned count = 0;
  std::size_t length = 0;
  std::size_t padding = 0;
  for (const char c : text) {
    if (c == ' ' || c == '\t' || c == '\r' || c == '\n') {
      continue;
    }
    ++length;
    if (c == '=') {
      ++padding;
      continue;
    }
    const std::size_t value = kSymbols.find(c);
    if (value == std::string_view::npos || padding > 0) {
      return std::nullopt;
    }
    bits = (bits << 6 | static_cast<unsigned>(value)) & 0xFFFF;
    count += 6;
    if (count >= 8) {
      count -= 8;
      bytes.push_back(static_cast<unsigned char>(bits >> count));
    }
  }
  const bool isWhole = length % 4 == 0 && padding <= 2 && count == padding * 2;
  return isWhole && (bits & ((1U << count) - 1)) == 0 ? std::optional(bytes) : std::nullopt;
}

std::string Base64Of(const unsigned char* bytes, std::size_t size) {
  std::string text(4 * ((size + 2) / 3) + 1, '\0');
  text.resize(static_cast<std::size_t>(EVP_EncodeBlock(
      reinterpret_cast<unsigned char*>(text.data()), bytes, static_cast<int>(size))));
  return text;
}

std::string Base64Of(const std::string& bytes) {
  return Base64Of(reinterpret_cast<const unsigned char*>(bytes.data()), bytes.size());
}

std::optional<unsigned long> CountOf(const std::string& text) {
  const std::size_t begin = !text.empty() && (text[0] == '+' || text[0] == '-') ? 1 : 0;
  if (text.size() == begin) {
    return std::nullopt;
  }
  unsigned long count = 0;
  for (const char c : text.substr(begin)) {
    if (c < '0' || c > '9' || count > std::numeric_limits<unsigned>::max()) {
      return std::nullopt;
    }
    count = count * 10 + static_cast<unsigned long>(c - '0');
  }
  const bool isInRange = count <= std::numeric_limits<unsigned>::max();
  return isInRange && (count == 0 || text[0] != '-') ? std::optional(count) : std::nullopt;
}

std::optional<bool> BooleanOf(const std::string& text) {
  const std::string lower = LowerCaseOf(text);
  if (lower == "true" || lower == "1") {
    return true;
  }
  return lower == "false" || lower == "0" ? std::optional(false) : std::nullopt;
}

std::string LowerCaseOf(std::string text) {
  std::transform(text.begin(), text.end(), text.begin(), [](char c) {
    return c >= 'A' && c <= 'Z' ? static_cast<char>(c - 'A' + 'a') : c;
  });
  return text;
}

std::string Trimmed(const std::string& text) {
  const std::size_t begin = text.find_first_not_of(" \t\r\n");
  return begin == std::string::npos
             ? ""
             : text.substr(begin, text.find_last_not_of(" \t\r\n") - begin + 1);
}

}  // namespace Fuzz
