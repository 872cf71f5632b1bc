#ifndef TARNIK_HTTP_SET_COOKIE_H
#define TARNIK_HTTP_SET_COOKIE_H

#include <optional>
#include <string>
#include <string_view>

#include <tarnik/system/date_time.h>

namespace Tarnik::Http {

/// The longest Set-Cookie header that is accepted (RFC 6265, section 6.1).
inline constexpr std::size_t kMaxCookieBytes = 4096;

/// The content of a Set-Cookie header, not yet validated against the request.
struct SetCookie {
  std::string name;
  std::string value;
  /// Lower case, without its leading dot; empty when not given.
  std::string domain;
  /// Empty when not given or not absolute.
  std::string path;
  /// When the cookie expires; nothing for one that lives as long as the store.
  std::optional<System::DateTime> expiry;
  bool isSecure = false;
};

/// Parses a Set-Cookie header (RFC 6265, section 5.2). Nothing for a header without a name, with
/// control characters, or longer than `kMaxCookieBytes`.
std::optional<SetCookie> ParseSetCookie(std::string_view header, const System::DateTime& now);

}  // namespace Tarnik::Http

#endif
