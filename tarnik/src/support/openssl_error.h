#ifndef TARNIK_SUPPORT_OPENSSL_ERROR_H
#define TARNIK_SUPPORT_OPENSSL_ERROR_H

#include <string>
#include <string_view>

#include "support/openssl_section.h"

namespace Tarnik::OpenSsl {

/// A section that restores this thread's OpenSSL error queue: errors raised within the scope are
/// removed at its end, and errors of the host program stay.
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
  Section section_;
  unsigned long before_;
};

}  // namespace Tarnik::OpenSsl

#endif
