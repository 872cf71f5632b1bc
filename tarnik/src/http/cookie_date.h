#ifndef TARNIK_HTTP_COOKIE_DATE_H
#define TARNIK_HTTP_COOKIE_DATE_H

#include <optional>
#include <string_view>

#include <tarnik/system/date_time.h>

namespace Tarnik::Http {

/// Parses the date of a cookie in any of the forms that servers send (RFC 6265, section 5.1.1).
/// Nothing when the text is not a date.
std::optional<System::DateTime> ParseCookieDate(std::string_view text);

}  // namespace Tarnik::Http

#endif
