#include "wire/http_reader.h"

#include <algorithm>
#include <array>

#include <boost/asio/buffer.hpp>
#include <boost/beast/http/parser.hpp>
#include <boost/beast/http/string_body.hpp>
#include <strings.h>

#include "devsts/server.h"

namespace DevSts {
namespace {

bool IsNamed(const std::pair<std::string, std::string>& field, const std::string& name) {
  return strcasecmp(field.first.c_str(), name.c_str()) == 0;
}

namespace http = boost::beast::http;
using Parser = http::request_parser<http::string_body>;

constexpr std::uint32_t kHeadLimit = 1024 * 1024;
constexpr std::uint64_t kBodyLimit = std::uint64_t{64} * 1024 * 1024;

std::string AsString(boost::beast::string_view text) {
  return {text.data(), text.size()};
}

void Fill(const Parser& parser, ReceivedRequest& request) {
  request.method = AsString(parser.get().method_string());
  request.target = AsString(parser.get().target());
  for (const auto& field : parser.get()) {
    request.headers.emplace_back(AsString(field.name_string()), AsString(field.value()));
  }
  request.body = parser.get().body();
}

}  // namespace

std::string ReceivedRequest::Header(const std::string& name) const {
  const auto found = std::find_if(headers.begin(), headers.end(),
                                  [&](const auto& field) { return IsNamed(field, name); });
  return found != headers.end() ? found->second : std::string();
}

std::size_t ReceivedRequest::HeaderCount(const std::string& name) const {
  return static_cast<std::size_t>(std::count_if(
      headers.begin(), headers.end(), [&](const auto& field) { return IsNamed(field, name); }));
}

HttpReader::Outcome HttpReader::Next(ReceivedRequest& request, bool& keepAlive) {
  Parser parser;
  parser.header_limit(kHeadLimit);
  parser.body_limit(kBodyLimit);
  parser.eager(true);
  bool begun = !buffer_.empty();
  for (;;) {
    if (!parser.is_header_done() && request.head.empty()) {
      const std::size_t end = buffer_.find("\r\n\r\n");
      request.head = end != std::string::npos ? buffer_.substr(0, end + 4) : "";
    }
    boost::system::error_code error;
    buffer_.erase(0, parser.put(boost::asio::buffer(buffer_), error));
    // What the parser has not taken is a part of a head, of a chunk's head or of a trailer.
    if ((error && error != http::error::need_more) ||
        (!parser.is_done() && buffer_.size() > kHeadLimit)) {
      return Outcome::Malformed;
    }
    if (parser.is_done()) {
      break;
    }
    if (!ReadMore()) {
      return begun ? Outcome::Malformed : Outcome::End;
    }
    begun = true;
  }
  keepAlive = parser.get().keep_alive();
  Fill(parser, request);
  return Outcome::Request;
}

bool HttpReader::ReadMore() {
  std::array<char, 16384> octets{};
  const std::size_t size = connection_.Read(octets.data(), octets.size());
  buffer_.append(octets.data(), size);
  return size != 0;
}

}  // namespace DevSts
