#include "http/response_head_check.h"

#include "http/field_syntax.h"
#include "support/ascii.h"

namespace Tarnik::Http {
namespace {

constexpr std::string_view kLineEnd = "\r\n";

/// What the header fields say about the length of the body.
struct Framing {
  bool hasLength = false;
  bool isChunked = false;
};

std::string_view TakeLine(std::string_view& head) {
  const auto end = head.find(kLineEnd);
  const std::string_view line = head.substr(0, end);
  head.remove_prefix(end + kLineEnd.size());
  return line;
}

// RFC 9112, section 4: status-line = HTTP-version SP status-code SP [ reason-phrase ].
void CheckStatusLine(std::string_view line) {
  constexpr std::size_t kShortest = std::string_view("HTTP/1.1 200 ").size();
  if (line.size() < kShortest || line[8] != ' ' || line[12] != ' ') {
    throw ResponseFault{"has a malformed status line"};
  }
  if (line[7] != '0' && line[7] != '1') {
    throw ResponseFault{"is of a version of HTTP other than 1.0 and 1.1"};
  }
  if (!AreDigits(line.substr(9, 3)) || line[9] == '0') {
    throw ResponseFault{"has a status code outside 100 to 999"};
  }
}

void CheckLength(std::string_view value, Framing& framing) {
  // RFC 9112, section 6.3. A repetition of the same number is rejected too.
  if (framing.hasLength) {
    throw ResponseFault{"gives its Content-Length more than once"};
  }
  framing.hasLength = true;
  constexpr std::size_t kMaxDigits = 19;
  if (!AreDigits(value) || value.size() > kMaxDigits) {
    throw ResponseFault{"has a malformed Content-Length"};
  }
}

void CheckCoding(std::string_view value, Framing& framing) {
  if (framing.isChunked || !EqualsIgnoringCase(value, "chunked")) {
    throw ResponseFault{"uses a transfer coding other than chunked, once"};
  }
  framing.isChunked = true;
}

void CheckField(std::string_view line, Framing& framing) {
  if (line.front() == ' ' || line.front() == '\t') {
    throw ResponseFault{"has a folded header line"};
  }
  const auto colon = line.find(':');
  if (colon == std::string_view::npos) {
    throw ResponseFault{"has a header line without a colon"};
  }
  const std::string_view name = line.substr(0, colon);
  if (name.ends_with(' ') || name.ends_with('\t')) {
    throw ResponseFault{"has a blank before the colon of a header line"};
  }
  if (!IsToken(name)) {
    throw ResponseFault{"has a malformed header name"};
  }
  const std::string_view value = TrimBlanks(line.substr(colon + 1));
  if (EqualsIgnoringCase(name, "Content-Length")) {
    CheckLength(value, framing);
  } else if (EqualsIgnoringCase(name, "Transfer-Encoding")) {
    CheckCoding(value, framing);
  }
}

void CheckFraming(const Framing& framing, bool isHttp10) {
  if (!framing.isChunked) {
    return;
  }
  if (framing.hasLength) {
    throw ResponseFault{"gives both Content-Length and Transfer-Encoding"};
  }
  // RFC 9112, section 6.1: such a message has faulty framing.
  if (isHttp10) {
    throw ResponseFault{"uses a transfer coding in HTTP/1.0"};
  }
}

void CheckBeginning(std::string_view input) {
  constexpr std::string_view kBeginning = "HTTP/1.";
  const std::string_view known = input.substr(0, kBeginning.size());
  if (known != kBeginning.substr(0, known.size())) {
    throw ResponseFault{"does not begin as an answer in HTTP/1.1"};
  }
}

}  // namespace

std::optional<std::size_t> ResponseHeadScanner::Scan(std::string_view input) {
  CheckBeginning(input);
  for (; scanned_ < input.size(); ++scanned_) {
    const char c = input[scanned_];
    const bool followsReturn = scanned_ > 0 && input[scanned_ - 1] == '\r';
    if (followsReturn != (c == '\n')) {
      throw ResponseFault{"has a bare carriage return or line feed in its header"};
    }
    if (c == '\n' && scanned_ >= 3 && input.substr(scanned_ - 3, 4) == "\r\n\r\n") {
      return ++scanned_;
    }
    if (IsControl(c) && c != '\t' && c != '\r' && c != '\n') {
      throw ResponseFault{"has a control character in its header"};
    }
  }
  return std::nullopt;
}

void CheckResponseHead(std::string_view head) {
  const std::string_view statusLine = TakeLine(head);
  CheckStatusLine(statusLine);
  Framing framing;
  for (std::string_view line = TakeLine(head); !line.empty(); line = TakeLine(head)) {
    CheckField(line, framing);
  }
  CheckFraming(framing, statusLine[7] == '0');
}

}  // namespace Tarnik::Http
