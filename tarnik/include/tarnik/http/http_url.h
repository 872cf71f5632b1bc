#ifndef TARNIK_HTTP_HTTP_URL_H
#define TARNIK_HTTP_HTTP_URL_H

#include <string>
#include <string_view>

#include <tarnik/export.h>

namespace Tarnik::Http {

/// Splits an absolute http or https URL (RFC 3986; RFC 9110, section 4.2). `host` is a name, an
/// IPv4 address, or an IPv6 address without its brackets; `port` is the one written or 80 or 443;
/// `path` is the request target: path and query, "/" if the URL has none.
///
/// Throws `InvalidArgumentException`, naming the fault but not the URL, for another scheme, a
/// missing or malformed host (a name that a resolver would take for a number included), a port
/// outside 1 to 65535, user information, a fragment, blanks, control characters or non-ASCII bytes,
/// characters that must be percent-encoded, and malformed percent escapes; the outputs are then
/// unchanged.
TARNIK_EXPORT void ParseHttpURL(std::string_view url, bool& isHttps, std::string& host, int& port,
                                std::string& path);

}  // namespace Tarnik::Http

#endif
