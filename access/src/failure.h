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

/// A failure as records and messages of this library describe it. Copying needs no memory.
struct Reason {
  FailureKind kind = FailureKind::kNone;
  /// Without the password; never null in a reason that is set.
  std::shared_ptr<const std::string> text;

  bool IsSet() const noexcept { return text != nullptr; }
  /// Kind and text.
  std::string ToString() const;
};

/// The reason of a failed attempt. Without memory, its text says so.
Reason MakeReason(FailureKind kind, const std::string& text) noexcept;

/// An exception that several callers receive. Immutable once set; each caller gets a copy. Copying
/// this object needs no memory.
class Failure {
 public:
  Failure() = default;
  /// `exception` is not null. Without memory for a copy, all callers receive the same object.
  explicit Failure(const std::exception_ptr& exception) noexcept;
  /// The failure of an attempt, whose kind is known exactly.
  Failure(const std::exception_ptr& exception, Reason reason) noexcept;

  /// A copy of an exception of the platform or of the client; `OutOfMemory` without memory.
  static Failure Copy(const Tarnik::Exception& exception) noexcept;
  template <class Exception>
  static Failure Of(Exception exception) {
    Failure failure;
    failure.reason_.kind = Classify(exception);
    failure.exception_ = std::make_shared<Exception>(std::move(exception));
    return failure;
  }
  /// Needs no memory.
  static Failure OutOfMemory() noexcept;
  /// What a call receives that its caller has cancelled.
  static Failure Cancelled();
  /// The exception that is being handled.
  static Failure Current() noexcept { return Failure(std::current_exception()); }
  /// The result of `make`, which returns a failure; `OutOfMemory` without memory.
  template <class Make>
  static Failure Made(const Make& make) noexcept {
    try {
      return make();
    } catch (const std::bad_alloc&) {
      return OutOfMemory();
    }
  }

  bool IsSet() const noexcept { return exception_ != nullptr || foreign_ != nullptr; }
  [[noreturn]] void Throw() const;
  /// The exception for a callback: others than those of the platform and the client become an
  /// `SsoException`. Never null.
  std::shared_ptr<const Tarnik::Exception> ForCallback() const noexcept;
  std::string Message() const;
  /// For records: the text of the reason, or the message without control characters and at most
  /// 1000 bytes long.
  std::string RecordText() const;
  /// Kind and text as in records. Without memory, the text says so.
  Reason AsReason() const noexcept;
  /// That of the attempt; otherwise as far as the class determines it.
  FailureKind Kind() const noexcept { return reason_.kind; }
  Failure WithKind(FailureKind kind) const noexcept {
    Failure changed = *this;
    changed.reason_.kind = kind;
    return changed;
  }
  /// True for exceptions of `Class` and of derived classes.
  template <class Class>
  bool Is() const noexcept {
    return dynamic_cast<const Class*>(exception_.get()) != nullptr;
  }

 private:
  std::shared_ptr<const Tarnik::Exception> exception_;
  std::exception_ptr foreign_;
  Reason reason_;
};

/// What a caller receives.
struct Answer {
  std::shared_ptr<const SamlToken> token;  ///< null exactly if `failure` is set
  Failure failure;
};

}  // namespace SsoClient::Access

#endif
