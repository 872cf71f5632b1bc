// Another parser of HTTP, libhttp-parser, reads every answer that is accepted here as the same
// message: status, reason, header fields, body, its last byte, and whether the connection may be
// used again. It refuses every answer that is refused here, except for the rules in `kStricter`.
#include <algorithm>
#include <charconv>
#include <map>
#include <optional>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include <http_parser.h>

#include <tarnik/http/http_exception.h>
#include <tarnik/http/http_user_agent.h>

#include "http/response_parser.h"
#include "input.h"

namespace {

using Fields = std::vector<std::pair<std::string, std::string>>;

struct Message {
  int code = 0;
  std::string reason;
  Fields fields;
  std::string body;
  bool letsAnotherFollow = false;

  bool operator==(const Message&) const = default;
};

struct Reading {
  std::optional<Message> message;
  std::size_t end = 0;  // one past the last byte of the message
  std::string refusal;
};

// The second parser.

struct Sink {
  Message message;
  bool isHeadDone = false;
  bool isDone = false;
};

Sink& SinkOf(http_parser* parser) {
  return *static_cast<Sink*>(parser->data);
}

bool HasNoBody(unsigned code) {
  return code / 100 == 1 || code == 204 || code == 304;
}

int OnReason(http_parser* parser, const char* text, std::size_t size) {
  SinkOf(parser).message.reason.append(text, size);
  return 0;
}

int OnName(http_parser* parser, const char* text, std::size_t size) {
  Sink& sink = SinkOf(parser);
  if (!sink.isHeadDone) {
    sink.message.fields.emplace_back(std::string(text, size), "");
  }
  return 0;
}

int OnValue(http_parser* parser, const char* text, std::size_t size) {
  Sink& sink = SinkOf(parser);
  if (!sink.isHeadDone) {
    sink.message.fields.back().second.append(text, size);
  }
  return 0;
}

// Returns 1 for an answer without a body (RFC 9112, section 6.3, rule 1). Otherwise http_parser
// reads a body after every status code.
int OnHead(http_parser* parser) {
  SinkOf(parser).isHeadDone = true;
  SinkOf(parser).message.letsAnotherFollow = http_should_keep_alive(parser) != 0;
  return HasNoBody(parser->status_code) ? 1 : 0;
}

int OnBody(http_parser* parser, const char* text, std::size_t size) {
  SinkOf(parser).message.body.append(text, size);
  return 0;
}

// A pause ends the call at the last byte of the message.
int OnEnd(http_parser* parser) {
  Sink& sink = SinkOf(parser);
  sink.isDone = true;
  sink.message.code = static_cast<int>(parser->status_code);
  if (HasNoBody(parser->status_code)) {
    sink.message.letsAnotherFollow = http_should_keep_alive(parser) != 0;
  }
  http_parser_pause(parser, 1);
  return 0;
}

// It keeps the blanks after a value, which are no part of it (RFC 9110, section 5.5).
void TrimValues(Fields& fields) {
  for (auto& field : fields) {
    field.second.erase(field.second.find_last_not_of(" \t") + 1);
  }
}

/// Reads one message, final or interim.
Reading ReadMessage(std::string_view bytes) {
  static const http_parser_settings settings = [] {
    http_parser_settings made;
    http_parser_settings_init(&made);
    made.on_status = OnReason;
    made.on_header_field = OnName;
    made.on_header_value = OnValue;
    made.on_headers_complete = OnHead;
    made.on_body = OnBody;
    made.on_message_complete = OnEnd;
    return made;
  }();
  http_parser parser;
  http_parser_init(&parser, HTTP_RESPONSE);
  Sink sink;
  parser.data = &sink;
  Reading reading;
  if (!bytes.empty()) {
    reading.end = http_parser_execute(&parser, &settings, bytes.data(), bytes.size());
  }
  if (parser.http_errno == HPE_OK) {
    http_parser_execute(&parser, &settings, nullptr, 0);
  }
  TrimValues(sink.message.fields);
  if (sink.isDone) {
    reading.message = std::move(sink.message);
  } else {
    reading.refusal = http_errno_name(static_cast<http_errno>(parser.http_errno));
  }
  return reading;
}

Reading ReadWithSecond(std::string_view bytes) {
  std::size_t begin = 0;
  for (;;) {
    Reading reading = ReadMessage(bytes.substr(begin));
    begin += reading.end;
    if (!reading.message || reading.message->code / 100 != 1) {
      reading.end = begin;
      return reading;
    }
  }
}

// Ours.

/// A look-up finds the first field of a name in any case.
void RequireFirstValues(const Tarnik::Http::ClientResponseImpl& response) {
  std::map<std::string, std::string> firstValues;
  for (const auto& [name, value] : response.Headers()) {
    std::string upper(name);
    std::transform(upper.begin(), upper.end(), upper.begin(),
                   [](char c) { return c >= 'a' && c <= 'z' ? static_cast<char>(c - 32) : c; });
    firstValues.emplace(upper, value);
  }
  for (const auto& [name, value] : firstValues) {
    Fuzz::Require(response.Header(name) == value);
  }
  Fuzz::Require(!response.Header("X-Not:A-Token"));
}

Message TakeMessage(Tarnik::Http::ResponseParser& parser) {
  Message message;
  message.letsAnotherFollow = parser.MayReuseConnection();
  const auto response = parser.TakeResponse();
  message.code = response->Status().code;
  message.reason = response->Status().reason;
  message.fields = response->Headers();
  RequireFirstValues(*response);
  char buffer[4096];
  while (const std::size_t count = response->Body()->Read(buffer, sizeof(buffer))) {
    message.body.append(buffer, count);
  }
  return message;
}

/// Fed byte by byte until the message is complete, so that its end is known.
Reading ReadWithOurs(std::string_view bytes) {
  Tarnik::Http::ResponseParser parser("sts.example.com:443");
  Reading reading;
  try {
    while (!parser.IsDone() && reading.end < bytes.size()) {
      parser.Feed(bytes.substr(reading.end++, 1));
    }
    parser.FeedEnd();
    reading.message = TakeMessage(parser);
  } catch (const Tarnik::Http::HttpException& error) {
    reading.refusal = error.Message();
  }
  return reading;
}

// Differences by design.

bool Contains(std::string_view text, std::string_view part) {
  return text.find(part) != std::string_view::npos;
}

bool HasBareLineEnd(std::string_view text) {
  for (std::size_t i = 1; i < text.size(); ++i) {
    if ((text[i] == '\n') != (text[i - 1] == '\r')) {
      return true;
    }
  }
  return text.starts_with('\n') || text.ends_with('\r');
}

bool HasControl(std::string_view text) {
  return std::any_of(text.begin(), text.end(), [](unsigned char c) {
    return (c < 0x20 && c != '\t' && c != '\r' && c != '\n') || c == 0x7F;
  });
}

// A text of the same length as `pattern`, in which '#' is any digit.
bool Matches(std::string_view text, std::string_view pattern) {
  return text.size() >= pattern.size() &&
         std::equal(pattern.begin(), pattern.end(), text.begin(), [](char expected, char c) {
           return expected == '#' ? c >= '0' && c <= '9' : expected == c;
         });
}

std::vector<std::string_view> LinesOf(std::string_view text) {
  std::vector<std::string_view> lines;
  for (std::size_t begin = 0; begin <= text.size();) {
    const std::size_t end = std::min(text.find("\r\n", begin), text.size());
    lines.push_back(text.substr(begin, end - begin));
    begin = end + 2;
  }
  return lines;
}

template <class Predicate>
bool HasLine(std::string_view text, Predicate isSuch) {
  const auto lines = LinesOf(text);
  return std::any_of(lines.begin(), lines.end(), isSuch);
}

bool HasOddStatusLine(std::string_view text) {
  return HasLine(text, [](std::string_view line) {
    return line.starts_with("HTTP/") &&
           (!Matches(line, "HTTP/1.# ### ") || line[7] > '1' || line[9] == '0');
  });
}

std::string Lower(std::string_view text) {
  std::string lower(text);
  std::transform(lower.begin(), lower.end(), lower.begin(),
                 [](char c) { return c >= 'A' && c <= 'Z' ? static_cast<char>(c + 32) : c; });
  return lower;
}

bool HasOddLength(std::string_view text) {
  return HasLine(text, [](std::string_view line) {
    constexpr std::size_t kMaxDigits = 19;
    const std::string lower = Lower(line);
    const std::size_t first = lower.find_first_of("0123456789");
    return lower.starts_with("content-length") &&
           (first == std::string::npos || lower.size() - first > kMaxDigits ||
            lower.find_first_not_of("0123456789", first) != std::string::npos);
  });
}

// The value of a field in lower case and without blanks at its ends; nothing for another line.
std::optional<std::string> ValueOf(std::string_view line, std::string_view nameEnd) {
  const std::size_t colon = std::min(line.find(':'), line.size());
  if (!Lower(line.substr(0, colon)).ends_with(nameEnd)) {
    return std::nullopt;
  }
  std::string value = Lower(line.substr(std::min(colon + 1, line.size())));
  value.erase(value.find_last_not_of(" \t") + 1);
  value.erase(0, value.find_first_not_of(" \t"));
  return value;
}

bool HasOtherCoding(std::string_view text) {
  const std::string all = Lower(text);
  return all.find("transfer-encoding") != all.rfind("transfer-encoding") ||
         HasLine(text, [](std::string_view line) {
           return ValueOf(line, "transfer-encoding").value_or("chunked") != "chunked";
         });
}

bool HasOddConnection(std::string_view text) {
  return HasLine(text, [](std::string_view line) {
    const std::string value = ValueOf(line, "connection").value_or("close");
    return value != "close" && value != "keep-alive";
  });
}

bool HasBlankInName(std::string_view text) {
  return HasLine(text, [](std::string_view line) {
    const std::size_t colon = line.find(':');
    return colon != std::string_view::npos && Contains(line.substr(0, colon), " ");
  });
}

std::string_view AfterHead(std::string_view text) {
  const std::size_t end = text.find("\r\n\r\n");
  return end == std::string_view::npos ? "" : text.substr(end + 4);
}

std::string_view FinalAnswer(std::string_view text) {
  while (Matches(text, "HTTP/1.# 1")) {
    text = AfterHead(text);
  }
  return text;
}

std::string_view BodyOf(std::string_view text) {
  return AfterHead(FinalAnswer(text));
}

bool IsOddTrailer(std::string_view text) {
  const std::string lower = Lower(text);
  return HasBlankInName(text) || HasBareLineEnd(text) || HasControl(text) ||
         Contains(lower, "transfer-encoding") || Contains(lower, "content-length") ||
         Contains(lower, "connection");
}

// Section 7.1.
bool HasBrokenChunks(std::string_view text) {
  std::string_view rest = BodyOf(text);
  for (;;) {
    std::size_t size = 0;
    const auto [end, error] = std::from_chars(rest.data(), rest.data() + rest.size(), size, 16);
    const std::size_t line = rest.find("\r\n");
    if (error != std::errc() || line == std::string_view::npos || (*end != ';' && *end != '\r') ||
        HasBareLineEnd(rest.substr(0, line + 2))) {
      return true;
    }
    if (size == 0) {
      return IsOddTrailer(rest.substr(line + 2));
    }
    rest.remove_prefix(line + 2);
    if (rest.size() < size || rest.substr(size, 2) != "\r\n") {
      return true;
    }
    rest.remove_prefix(size + 2);
  }
}

bool HasExtension(std::string_view text) {
  return Contains(BodyOf(text), ";");
}

struct Rule {
  std::string_view refusal;
  /// Whether an answer can deserve this refusal.
  bool (*applies)(std::string_view bytes);
};

/// What is refused here although the second parser accepts it: where implementations differ in
/// what they take it for (RFC 9112, section 11), and beyond a limit.
const Rule kStricter[] = {
    // It skips empty lines before the message and accepts a bare line feed as the end of a line
    // (both allowed by section 2.2), and versions from 0.0 to 9.9.
    {"does not begin as an answer in HTTP/1.1",
     [](std::string_view text) { return !FinalAnswer(text).starts_with("HTTP/1."); }},
    {"bare carriage return or line feed", HasBareLineEnd},
    {"has a control character", HasControl},
    {"has a malformed status line", HasOddStatusLine},
    {"a version of HTTP other than 1.0 and 1.1", HasOddStatusLine},
    {"a status code outside 100 to 999", HasOddStatusLine},
    // Section 5.2 lets a client join the lines.
    {"has a folded header line",
     [](std::string_view text) {
       return HasLine(text, [](std::string_view line) {
         return line.starts_with(' ') || line.starts_with('\t');
       });
     }},
    {"has a malformed Content-Length", HasOddLength},
    // It supports codings before "chunked" and leaves decoding to its caller.
    {"uses a transfer coding other than chunked, once", HasOtherCoding},
    {"uses a transfer coding in HTTP/1.0",
     [](std::string_view text) { return Contains(text, "HTTP/1.0 "); }},
    {"switches to another protocol",
     [](std::string_view text) {
       return Contains(text, "HTTP/1.1 101 ") || Contains(text, "HTTP/1.0 101 ");
     }},
    {"more than 16 interim answers", [](std::string_view text) { return Contains(text, " 1"); }},
    {"spends more bytes on chunk headers",
     [](std::string_view text) { return text.size() > Tarnik::Http::kMaxHeaderBytes; }},
    // It looks for "close" and "keep-alive" in any text.
    {"has a malformed header: bad value", HasOddConnection},
    // It skips chunk extensions without reading them (section 7.1.1).
    {"has a malformed body: bad chunk extension", HasExtension},
    {"was cut off in its body", HasExtension},
    // As Debian builds it, it accepts blanks in names and any two octets after a chunk.
    {"has a malformed header name", HasBlankInName},
    {"has a blank before the colon of a header line", HasBlankInName},
    {"has a malformed body", HasBrokenChunks},
    {"has a header of more than",
     [](std::string_view text) { return text.size() > Tarnik::Http::kMaxHeaderBytes; }},
};

bool IsStricterByDesign(std::string_view bytes, const std::string& refusal) {
  return std::any_of(std::begin(kStricter), std::end(kStricter), [&](const Rule& rule) {
    return Contains(refusal, rule.refusal) && rule.applies(bytes);
  });
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  const std::string bytes = Fuzz::TextOf(data, size);
  const Reading ours = ReadWithOurs(bytes);
  const Reading second = ReadWithSecond(bytes);
  if (!ours.message) {
    Fuzz::Require(!second.message || IsStricterByDesign(bytes, ours.refusal));
    return 0;
  }
  Fuzz::Require(second.message == ours.message && second.end == ours.end);
  return 0;
}
