#include <utility>

#include <tarnik/ssl/ssl_exception.h>

namespace Tarnik::Ssl {

SSLException::SSLException(std::string message, const boost::source_location& where)
    : IOException(std::move(message), where) {}

SSLException::~SSLException() = default;

std::unique_ptr<Throwable> SSLException::Clone() const {
  return std::make_unique<SSLException>(*this);
}

void SSLException::Throw() const {
  throw SSLException(*this);
}

}  // namespace Tarnik::Ssl
