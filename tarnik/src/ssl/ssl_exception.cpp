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

PeerTrustException::PeerTrustException(std::string message, const boost::source_location& where)
    : SSLException(std::move(message), where) {}

PeerTrustException::~PeerTrustException() = default;

std::unique_ptr<Throwable> PeerTrustException::Clone() const {
  return std::make_unique<PeerTrustException>(*this);
}

void PeerTrustException::Throw() const {
  throw PeerTrustException(*this);
}

PeerNameException::PeerNameException(std::string message, const boost::source_location& where)
    : SSLException(std::move(message), where) {}

PeerNameException::~PeerNameException() = default;

std::unique_ptr<Throwable> PeerNameException::Clone() const {
  return std::make_unique<PeerNameException>(*this);
}

void PeerNameException::Throw() const {
  throw PeerNameException(*this);
}

TruncationException::TruncationException(std::string message, const boost::source_location& where)
    : SSLException(std::move(message), where) {}

TruncationException::~TruncationException() = default;

std::unique_ptr<Throwable> TruncationException::Clone() const {
  return std::make_unique<TruncationException>(*this);
}

void TruncationException::Throw() const {
  throw TruncationException(*this);
}

}  // namespace Tarnik::Ssl
