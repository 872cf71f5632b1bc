// The result of parsing an answer does not depend on the size of the pieces or on bytes after the
// answer. The body is shorter than the input, and an answer without its last byte is incomplete.
// The first byte of the input is the size of the pieces.
#include <algorithm>
#include <optional>
#include <string>
#include <string_view>

#include <tarnik/http/http_exception.h>

#include "http/response_parser.h"
#include "input.h"

namespace {

using Tarnik::Http::ResponseParser;

struct Answer {
  int code = 0;
  std::string reason;
  std::string body;

  bool operator==(const Answer&) const = default;
};

Answer TakeAnswer(ResponseParser& parser) {
  const auto response = parser.TakeResponse();
  Answer answer{response->Status().code, response->Status().reason, ""};
  Fuzz::Require(answer.code >= 200 && answer.code <= 999);
  char buffer[4096];
  while (const std::size_t count = response->Body()->Read(buffer, sizeof(buffer))) {
    answer.body.append(buffer, count);
  }
  return answer;
}

/// The answer, or nothing if it is refused.
std::optional<Answer> Read(std::string_view bytes, std::size_t pieceSize) {
  ResponseParser parser("sts.example.com:443");
  try {
    for (; !bytes.empty(); bytes.remove_prefix(std::min(pieceSize, bytes.size()))) {
      parser.Feed(bytes.substr(0, pieceSize));
    }
    parser.FeedEnd();
  } catch (const Tarnik::Http::HttpException&) {
    return std::nullopt;
  }
  return TakeAnswer(parser);
}

/// The length of the answer, unless only the end of the connection completes it.
std::optional<std::size_t> OwnLength(std::string_view bytes) {
  ResponseParser parser("sts.example.com:443");
  for (std::size_t count = 0; count < bytes.size(); ++count) {
    try {
      parser.Feed(bytes.substr(count, 1));
    } catch (const Tarnik::Http::HttpException&) {
      return std::nullopt;
    }
    if (parser.IsDone()) {
      return count + 1;
    }
  }
  return std::nullopt;
}

bool LetsAnotherFollow(std::string_view bytes) {
  ResponseParser parser("sts.example.com:443");
  parser.Feed(bytes);
  return parser.MayReuseConnection();
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  if (size < 2) {
    return 0;
  }
  const std::string bytes = Fuzz::TextOf(data + 1, size - 1);
  const auto whole = Read(bytes, bytes.size());
  Fuzz::Require(whole == Read(bytes, 1));
  Fuzz::Require(whole == Read(bytes, 1 + data[0]));
  Fuzz::Require(!whole || whole->body.size() < bytes.size());
  const auto length = OwnLength(bytes);
  if (!whole || !length) {
    return 0;
  }
  const std::string own = bytes.substr(0, *length);
  Fuzz::Require(Read(own, own.size()) == whole);
  Fuzz::Require(!Read(own.substr(0, own.size() - 1), own.size()));
  const std::string withAnother = own + "HTTP/1.1 200 OK\r\nContent-Length: 1\r\n\r\nx";
  Fuzz::Require(Read(withAnother, withAnother.size()) == whole);
  Fuzz::Require(!LetsAnotherFollow(withAnother));
  return 0;
}
