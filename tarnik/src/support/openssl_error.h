#ifndef TARNIK_SUPPORT_OPENSSL_ERROR_H
#define TARNIK_SUPPORT_OPENSSL_ERROR_H

#include <string>
#include <string_view>

namespace Tarnik::OpenSsl {

/// Keeps this thread's OpenSSL error queue as it was found: errors raised while the scope lives are
/// gone afterwards, those of the host program stay.
class ErrorScope {
 public:
  ErrorScope() noexcept;
  ~ErrorScope();
  ErrorScope(const ErrorScope&) = delete;
  ErrorScope& operator=(const ErrorScope&) = delete;

  /// `what` followed by ": " and the reason of the latest error, if OpenSSL gave one, and a full
  /// stop.
  std::string Describe(std::string_view what) const;

 private:
  unsigned long before_;
};

}  // namespace Tarnik::OpenSsl

#endif
