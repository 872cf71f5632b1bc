#include <utility>

#include <tarnik/crypto/crypto_exception.h>

namespace Tarnik::Crypto {

CryptoException::CryptoException(std::string message, const boost::source_location& where)
    : Exception(std::move(message), where) {}

CryptoException::~CryptoException() = default;

std::unique_ptr<Throwable> CryptoException::Clone() const {
  return std::make_unique<CryptoException>(*this);
}

void CryptoException::Throw() const {
  throw CryptoException(*this);
}

}  // namespace Tarnik::Crypto
