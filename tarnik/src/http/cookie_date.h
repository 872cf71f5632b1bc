#ifndef TARNIK_HTTP_COOKIE_DATE_H
#define TARNIK_HTTP_COOKIE_DATE_H

#include <optional>
#include <string_view>

#include <tarnik/system/date_time.h>

namespace Tarnik::Http {

/// Reads a date as cookies carry it, in any of the forms of the wild (RFC 6265, section 5.1.1).
std::optional<System::DateTime> ParseCookieDate(std::string_view text);

}  // namespace Tarnik::Http

#endif
