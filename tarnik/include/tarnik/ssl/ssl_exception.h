#ifndef TARNIK_SSL_SSL_EXCEPTION_H
#define TARNIK_SSL_SSL_EXCEPTION_H

#include <memory>
#include <string>

#include <tarnik/core/exception.h>

namespace Tarnik::Ssl {

/// A failure of TLS configuration, of a handshake or of a connection. The message names the cause
/// and, for a connection, the peer.
class TARNIK_EXPORT SSLException : public IOException {
 public:
  /// An exception with this message, which says that it was created at `where`.
  explicit SSLException(std::string message,
                        const boost::source_location& where = CurrentLocation());
  ~SSLException() override;
  std::unique_ptr<Throwable> Clone() const override;
  [[noreturn]] void Throw() const override;
};

/// A handshake that failed because the peer's certificate is not trusted: its issuer is unknown, it
/// is expired, not yet valid, revoked, not meant for servers or not pinned, its revocation cannot
/// be determined, or the peer has none (RFC 5280, section 6).
class TARNIK_EXPORT PeerTrustException : public SSLException {
 public:
  /// An exception with this message, which says that it was created at `where`.
  explicit PeerTrustException(std::string message,
                              const boost::source_location& where = CurrentLocation());
  ~PeerTrustException() override;
  std::unique_ptr<Throwable> Clone() const override;
  [[noreturn]] void Throw() const override;
};

/// A handshake that failed because the peer's certificate is for another name or address (RFC 9525,
/// section 6). It may be unacceptable for other reasons, too.
class TARNIK_EXPORT PeerNameException : public SSLException {
 public:
  /// An exception with this message, which says that it was created at `where`.
  explicit PeerNameException(std::string message,
                             const boost::source_location& where = CurrentLocation());
  ~PeerNameException() override;
  std::unique_ptr<Throwable> Clone() const override;
  [[noreturn]] void Throw() const override;
};

/// A connection whose peer ended it after the handshake without close_notify, so that the data may
/// be cut off (RFC 8446, section 6.1).
class TARNIK_EXPORT TruncationException : public SSLException {
 public:
  /// An exception with this message, which says that it was created at `where`.
  explicit TruncationException(std::string message,
                               const boost::source_location& where = CurrentLocation());
  ~TruncationException() override;
  std::unique_ptr<Throwable> Clone() const override;
  [[noreturn]] void Throw() const override;
};

}  // namespace Tarnik::Ssl

#endif
