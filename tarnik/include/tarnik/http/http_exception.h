#ifndef TARNIK_HTTP_HTTP_EXCEPTION_H
#define TARNIK_HTTP_HTTP_EXCEPTION_H

#include <memory>
#include <string>

#include <tarnik/core/exception.h>

namespace Tarnik::Http {

/// An HTTP exchange that violated the protocol or a limit.
class TARNIK_EXPORT HttpException : public IOException {
 public:
  /// An exception with this message, which says that it was created at `where`.
  explicit HttpException(std::string message,
                         const boost::source_location& where = CurrentLocation());
  ~HttpException() override;
  std::unique_ptr<Throwable> Clone() const override;
  [[noreturn]] void Throw() const override;
};

/// An answer that is incomplete because the peer ended the connection, or did so without an answer
/// (RFC 9112, section 8).
class TARNIK_EXPORT CutOffException : public HttpException {
 public:
  /// An exception with this message, which says that it was created at `where`.
  explicit CutOffException(std::string message,
                           const boost::source_location& where = CurrentLocation());
  ~CutOffException() override;
  std::unique_ptr<Throwable> Clone() const override;
  [[noreturn]] void Throw() const override;
};

}  // namespace Tarnik::Http

#endif
