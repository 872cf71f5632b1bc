#ifndef SSOCLIENT_ACCESS_FAILURE_H
#define SSOCLIENT_ACCESS_FAILURE_H

#include <exception>
#include <memory>
#include <string>
#include <utility>

#include <ssoclient/access/failure_kind.h>
#include <ssoclient/saml_token.h>
#include <tarnik/core/exception.h>

namespace SsoClient::Access {

/// An exception that several callers receive. Immutable once set; each caller gets a copy.
class Failure {
 public:
  Failure() = default;
  explicit Failure(const std::exception_ptr& exception);

  /// A copy of an exception of the platform or of the client.
  static Failure Copy(const Tarnik::Exception& exception);
  template <class Exception>
  static Failure Of(Exception exception) {
    Failure failure;
    failure.exception_ = std::make_shared<Exception>(std::move(exception));
    return failure;
  }
  /// Needs no memory.
  static Failure OutOfMemory() noexcept;
  /// The exception that is being handled.
  static Failure Current() { return Failure(std::current_exception()); }

  bool IsSet() const noexcept { return exception_ != nullptr || foreign_ != nullptr; }
  [[noreturn]] void Throw() const;
  /// The exception for a callback: others than those of the platform and the client become an
  /// `SsoException`. Never null.
  std::shared_ptr<const Tarnik::Exception> ForCallback() const noexcept;
  std::string Message() const;
  /// As far as the class determines it.
  FailureKind Kind() const noexcept;

 private:
  std::shared_ptr<const Tarnik::Exception> exception_;
  std::exception_ptr foreign_;
};

/// What a caller receives.
struct Answer {
  std::shared_ptr<const SamlToken> token;  ///< null exactly if `failure` is set
  Failure failure;
};

}  // namespace SsoClient::Access

#endif
