#ifndef TARNIK_HTTP_COOKIE_STORE_H
#define TARNIK_HTTP_COOKIE_STORE_H

#include <string>
#include <string_view>

#include <tarnik/core/object.h>
#include <tarnik/core/ref.h>
#include <tarnik/system/date_time.h>

namespace Tarnik::Http {

/// Cookies in memory (RFC 6265). Thread-safe. Stores at most 50 cookies per domain and 300 in
/// total, of at most 4096 bytes each; the oldest are removed first.
class TARNIK_EXPORT CookieStore : public virtual Object {
 public:
  /// Stores the cookie of a Set-Cookie header that `host` sent in the answer to a request for
  /// `path`. Ignores a cookie for another domain, without a name, with control characters, and a
  /// Secure cookie that was received over plain HTTP (RFC 6265, sections 5.2 and 5.3).
  virtual void Store(std::string_view host, std::string_view path, bool isSecure,
                     std::string_view setCookie, const System::DateTime& now) = 0;
  /// The Cookie header for a request (RFC 6265, section 5.4); empty when there is nothing to send.
  virtual std::string HeaderFor(std::string_view host, std::string_view path, bool isSecure,
                                const System::DateTime& now) = 0;
};

/// A new, empty store. `name` is a label for diagnostics and may be empty.
TARNIK_EXPORT Ref<CookieStore> CreateCookieStore(const std::string& name);

}  // namespace Tarnik::Http

#endif
