#ifndef TARNIK_CORE_EXCEPTION_H
#define TARNIK_CORE_EXCEPTION_H

#include <memory>
#include <string>
#include <utility>

#include <tarnik/core/throwable.h>

namespace Tarnik {

/// Base class of all failures that a caller may handle. Contains one message.
class TARNIK_EXPORT Exception : public Throwable {
 public:
  /// An exception with this message, which says that it was created at `where`.
  explicit Exception(std::string message, const boost::source_location& where = CurrentLocation());
  ~Exception() override;
  std::unique_ptr<Throwable> Clone() const override;
  [[noreturn]] void Throw() const override;
};

/// An argument that the called function does not accept.
class TARNIK_EXPORT InvalidArgumentException : public Exception {
 public:
  /// An exception with this message, which says that it was created at `where`.
  explicit InvalidArgumentException(std::string message,
                                    const boost::source_location& where = CurrentLocation());
  ~InvalidArgumentException() override;
  std::unique_ptr<Throwable> Clone() const override;
  [[noreturn]] void Throw() const override;
};

/// An object that is not in the state that the called function requires.
class TARNIK_EXPORT InvalidStateException : public Exception {
 public:
  /// An exception with this message, which says that it was created at `where`.
  explicit InvalidStateException(std::string message,
                                 const boost::source_location& where = CurrentLocation());
  ~InvalidStateException() override;
  std::unique_ptr<Throwable> Clone() const override;
  [[noreturn]] void Throw() const override;
};

/// An object that is not of the expected class.
class TARNIK_EXPORT TypeMismatchException : public Exception {
 public:
  /// An exception with this message, which says that it was created at `where`.
  explicit TypeMismatchException(std::string message,
                                 const boost::source_location& where = CurrentLocation());
  ~TypeMismatchException() override;
  std::unique_ptr<Throwable> Clone() const override;
  [[noreturn]] void Throw() const override;
};

/// Text that is not a date and time.
class TARNIK_EXPORT DateTimeFormatException : public Exception {
 public:
  /// An exception with this message, which says that it was created at `where`.
  explicit DateTimeFormatException(std::string message,
                                   const boost::source_location& where = CurrentLocation());
  ~DateTimeFormatException() override;
  std::unique_ptr<Throwable> Clone() const override;
  [[noreturn]] void Throw() const override;
};

/// Text that is not Base64.
class TARNIK_EXPORT Base64FormatException : public Exception {
 public:
  /// An exception with this message, which says that it was created at `where`.
  explicit Base64FormatException(std::string message,
                                 const boost::source_location& where = CurrentLocation());
  ~Base64FormatException() override;
  std::unique_ptr<Throwable> Clone() const override;
  [[noreturn]] void Throw() const override;
};

/// An input or output operation that failed: file, socket or stream.
class TARNIK_EXPORT IOException : public Exception {
 public:
  /// An exception with this message, which says that it was created at `where`.
  explicit IOException(std::string message,
                       const boost::source_location& where = CurrentLocation());
  ~IOException() override;
  std::unique_ptr<Throwable> Clone() const override;
  [[noreturn]] void Throw() const override;
};

/// An operation that did not end within its time limit.
class TARNIK_EXPORT TimeoutException : public IOException {
 public:
  /// An exception with this message, which says that it was created at `where`.
  explicit TimeoutException(std::string message,
                            const boost::source_location& where = CurrentLocation());
  ~TimeoutException() override;
  std::unique_ptr<Throwable> Clone() const override;
  [[noreturn]] void Throw() const override;
};

/// An operation that was cancelled before it ended.
class TARNIK_EXPORT CancelledException : public IOException {
 public:
  /// An exception with this message, which says that it was created at `where`.
  explicit CancelledException(std::string message,
                              const boost::source_location& where = CurrentLocation());
  ~CancelledException() override;
  std::unique_ptr<Throwable> Clone() const override;
  [[noreturn]] void Throw() const override;
};

/// The system has too few threads, descriptors or bytes of memory.
class TARNIK_EXPORT ResourceException : public Exception {
 public:
  /// An exception with this message, which says that it was created at `where`.
  explicit ResourceException(std::string message,
                             const boost::source_location& where = CurrentLocation());
  ~ResourceException() override;
  std::unique_ptr<Throwable> Clone() const override;
  [[noreturn]] void Throw() const override;
};

/// The failure that is reported where an allocation failed and `std::bad_alloc` cannot be thrown.
/// It exists from the time when the library is loaded, so that reporting it needs no memory.
TARNIK_EXPORT const ResourceException& OutOfMemory() noexcept;

}  // namespace Tarnik

#endif
