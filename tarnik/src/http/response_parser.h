#ifndef TARNIK_HTTP_RESPONSE_PARSER_H
#define TARNIK_HTTP_RESPONSE_PARSER_H

#include <memory>
#include <string>
#include <string_view>

#include <tarnik/core/ref.h>

#include "http/client_response.h"
#include "http/response_head_check.h"
#include "support/sensitive_text.h"

namespace Tarnik::Http {

/// Reads one answer (RFC 9112) from the bytes of a connection. Pure: it is fed, and knows no
/// stream. Interim answers (RFC 9110, section 15.2) are passed over.
class ResponseParser {
 public:
  /// `peer` names the other end in messages.
  explicit ResponseParser(std::string peer);
  ~ResponseParser();

  /// Takes the next bytes. Throws `HttpException` for an answer that breaks the protocol or a
  /// limit.
  void Feed(std::string_view bytes);
  /// Takes the orderly end of the connection. Throws `HttpException` when it cuts the answer off.
  void FeedEnd();

  /// True when the answer is whole.
  bool IsDone() const noexcept { return isDone_; }
  /// True when the answer is whole and another one may follow on its connection.
  bool MayReuseConnection() const noexcept;
  /// The whole answer, once.
  Ref<ClientResponseImpl> TakeResponse();

 private:
  class Message;

  void Advance();
  bool ReadHead();
  bool ReadBody();
  void PassOverInterim(int code);
  void CheckOverhead() const;
  [[noreturn]] void Refuse(std::string_view fault) const;

  const std::string peer_;
  /// Bytes that no message has consumed yet.
  SensitiveText input_;
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
