#ifndef TARNIK_HTTP_SET_COOKIE_H
#define TARNIK_HTTP_SET_COOKIE_H

#include <optional>
#include <string>
#include <string_view>

#include <tarnik/system/date_time.h>

namespace Tarnik::Http {

/// What one cookie, its attributes included, may hold (RFC 6265, section 6.1).
inline constexpr std::size_t kMaxCookieBytes = 4096;

/// A Set-Cookie header, read but not yet judged.
struct SetCookie {
  std::string name;
  std::string value;
  /// Lower case, without its leading dot; empty when not given.
  std::string domain;
  /// Empty when not given or not absolute.
  std::string path;
  /// The instant from which the cookie is gone; none for one that lives as long as the store.
  std::optional<System::DateTime> expiry;
  bool isSecure = false;
};

/// Reads a Set-Cookie header (RFC 6265, section 5.2). None for one without a name, with control
/// characters, or longer than `kMaxCookieBytes`.
std::optional<SetCookie> ParseSetCookie(std::string_view header, const System::DateTime& now);

}  // namespace Tarnik::Http

#endif
