#ifndef TARNIK_HTTP_RESPONSE_PARSER_H
#define TARNIK_HTTP_RESPONSE_PARSER_H

#include <memory>
#include <string>
#include <string_view>

#include <tarnik/core/ref.h>

#include "http/http_response_impl.h"
#include "http/response_head_check.h"
#include "support/sensitive_text.h"

namespace Tarnik::Http {

/// Parses one answer (RFC 9112) from the bytes of a connection, without I/O of its own. Interim
/// answers (RFC 9110, section 15.2) are skipped.
class ResponseParser {
 public:
  /// `peer` names the other end in messages.
  explicit ResponseParser(std::string peer);
  ~ResponseParser();

  /// Takes the next bytes. Throws `HttpException` for an answer that violates the protocol or a
  /// limit.
  void Feed(std::string_view bytes);
  /// Takes the orderly end of the connection. Throws `CutOffException` when it cuts the answer off.
  void FeedEnd();

  /// True when the answer is complete.
  bool IsDone() const noexcept { return isDone_; }
  /// True when the answer is complete and its connection may be used for another exchange.
  bool MayReuseConnection() const noexcept;
  /// Moves the complete answer out. Called once.
  Ref<ClientResponseImpl> TakeResponse();

 private:
  class Message;

  void Advance();
  bool ReadHead();
  bool ReadBody();
  void SkipInterim(int code);
  void CheckOverhead() const;
  [[noreturn]] void Refuse(std::string_view fault) const;
  [[noreturn]] void RefuseCutOff(std::string_view part) const;

  const std::string peer_;
  SensitiveText input_;  // bytes that no message has consumed yet
  ResponseHeadScanner scanner_;
  std::unique_ptr<Message> message_;
  std::size_t headBytes_ = 0;
  std::size_t bodyWireBytes_ = 0;
  int interimCount_ = 0;
  bool hasStarted_ = false;
  bool hasSurplus_ = false;
  bool isDone_ = false;
};

}  // namespace Tarnik::Http

#endif
