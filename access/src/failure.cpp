#include "failure.h"

#include <new>

#include <ssoclient/exceptions.h>

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

std::string TextOf(const std::exception_ptr& foreign) {
  try {
    std::rethrow_exception(foreign);
  } catch (const std::exception& exception) {
    return exception.what();
  } catch (...) {
    return "A function of the login has thrown an object that is not an exception.";
  }
}

bool IsBadAlloc(const std::exception_ptr& foreign) noexcept {
  try {
    std::rethrow_exception(foreign);
  } catch (const std::bad_alloc&) {
    return true;
  } catch (...) {
    return false;
  }
}

}  // namespace

Failure::Failure(const std::exception_ptr& exception) {
  try {
    std::rethrow_exception(exception);
  } catch (const Tarnik::Exception& known) {
    exception_ = CopyOf(known);
  } catch (...) {
    foreign_ = exception;
  }
}

Failure Failure::Copy(const Tarnik::Exception& exception) {
  Failure failure;
  failure.exception_ = CopyOf(exception);
  return failure;
}

Failure Failure::OutOfMemory() noexcept {
  Failure failure;
  failure.exception_ = SharedOutOfMemory();
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
    if (!IsBadAlloc(foreign_)) {
      return std::make_shared<const SsoException>(TextOf(foreign_));
    }
  } catch (...) {
    // Reported as below.
  }
  return SharedOutOfMemory();
}

std::string Failure::Message() const {
  return exception_ != nullptr ? exception_->Message() : TextOf(foreign_);
}

FailureKind Failure::Kind() const noexcept {
  return exception_ != nullptr ? Classify(*exception_) : FailureKind::kLocal;
}

}  // namespace SsoClient::Access
