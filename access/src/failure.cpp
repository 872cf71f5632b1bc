#include "failure.h"

#include <new>

#include <ssoclient/exceptions.h>

#include "secret_text.h"

namespace SsoClient::Access {

namespace {

// `Clone` returns the base class.
std::shared_ptr<const Tarnik::Exception> CopyOf(const Tarnik::Exception& exception) {
  return std::dynamic_pointer_cast<const Tarnik::Exception>(
      std::shared_ptr<const Tarnik::Throwable>(exception.Clone()));
}

// One that is not destroyed.
std::shared_ptr<const Tarnik::Exception> SharedOutOfMemory() noexcept {
  return {std::shared_ptr<void>(), &Tarnik::OutOfMemory()};
}

std::shared_ptr<const std::string> TextWithoutMemory() noexcept {
  static const std::string kText = "no memory";
  return {std::shared_ptr<void>(), &kText};
}

std::string TextOf(const std::exception_ptr& foreign) {
  try {
    std::rethrow_exception(foreign);
  } catch (const std::exception& exception) {
    return exception.what();
  } catch (...) {
    return "A function of the login has thrown an object that is not an exception.";
  }
}

// What a callback receives for an exception that is not kept as a copy.
std::shared_ptr<const Tarnik::Exception> Convert(const std::exception_ptr& foreign) {
  try {
    std::rethrow_exception(foreign);
  } catch (const std::bad_alloc&) {
    return SharedOutOfMemory();
  } catch (const Tarnik::Exception& known) {
    return CopyOf(known);
  } catch (...) {
    return std::make_shared<const SsoException>(TextOf(foreign));
  }
}

}  // namespace

std::string Reason::ToString() const {
  return std::string(NameOf(kind)) + ": " + *text;
}

Reason MakeReason(FailureKind kind, const std::string& text) noexcept {
  try {
    return {kind, std::make_shared<const std::string>(text)};
  } catch (const std::bad_alloc&) {
    return {kind, TextWithoutMemory()};
  }
}

Failure::Failure(const std::exception_ptr& exception) noexcept {
  foreign_ = exception;
  reason_.kind = FailureKind::kLocal;
  try {
    std::rethrow_exception(exception);
  } catch (const Tarnik::Exception& known) {
    reason_.kind = Classify(known);
    try {
      exception_ = CopyOf(known);
      foreign_ = nullptr;
    } catch (const std::bad_alloc&) {
      // The object itself is kept.
    }
  } catch (...) {
    // The object itself is kept.
  }
}

Failure::Failure(const std::exception_ptr& exception, Reason reason) noexcept : Failure(exception) {
  reason_ = std::move(reason);
}

Failure Failure::Copy(const Tarnik::Exception& exception) noexcept {
  return Made([&exception] {
    Failure failure;
    failure.exception_ = CopyOf(exception);
    failure.reason_.kind = Classify(exception);
    return failure;
  });
}

Failure Failure::Cancelled() {
  return Of(Tarnik::CancelledException("The call was cancelled by its caller."));
}

Failure Failure::OutOfMemory() noexcept {
  Failure failure;
  failure.exception_ = SharedOutOfMemory();
  failure.reason_.kind = FailureKind::kLocal;
  return failure;
}

void Failure::Throw() const {
  if (exception_ != nullptr) {
    exception_->Throw();
  }
  std::rethrow_exception(foreign_);
}

std::shared_ptr<const Tarnik::Exception> Failure::ForCallback() const noexcept {
  if (exception_ != nullptr) {
    return exception_;
  }
  try {
    return Convert(foreign_);
  } catch (...) {
    return SharedOutOfMemory();
  }
}

std::string Failure::Message() const {
  return exception_ != nullptr ? exception_->Message() : TextOf(foreign_);
}

Reason Failure::AsReason() const noexcept {
  try {
    return reason_.IsSet() ? reason_ : MakeReason(reason_.kind, RecordText());
  } catch (const std::bad_alloc&) {
    return {reason_.kind, TextWithoutMemory()};
  }
}

std::string Failure::RecordText() const {
  return reason_.IsSet() ? *reason_.text : ToRecordText(Message());
}

}  // namespace SsoClient::Access
