#include <tarnik/http/http_exception.h>

namespace Tarnik::Http {

HttpException::HttpException(std::string message, const boost::source_location& where)
    : IOException(std::move(message), where) {}

HttpException::~HttpException() = default;

std::unique_ptr<Throwable> HttpException::Clone() const {
  return std::make_unique<HttpException>(*this);
}

void HttpException::Throw() const {
  throw *this;
}

CutOffException::CutOffException(std::string message, const boost::source_location& where)
    : HttpException(std::move(message), where) {}

CutOffException::~CutOffException() = default;

std::unique_ptr<Throwable> CutOffException::Clone() const {
  return std::make_unique<CutOffException>(*this);
}

void CutOffException::Throw() const {
  throw CutOffException(*this);
}

}  // namespace Tarnik::Http
