#include "xml/schema_values.h"

#include <algorithm>
#include <array>
#include <cstdio>
#include <regex>

#include <libxml/xmlstring.h>
#include <openssl/evp.h>

#include "devsts/xml_security.h"

namespace DevSts {
namespace {

using std::chrono::days;
using std::chrono::floor;
using std::chrono::hours;
using std::chrono::milliseconds;
using std::chrono::minutes;
using std::chrono::seconds;

milliseconds FractionOf(std::string digits) {
  digits.resize(3, '0');
  return milliseconds(std::stoi(digits));
}

std::optional<minutes> OffsetOf(const std::string& zone) {
  if (zone == "Z") {
    return minutes(0);
  }
  const minutes offset =
      hours(std::stoi(zone.substr(1, 2))) + minutes(std::stoi(zone.substr(4, 2)));
  if (offset > hours(14) || std::stoi(zone.substr(4, 2)) > 59) {
    return std::nullopt;
  }
  return zone.front() == '-' ? -offset : offset;
}

}  // namespace

bool IsUtf8(const std::string& text) {
  return text.find('\0') == std::string::npos &&
         xmlCheckUTF8(reinterpret_cast<const unsigned char*>(text.c_str())) == 1;
}

std::string ToBase64(const Octets& octets) {
  std::string text(4 * ((octets.size() + 2) / 3) + 1, '\0');
  const int size = EVP_EncodeBlock(reinterpret_cast<unsigned char*>(text.data()), octets.data(),
                                   static_cast<int>(octets.size()));
  text.resize(static_cast<std::size_t>(size));
  return text;
}

Octets FromBase64(std::string text) {
  std::erase_if(text, [](char c) { return c == ' ' || c == '\t' || c == '\r' || c == '\n'; });
  const auto padding = static_cast<std::size_t>(std::count(text.begin(), text.end(), '='));
  Octets octets(text.size() / 4 * 3);
  const int size =
      EVP_DecodeBlock(octets.data(), reinterpret_cast<const unsigned char*>(text.data()),
                      static_cast<int>(text.size()));
  if (size < 0 || padding > 2 || text.size() % 4 != 0 || text.find('=') < text.size() - padding) {
    throw XmlError("not Base64");
  }
  octets.resize(static_cast<std::size_t>(size) - padding);
  return octets;
}

Time Now() {
  return floor<milliseconds>(std::chrono::system_clock::now());
}

std::string TimeToText(Time time) {
  const auto day = floor<days>(time);
  const std::chrono::year_month_day date(day);
  const std::chrono::hh_mm_ss clock(time - day);
  std::array<char, 64> text{};
  std::snprintf(text.data(), text.size(), "%04d-%02u-%02uT%02d:%02d:%02d.%03dZ",
                static_cast<int>(date.year()), static_cast<unsigned>(date.month()),
                static_cast<unsigned>(date.day()), static_cast<int>(clock.hours().count()),
                static_cast<int>(clock.minutes().count()),
                static_cast<int>(clock.seconds().count()),
                static_cast<int>(clock.subseconds().count()));
  return text.data();
}

std::optional<Time> TimeFromText(std::string_view text) {
  // Never destroyed: a server may still answer while the process destroys its static objects.
  static const std::regex& kForm =
      *new std::regex(R"((\d{4})-(\d\d)-(\d\d)T(\d\d):(\d\d):(\d\d)(?:\.(\d+))?(Z|[+-]\d\d:\d\d))");
  std::match_results<std::string_view::const_iterator> match;
  if (text.size() > 64 || !std::regex_match(text.begin(), text.end(), match, kForm)) {
    return std::nullopt;
  }
  const auto number = [&match](std::size_t group) { return std::stoi(match[group].str()); };
  const std::chrono::year_month_day date(std::chrono::year(number(1)),
                                         std::chrono::month(static_cast<unsigned>(number(2))),
                                         std::chrono::day(static_cast<unsigned>(number(3))));
  const std::optional<minutes> offset = OffsetOf(match[8].str());
  if (!date.ok() || !offset || number(4) > 23 || number(5) > 59 || number(6) > 59) {
    return std::nullopt;
  }
  return std::chrono::sys_days(date) + hours(number(4)) + minutes(number(5)) + seconds(number(6)) +
         FractionOf(match[7].str()) - *offset;
}

}  // namespace DevSts
