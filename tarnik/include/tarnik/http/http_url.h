#ifndef TARNIK_HTTP_HTTP_URL_H
#define TARNIK_HTTP_HTTP_URL_H

#include <string>
#include <string_view>

#include <tarnik/export.h>

namespace Tarnik::Http {

/// Splits an absolute http or https URL (RFC 3986; RFC 9110, section 4.2). `host` is a name, with
/// the full stop of the DNS root at its end if the URL has it, an IPv4 address, or an IPv6 address
/// without its brackets; `port` is the port of the URL, or 80 or 443 if it has none; `path` is the
/// request target: path and query, "/" if the URL has no path.
///
/// Throws `InvalidArgumentException`, whose message states the fault but not the URL, for another
/// scheme, a missing or malformed host (including a name that a resolver would read as a number), a
/// port outside 1 to 65535, user information, a fragment, blanks, control characters or non-ASCII
/// bytes, characters that must be percent-encoded, and malformed percent escapes; the outputs are
/// then unchanged.
TARNIK_EXPORT void ParseHttpURL(std::string_view url, bool& isHttps, std::string& host, int& port,
                                std::string& path);

}  // namespace Tarnik::Http

#endif
