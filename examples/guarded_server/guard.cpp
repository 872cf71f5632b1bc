#include "guard.h"

#include <iostream>
#include <iterator>

#include <boost/beast/core/string.hpp>

#include <tarnik/text/display_text.h>

namespace GuardedServer {

namespace beast = boost::beast;
namespace http = beast::http;

namespace {

using SsoClient::Access::Remedy;
using SsoClient::Access::Verdict;

Response MakeResponse(const Request& request, http::status status, std::string body) {
  Response response(status, request.version());
  response.set(http::field::content_type, "text/plain; charset=utf-8");
  response.set(http::field::cache_control, "no-store");
  response.body() = std::move(body);
  return response;
}

// RFC 6750, section 3
Response Challenge(const Request& request, http::status status, const char* challenge) {
  Response response = MakeResponse(request, status, "");
  response.set(http::field::www_authenticate, challenge);
  return response;
}

/// The answer does not say what this service trusts; the log does.
Response Refuse(const Request& request, const Verdict& verdict, const std::string& sender) {
  std::cerr << sender + ": " + verdict.ToString();
  switch (RemedyOf(verdict.Refusal())) {
    case Remedy::kAccess:
      return MakeResponse(request, http::status::forbidden, "");
    case Remedy::kService:
      return MakeResponse(request, http::status::service_unavailable, "");
    default:
      return Challenge(request, http::status::unauthorized, "Bearer error=\"invalid_token\"");
  }
}

}  // namespace

bool HasClearEnd(const http::request_header<>& header) {
  const auto [begin, end] = header.equal_range(http::field::transfer_encoding);
  return begin == end || (header.version() == 11 && std::next(begin) == end &&
                          beast::iequals(begin->value(), "chunked"));
}

Response AnswerTo(const beast::error_code& error) {
  Response response(http::status::bad_request, 11);
  response.keep_alive(false);
  if (error == http::error::header_limit || error == http::error::buffer_overflow) {
    response.result(http::status::request_header_fields_too_large);
  } else if (error == http::error::body_limit) {
    response.result(http::status::payload_too_large);
  } else if (error.category() != make_error_code(http::error::bad_method).category() ||
             error == http::error::end_of_stream || error == http::error::partial_message) {
    throw beast::system_error(error);
  }
  return response;
}

Response Guard::Answer(const Request& request, const SsoClient::Access::Presenter& presenter,
                       const std::string& sender) const try {
  if (request.method() != http::verb::get && request.method() != http::verb::post) {
    Response response = MakeResponse(request, http::status::method_not_allowed, "");
    response.set(http::field::allow, "GET, POST");
    return response;
  }
  const auto token = TokenIn(request);
  if (!token) {
    return Challenge(request, http::status::unauthorized, "Bearer");
  }
  const Verdict verdict = gate_->Check(*token, presenter);
  if (!verdict.IsAccepted()) {
    return Refuse(request, verdict, sender);
  }
  const auto& subject = verdict.Token()->Subject();
  return MakeResponse(request, http::status::ok, subject.name + '@' + subject.domain + '\n');
} catch (const MalformedRequest& e) {
  std::cerr << sender + ": malformed request: " + Tarnik::ToDisplayText(e.what(), 1000) + '\n';
  return Challenge(request, http::status::bad_request, "Bearer error=\"invalid_request\"");
}

}  // namespace GuardedServer
