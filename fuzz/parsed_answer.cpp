#include "parsed_answer.h"

#include <cstddef>

#include <tarnik/http/http_exception.h>

#include "http/response_parser.h"

namespace Fuzz {

ParsedAnswer AnswerOf(Tarnik::Http::ClientResponse& response) {
  ParsedAnswer answer{response.Status().code, "", false};
  char buffer[1024];
  while (const std::size_t count = response.Body()->Read(buffer, sizeof(buffer))) {
    answer.body.append(buffer, count);
  }
  return answer;
}

std::optional<ParsedAnswer> ParseAnswer(const std::string& bytes, bool hasEnd) {
  Tarnik::Http::ResponseParser parser("sts.example:443");
  try {
    if (!bytes.empty()) {
      parser.Feed(bytes);
    }
    if (hasEnd) {
      parser.FeedEnd();
    }
  } catch (const Tarnik::Http::HttpException&) {
    return std::nullopt;
  }
  if (!parser.IsDone()) {
    return std::nullopt;
  }
  const bool mayBeFollowed = parser.MayReuseConnection();
  ParsedAnswer answer = AnswerOf(*parser.TakeResponse());
  answer.mayBeFollowed = mayBeFollowed;
  return answer;
}

}  // namespace Fuzz
