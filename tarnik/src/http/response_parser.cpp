#include "http/response_parser.h"

#include <algorithm>
#include <utility>

#include <boost/beast/http/basic_parser.hpp>

#include <tarnik/http/http_exception.h>
#include <tarnik/http/http_user_agent.h>

namespace Tarnik::Http {
namespace {

namespace BeastHttp = boost::beast::http;
using BeastText = boost::beast::string_view;
using BeastError = boost::beast::error_code;

constexpr int kMaxInterimAnswers = 16;
constexpr int kSwitchingProtocols = 101;
/// The most memory that is reserved because of Content-Length, before the bytes have arrived.
constexpr std::size_t kMaxReservedBytes = std::size_t{1} << 20;

std::string_view View(BeastText text) {
  return {text.data(), text.size()};
}

}  // namespace

/// One message, final or interim, built from the parser's events.
class ResponseParser::Message final : public BeastHttp::basic_parser<false> {
 public:
  Message() {
    eager(true);
    header_limit(static_cast<std::uint32_t>(kMaxHeaderBytes));
    body_limit(kMaxBodyBytes);
  }

  StatusLine status{};
  HeaderFields headers;
  SensitiveText body;

 private:
  void on_request_impl(BeastHttp::verb, BeastText, BeastText, int, BeastError&) override {}

  void on_response_impl(int code, BeastText reason, int, BeastError&) override {
    status = {code, std::string(reason)};
  }

  void on_field_impl(BeastHttp::field, BeastText name, BeastText value, BeastError&) override {
    // RFC 9110, section 6.5.1: trailer fields must not be merged into the header fields.
    if (!isHeadDone_) {
      headers.emplace_back(std::string(name), std::string(value));
    }
  }

  void on_header_impl(BeastError&) override { isHeadDone_ = true; }

  void on_body_init_impl(const boost::optional<std::uint64_t>& length, BeastError&) override {
    if (length) {
      body.Reserve(std::min<std::uint64_t>(*length, kMaxReservedBytes));
    }
  }

  std::size_t on_body_impl(BeastText bytes, BeastError&) override {
    body.Append(View(bytes));
    return bytes.size();
  }

  void on_chunk_header_impl(std::uint64_t, BeastText, BeastError&) override {}

  std::size_t on_chunk_body_impl(std::uint64_t, BeastText bytes, BeastError&) override {
    body.Append(View(bytes));
    return bytes.size();
  }

  void on_finish_impl(BeastError&) override {}

  bool isHeadDone_ = false;
};

ResponseParser::ResponseParser(std::string peer) : peer_(std::move(peer)) {}

ResponseParser::~ResponseParser() = default;

void ResponseParser::Refuse(std::string_view fault) const {
  throw HttpException("The answer from " + peer_ + " " + std::string(fault) + ".");
}

void ResponseParser::RefuseCutOff(std::string_view part) const {
  throw CutOffException("The answer from " + peer_ + " was cut off in its " + std::string(part) +
                        ".");
}

void ResponseParser::Feed(std::string_view bytes) {
  hasStarted_ = true;
  if (isDone_) {
    hasSurplus_ = true;
    return;
  }
  input_.Append(bytes);
  try {
    Advance();
  } catch (const ResponseFault& fault) {
    Refuse(fault.text);
  }
}

void ResponseParser::Advance() {
  while (!isDone_ && input_.Size() != 0) {
    const bool hasMoved = message_ == nullptr ? ReadHead() : ReadBody();
    if (!hasMoved) {
      return;
    }
  }
  hasSurplus_ = input_.Size() != 0;
}

bool ResponseParser::ReadHead() {
  const auto size = scanner_.Scan(input_.Text());
  if (headBytes_ + size.value_or(input_.Size() + 1) > kMaxHeaderBytes) {
    Refuse("has a header of more than " + std::to_string(kMaxHeaderBytes) + " bytes");
  }
  if (!size) {
    return false;
  }
  CheckResponseHead(std::string_view(input_.Text()).substr(0, *size));
  message_ = std::make_unique<Message>();
  BeastError error;
  message_->put({input_.Text().data(), *size}, error);
  if (error == BeastHttp::error::body_limit) {
    Refuse("has a body of more than " + std::to_string(kMaxBodyBytes) + " bytes");
  }
  if (error || !message_->is_header_done()) {
    Refuse("has a malformed header: " + error.message());
  }
  headBytes_ += *size;
  input_.RemovePrefix(*size);
  if (message_->status.code / 100 == 1) {
    SkipInterim(message_->status.code);
    return true;
  }
  isDone_ = message_->is_done();
  return true;
}

void ResponseParser::SkipInterim(int code) {
  if (code == kSwitchingProtocols) {
    Refuse("switches to another protocol without being asked");
  }
  if (++interimCount_ > kMaxInterimAnswers) {
    Refuse("is preceded by more than " + std::to_string(kMaxInterimAnswers) + " interim answers");
  }
  message_.reset();
  scanner_ = {};
}

bool ResponseParser::ReadBody() {
  // Beast's parser needs to see at least these bytes of the last chunk at once.
  constexpr std::size_t kShortestRestOfChunks = std::string_view("0\r\n\r\n").size();
  if (message_->chunked() && input_.Size() < kShortestRestOfChunks) {
    return false;
  }
  BeastError error;
  const std::size_t consumed = message_->put({input_.Text().data(), input_.Size()}, error);
  bodyWireBytes_ += consumed;
  input_.RemovePrefix(consumed);
  if (error == BeastHttp::error::body_limit) {
    Refuse("has a body of more than " + std::to_string(kMaxBodyBytes) + " bytes");
  }
  if (error && error != BeastHttp::error::need_more) {
    Refuse("has a malformed body: " + error.message());
  }
  CheckOverhead();
  isDone_ = message_->is_done();
  return !error;
}

// Chunk extensions and trailers are ignored, and a chunk may contain a single byte. Without this
// limit an answer could continue forever without reaching the limit of its body.
void ResponseParser::CheckOverhead() const {
  constexpr std::size_t kFramingPerBodyByte = 8;
  const std::size_t body = message_->body.Size();
  if (bodyWireBytes_ + input_.Size() - body > kMaxHeaderBytes + kFramingPerBodyByte * body) {
    Refuse("spends more bytes on chunk headers and trailers than any honest one");
  }
}

void ResponseParser::FeedEnd() {
  if (isDone_) {
    return;
  }
  if (!hasStarted_) {
    throw CutOffException(peer_ + " closed the connection without an answer.");
  }
  if (message_ == nullptr) {
    RefuseCutOff("header");
  }
  BeastError error;
  message_->put_eof(error);
  if (error) {
    RefuseCutOff("body");
  }
  isDone_ = true;
}

bool ResponseParser::MayReuseConnection() const noexcept {
  return isDone_ && !hasSurplus_ && message_->keep_alive();
}

Ref<ClientResponseImpl> ResponseParser::TakeResponse() {
  return MakeRef<ClientResponseImpl>(std::move(message_->status), std::move(message_->headers),
                                     message_->body.Take());
}

}  // namespace Tarnik::Http
