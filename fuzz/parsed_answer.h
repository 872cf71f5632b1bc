#ifndef FUZZ_PARSED_ANSWER_H
#define FUZZ_PARSED_ANSWER_H

#include <optional>
#include <string>

#include <tarnik/http/http_response.h>

namespace Fuzz {

struct ParsedAnswer {
  int code = 0;
  std::string body;
  /// Whether another request may follow on the connection.
  bool mayBeFollowed = false;
};

/// Reads the body to its end.
ParsedAnswer AnswerOf(Tarnik::Http::ClientResponse& response);
/// What the bytes contain; nothing if they are refused or incomplete.
std::optional<ParsedAnswer> ParseAnswer(const std::string& bytes, bool hasEnd);

}  // namespace Fuzz

#endif
