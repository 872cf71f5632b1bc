#include <tarnik/core/exception.h>

namespace Tarnik {

Exception::Exception(std::string message, const boost::source_location& where)
    : Throwable(std::move(message), where) {}

Exception::~Exception() = default;

std::unique_ptr<Throwable> Exception::Clone() const {
  return std::make_unique<Exception>(*this);
}

void Exception::Throw() const {
  throw Exception(*this);
}

InvalidArgumentException::InvalidArgumentException(std::string message,
                                                   const boost::source_location& where)
    : Exception(std::move(message), where) {}

InvalidArgumentException::~InvalidArgumentException() = default;

std::unique_ptr<Throwable> InvalidArgumentException::Clone() const {
  return std::make_unique<InvalidArgumentException>(*this);
}

void InvalidArgumentException::Throw() const {
  throw InvalidArgumentException(*this);
}

InvalidStateException::InvalidStateException(std::string message,
                                             const boost::source_location& where)
    : Exception(std::move(message), where) {}

InvalidStateException::~InvalidStateException() = default;

std::unique_ptr<Throwable> InvalidStateException::Clone() const {
  return std::make_unique<InvalidStateException>(*this);
}

void InvalidStateException::Throw() const {
  throw InvalidStateException(*this);
}

TypeMismatchException::TypeMismatchException(std::string message,
                                             const boost::source_location& where)
    : Exception(std::move(message), where) {}

TypeMismatchException::~TypeMismatchException() = default;

std::unique_ptr<Throwable> TypeMismatchException::Clone() const {
  return std::make_unique<TypeMismatchException>(*this);
}

void TypeMismatchException::Throw() const {
  throw TypeMismatchException(*this);
}

DateTimeFormatException::DateTimeFormatException(std::string message,
                                                 const boost::source_location& where)
    : Exception(std::move(message), where) {}

DateTimeFormatException::~DateTimeFormatException() = default;

std::unique_ptr<Throwable> DateTimeFormatException::Clone() const {
  return std::make_unique<DateTimeFormatException>(*this);
}

void DateTimeFormatException::Throw() const {
  throw DateTimeFormatException(*this);
}

Base64FormatException::Base64FormatException(std::string message,
                                             const boost::source_location& where)
    : Exception(std::move(message), where) {}

Base64FormatException::~Base64FormatException() = default;

std::unique_ptr<Throwable> Base64FormatException::Clone() const {
  return std::make_unique<Base64FormatException>(*this);
}

void Base64FormatException::Throw() const {
  throw Base64FormatException(*this);
}

IOException::IOException(std::string message, const boost::source_location& where)
    : Exception(std::move(message), where) {}

IOException::~IOException() = default;

std::unique_ptr<Throwable> IOException::Clone() const {
  return std::make_unique<IOException>(*this);
}

void IOException::Throw() const {
  throw IOException(*this);
}

TimeoutException::TimeoutException(std::string message, const boost::source_location& where)
    : IOException(std::move(message), where) {}

TimeoutException::~TimeoutException() = default;

std::unique_ptr<Throwable> TimeoutException::Clone() const {
  return std::make_unique<TimeoutException>(*this);
}

void TimeoutException::Throw() const {
  throw TimeoutException(*this);
}

CancelledException::CancelledException(std::string message, const boost::source_location& where)
    : IOException(std::move(message), where) {}

CancelledException::~CancelledException() = default;

std::unique_ptr<Throwable> CancelledException::Clone() const {
  return std::make_unique<CancelledException>(*this);
}

void CancelledException::Throw() const {
  throw CancelledException(*this);
}

ResourceException::ResourceException(std::string message, const boost::source_location& where)
    : Exception(std::move(message), where) {}

ResourceException::~ResourceException() = default;

std::unique_ptr<Throwable> ResourceException::Clone() const {
  return std::make_unique<ResourceException>(*this);
}

void ResourceException::Throw() const {
  throw ResourceException(*this);
}

namespace {

// Never destroyed, since threads may report it while the process ends.
ResourceException* MakeOutOfMemory() {
  return new ResourceException("There is not enough memory.");
}

}  // namespace

const ResourceException& OutOfMemory() noexcept {
  static const ResourceException* const failure = MakeOutOfMemory();
  return *failure;
}

namespace {

[[maybe_unused]] const bool kMadeAtLoad = (OutOfMemory(), true);

}  // namespace

}  // namespace Tarnik
