#ifndef TARNIK_SUPPORT_OPENSSL_ERROR_H
#define TARNIK_SUPPORT_OPENSSL_ERROR_H

#include <string>
#include <string_view>

namespace Tarnik::OpenSsl {

/// Restores this thread's OpenSSL error queue: errors raised within the scope are removed at its
/// end, and errors of the host program stay.
class ErrorScope {
 public:
  ErrorScope() noexcept;
  ~ErrorScope();
  ErrorScope(const ErrorScope&) = delete;
  ErrorScope& operator=(const ErrorScope&) = delete;

  /// `what`, then ": " and the reason of the latest error within the scope, if there is one, and a
  /// full stop.
  std::string Describe(std::string_view what) const;

 private:
  unsigned long before_;
};

}  // namespace Tarnik::OpenSsl

#endif
