#ifndef TARNIK_HTTP_RESPONSE_HEAD_CHECK_H
#define TARNIK_HTTP_RESPONSE_HEAD_CHECK_H

#include <cstddef>
#include <optional>
#include <string_view>

namespace Tarnik::Http {

/// A violation in an answer: the rest of the sentence that starts "The answer from host:port".
struct ResponseFault {
  std::string_view text;
};

/// Finds the end of a response head as its bytes arrive, and rejects bytes that are not allowed in
/// a head. RFC 9112 lets recipients repair many of these violations, but each repair lets two
/// readers interpret one answer differently, so nothing is repaired here.
class ResponseHeadScanner {
 public:
  /// Scans what was appended to `input` since the last call. Returns the size of the head including
  /// its empty line, or nothing while it is incomplete. Throws a `ResponseFault`.
  std::optional<std::size_t> Scan(std::string_view input);

 private:
  std::size_t scanned_ = 0;
};

/// Throws a `ResponseFault` unless the complete head `head` follows RFC 9112 exactly and defines
/// the length of its body in only one way (section 6.3).
void CheckResponseHead(std::string_view head);

}  // namespace Tarnik::Http

#endif
