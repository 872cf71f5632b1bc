#ifndef TARNIK_HTTP_RESPONSE_HEAD_CHECK_H
#define TARNIK_HTTP_RESPONSE_HEAD_CHECK_H

#include <cstddef>
#include <optional>
#include <string_view>

namespace Tarnik::Http {

/// What is wrong with an answer; the end of the sentence that begins "The answer from host:port".
struct ResponseFault {
  std::string_view text;
};

/// Finds the end of a response head as its bytes arrive and meets, at once, what no head may hold.
/// RFC 9112 lets a recipient repair much of that; each repair is a place where two readers of one
/// answer may come to disagree, so nothing is repaired here.
class ResponseHeadScanner {
 public:
  /// Looks at what was appended to `input` since the last call. Gives the size of the head, its
  /// blank line included, or nothing when it is not whole yet. Throws a
  /// `ResponseFault`.
  std::optional<std::size_t> Scan(std::string_view input);

 private:
  std::size_t scanned_ = 0;
};

/// Throws a `ResponseFault` unless the whole head `head` follows RFC 9112 to the letter and frames
/// its body in one way only (section 6.3).
void CheckResponseHead(std::string_view head);

}  // namespace Tarnik::Http

#endif
