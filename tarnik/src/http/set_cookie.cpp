#include "http/set_cookie.h"

#include <algorithm>

#include <tarnik/text/string_util.h>

#include "http/cookie_date.h"
#include "http/field_syntax.h"
#include "support/ascii.h"

namespace Tarnik::Http {
namespace {

constexpr long kMicrosecondsPerSecond = 1000000;

struct NameAndValue {
  std::string_view name;
  std::string_view value;
  bool hasValue;
};

bool HasControl(std::string_view text) {
  return std::any_of(text.begin(), text.end(), IsControl);
}

/// Removes the text before the next semicolon from `header` and splits it at its first "=".
NameAndValue TakePair(std::string_view& header) {
  const auto end = std::min(header.find(';'), header.size());
  const std::string_view pair = header.substr(0, end);
  header.remove_prefix(std::min(end + 1, header.size()));
  const auto equals = pair.find('=');
  if (equals == std::string_view::npos) {
    return {TrimBlanks(pair), {}, false};
  }
  return {TrimBlanks(pair.substr(0, equals)), TrimBlanks(pair.substr(equals + 1)), true};
}

/// RFC 6265, section 5.2.2: zero or less expires immediately. Nothing when `text` is not a number.
std::optional<long> ParseMaxAge(std::string_view text) {
  const bool isNegative = !text.empty() && text.front() == '-';
  if (isNegative) {
    text.remove_prefix(1);
  }
  if (!AreDigits(text)) {
    return std::nullopt;
  }
  long seconds = 0;
  for (const char c : text) {
    seconds = System::SaturatingAdd(System::SaturatingMultiply(seconds, 10), c - '0');
  }
  return isNegative ? 0 : seconds;
}

class AttributeReader {
 public:
  AttributeReader(SetCookie& cookie, const System::DateTime& now) : cookie_(cookie), now_(now) {}

  void Read(std::string_view name, std::string_view value) {
    if (EqualsIgnoringCase(name, "Expires")) {
      TakeExpires(value);
    } else if (EqualsIgnoringCase(name, "Max-Age")) {
      TakeMaxAge(value);
    } else if (EqualsIgnoringCase(name, "Domain")) {
      TakeDomain(value);
    } else if (EqualsIgnoringCase(name, "Path")) {
      cookie_.path = !value.empty() && value.front() == '/' ? std::string(value) : std::string();
    } else if (EqualsIgnoringCase(name, "Secure")) {
      cookie_.isSecure = true;
    }
  }

 private:
  void TakeExpires(std::string_view value) {
    // RFC 6265, section 5.3, step 3: Max-Age takes precedence, before or after Expires.
    if (const auto date = ParseCookieDate(value); date && !hasMaxAge_) {
      cookie_.expiry = date;
    }
  }

  void TakeMaxAge(std::string_view value) {
    const auto seconds = ParseMaxAge(value);
    if (!seconds) {
      return;
    }
    hasMaxAge_ = true;
    const long microseconds = System::SaturatingMultiply(*seconds, kMicrosecondsPerSecond);
    cookie_.expiry =
        System::DateTimeFromUtc(System::SaturatingAdd(now_.GetUtcTime(), microseconds), false);
  }

  void TakeDomain(std::string_view value) {
    if (value.empty()) {
      return;
    }
    if (value.front() == '.') {
      value.remove_prefix(1);
    }
    cookie_.domain = StringUtil::ToLower(value);
  }

  SetCookie& cookie_;
  const System::DateTime& now_;
  bool hasMaxAge_ = false;
};

}  // namespace

std::optional<SetCookie> ParseSetCookie(std::string_view header, const System::DateTime& now) {
  if (header.size() > kMaxCookieBytes ||
      std::any_of(header.begin(), header.end(), [](char c) { return IsControl(c) && c != '\t'; })) {
    return std::nullopt;
  }
  const NameAndValue pair = TakePair(header);
  if (!pair.hasValue || pair.name.empty() || HasControl(pair.name) || HasControl(pair.value)) {
    return std::nullopt;
  }
  SetCookie cookie;
  cookie.name = pair.name;
  cookie.value = pair.value;
  AttributeReader attributes(cookie, now);
  while (!header.empty()) {
    const NameAndValue attribute = TakePair(header);
    attributes.Read(attribute.name, attribute.value);
  }
  return cookie;
}

}  // namespace Tarnik::Http
