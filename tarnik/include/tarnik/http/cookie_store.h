#ifndef TARNIK_HTTP_COOKIE_STORE_H
#define TARNIK_HTTP_COOKIE_STORE_H

#include <string>
#include <string_view>

#include <tarnik/core/object.h>
#include <tarnik/core/ref.h>
#include <tarnik/system/date_time.h>

namespace Tarnik::Http {

/// Cookies in memory (RFC 6265). Safe from many threads. Holds at most 50 cookies of 4096 bytes a
/// host and 300 in all; the oldest go first.
class TARNIK_EXPORT CookieStore : public virtual Object {
 public:
  /// Takes a Set-Cookie header that `host` answered to a request for `path`. What RFC 6265
  /// section 5.3 says to ignore is ignored: another domain, control characters, a name-less cookie,
  /// a Secure one over plain HTTP.
  virtual void Store(std::string_view host, std::string_view path, bool isSecure,
                     std::string_view setCookie, const System::DateTime& now) = 0;
  /// The Cookie header for a request (RFC 6265 section 5.4); empty when there is nothing to send.
  virtual std::string HeaderFor(std::string_view host, std::string_view path, bool isSecure,
                                const System::DateTime& now) = 0;
};

/// A new, empty store. `name` is a label for diagnostics and may be empty.
TARNIK_EXPORT Ref<CookieStore> CreateCookieStore(const std::string& name);

}  // namespace Tarnik::Http

#endif
