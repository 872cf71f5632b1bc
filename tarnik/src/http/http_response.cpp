#include "http/http_response_impl.h"
#include "support/ascii.h"

namespace Tarnik::Http {

ClientResponseImpl::ClientResponseImpl(StatusLine status, HeaderFields headers, std::string body)
    : status_(std::move(status)),
      headers_(std::move(headers)),
      body_(CreateStringReader(std::move(body))) {}

ClientResponseImpl::~ClientResponseImpl() = default;

const StatusLine& ClientResponseImpl::Status() const {
  return status_;
}

std::optional<std::string> ClientResponseImpl::Header(const std::string& name) const {
  for (const auto& [fieldName, value] : headers_) {
    if (EqualsIgnoringCase(fieldName, name)) {
      return value;
    }
  }
  return std::nullopt;
}

Ref<Reader> ClientResponseImpl::Body() const {
  return body_;
}

}  // namespace Tarnik::Http
