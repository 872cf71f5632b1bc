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
  explicit SSLException(std::string message,
                        const boost::source_location& where = CurrentLocation());
  ~SSLException() override;
  std::unique_ptr<Throwable> Clone() const override;
  [[noreturn]] void Throw() const override;
};

}  // namespace Tarnik::Ssl

#endif
