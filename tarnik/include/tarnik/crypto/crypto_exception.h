#ifndef TARNIK_CRYPTO_CRYPTO_EXCEPTION_H
#define TARNIK_CRYPTO_CRYPTO_EXCEPTION_H

#include <memory>
#include <string>

#include <tarnik/core/exception.h>

namespace Tarnik::Crypto {

/// A certificate or key that cannot be decoded or used, or a failure of the cryptographic library.
class TARNIK_EXPORT CryptoException : public Exception {
 public:
  /// An exception with this message, which says that it was created at `where`.
  explicit CryptoException(std::string message,
                           const boost::source_location& where = CurrentLocation());
  ~CryptoException() override;
  std::unique_ptr<Throwable> Clone() const override;
  [[noreturn]] void Throw() const override;
};

}  // namespace Tarnik::Crypto

#endif
