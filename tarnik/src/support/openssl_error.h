#ifndef TARNIK_SUPPORT_OPENSSL_ERROR_H
#define TARNIK_SUPPORT_OPENSSL_ERROR_H

#include <string>
#include <string_view>
#include <vector>

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
  /// full stop. The reason is "not enough memory" when an earlier error was a failed allocation.
  /// Called once, since it may take the errors out of the queue.
  std::string Describe(std::string_view what) const;

 private:
  Section section_;
  unsigned long before_;
};

/// What a failed operation of OpenSSL reported.
struct ErrorReport {
  unsigned long cause = 0;  ///< the earliest error; 0 when nothing was reported
  bool isOutOfMemory = false;
};

/// An empty OpenSSL error queue of this thread, so that all errors of an operation can be examined
/// when it has failed. The errors that the queue held before are put back at the end.
class FreshErrors {
 public:
  FreshErrors();
  ~FreshErrors();
  FreshErrors(const FreshErrors&) = delete;
  FreshErrors& operator=(const FreshErrors&) = delete;

  /// Takes the errors out of the queue.
  ErrorReport Take() const noexcept;

 private:
  struct Saved {
    unsigned long code;
    std::string file;
    int line;
    std::string function;
    std::string text;
  };
  Section section_;
  std::vector<Saved> saved_;
};

/// The words for an error of OpenSSL, or null when it has none. A failed allocation is "not enough
/// memory".
const char* ReasonOf(unsigned long error) noexcept;

}  // namespace Tarnik::OpenSsl

#endif
