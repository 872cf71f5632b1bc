#ifndef SSOCLIENT_EXCEPTIONS_H
#define SSOCLIENT_EXCEPTIONS_H

#include <memory>
#include <string>
#include <utility>

#include <ssoclient/export.h>
#include <tarnik/core/exception.h>

namespace SsoClient {

/// Base of all exceptions that the library defines.
class SSOCLIENT_EXPORT SsoException : public Tarnik::Exception {
 public:
  /// An exception with this message, which says that it was created at `where`.
  explicit SsoException(std::string message,
                        const boost::source_location& where = Tarnik::CurrentLocation())
      : Exception(std::move(message), where) {}
  ~SsoException() override = default;
  std::unique_ptr<Tarnik::Throwable> Clone() const override {
    return std::make_unique<SsoException>(*this);
  }
  [[noreturn]] void Throw() const override { throw SsoException(*this); }
};

/// The exchange with the service failed: connection, TLS, time-out, the end of the process, or an
/// HTTP status other than 2xx and 500.
class SSOCLIENT_EXPORT CommunicationException : public SsoException {
 public:
  /// An exception with this message, which says that it was created at `where`.
  explicit CommunicationException(std::string message,
                                  const boost::source_location& where = Tarnik::CurrentLocation())
      : SsoException(std::move(message), where) {}
  ~CommunicationException() override = default;
  std::unique_ptr<Tarnik::Throwable> Clone() const override {
    return std::make_unique<CommunicationException>(*this);
  }
  [[noreturn]] void Throw() const override { throw CommunicationException(*this); }
};

/// The service rejected the credentials.
class SSOCLIENT_EXPORT InvalidCredentialsException : public SsoException {
 public:
  /// An exception with this message, which says that it was created at `where`.
  explicit InvalidCredentialsException(
      std::string message, const boost::source_location& where = Tarnik::CurrentLocation())
      : SsoException(std::move(message), where) {}
  ~InvalidCredentialsException() override = default;
  std::unique_ptr<Tarnik::Throwable> Clone() const override {
    return std::make_unique<InvalidCredentialsException>(*this);
  }
  [[noreturn]] void Throw() const override { throw InvalidCredentialsException(*this); }
};

/// The user's password has expired.
class SSOCLIENT_EXPORT PasswordExpiredException : public SsoException {
 public:
  /// An exception with this message, which says that it was created at `where`.
  explicit PasswordExpiredException(std::string message,
                                    const boost::source_location& where = Tarnik::CurrentLocation())
      : SsoException(std::move(message), where) {}
  ~PasswordExpiredException() override = default;
  std::unique_ptr<Tarnik::Throwable> Clone() const override {
    return std::make_unique<PasswordExpiredException>(*this);
  }
  [[noreturn]] void Throw() const override { throw PasswordExpiredException(*this); }
};

/// Base of every failure to accept a token. Only its two subclasses are thrown.
class SSOCLIENT_EXPORT InvalidTokenException : public SsoException {
 public:
  /// An exception with this message, which says that it was created at `where`.
  explicit InvalidTokenException(std::string message,
                                 const boost::source_location& where = Tarnik::CurrentLocation())
      : SsoException(std::move(message), where) {}
  ~InvalidTokenException() override = default;
  std::unique_ptr<Tarnik::Throwable> Clone() const override {
    return std::make_unique<InvalidTokenException>(*this);
  }
  [[noreturn]] void Throw() const override { throw InvalidTokenException(*this); }
};

/// The token's XML does not have the accepted structure, or a validity rule fails.
class SSOCLIENT_EXPORT ParseException : public InvalidTokenException {
 public:
  /// An exception with this message, which says that it was created at `where`.
  explicit ParseException(std::string message,
                          const boost::source_location& where = Tarnik::CurrentLocation())
      : InvalidTokenException(std::move(message), where) {}
  ~ParseException() override = default;
  std::unique_ptr<Tarnik::Throwable> Clone() const override {
    return std::make_unique<ParseException>(*this);
  }
  [[noreturn]] void Throw() const override { throw ParseException(*this); }
};

/// The token's signature does not verify.
class SSOCLIENT_EXPORT InvalidSignatureException : public InvalidTokenException {
 public:
  /// An exception with this message, which says that it was created at `where`.
  explicit InvalidSignatureException(
      std::string message, const boost::source_location& where = Tarnik::CurrentLocation())
      : InvalidTokenException(std::move(message), where) {}
  ~InvalidSignatureException() override = default;
  std::unique_ptr<Tarnik::Throwable> Clone() const override {
    return std::make_unique<InvalidSignatureException>(*this);
  }
  [[noreturn]] void Throw() const override { throw InvalidSignatureException(*this); }
};

}  // namespace SsoClient

#endif
