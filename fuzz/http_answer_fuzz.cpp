// An answer means the same in whatever pieces it comes, and never more than its bytes hold.
#include <tarnik/http/http_exception.h>

#include <algorithm>
#include <optional>
#include <string>
#include <string_view>

#include "http/response_parser.h"
#include "input.h"

namespace {

/// The body of the answer, or nothing when it is refused.
std::optional<std::string> Read(std::string_view bytes, std::size_t pieceSize) {
  Tarnik::Http::ResponseParser parser("sts.example.com:443");
  try {
    for (; !bytes.empty(); bytes.remove_prefix(std::min(pieceSize, bytes.size()))) {
      parser.Feed(bytes.substr(0, pieceSize));
    }
    parser.FeedEnd();
  } catch (const Tarnik::Http::HttpException&) {
    return std::nullopt;
  }
  const auto response = parser.TakeResponse();
  Fuzz::Require(response->Status().code >= 200 && response->Status().code <= 999);
  std::string body;
  char buffer[4096];
  while (const std::size_t count = response->Body()->Read(buffer, sizeof(buffer))) {
    body.append(buffer, count);
  }
  return body;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  const std::string bytes = Fuzz::TextOf(data, size);
  const auto whole = Read(bytes, std::max<std::size_t>(size, 1));
  Fuzz::Require(whole == Read(bytes, 1));
  Fuzz::Require(!whole || whole->size() < bytes.size());
  return 0;
}
