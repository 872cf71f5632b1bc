#ifndef GUARDED_SERVER_GUARD_H
#define GUARDED_SERVER_GUARD_H

#include <memory>
#include <string>

#include <boost/beast/core/error.hpp>

#include <ssoclient/access/token_gate.h>

#include "token_in_request.h"

namespace GuardedServer {

/// Whether every recipient finds the same end of the request (RFC 9112, section 6.3). The parser
/// ignores transfer codings other than "chunked", and reads that one in HTTP/1.0 too.
bool HasClearEnd(const boost::beast::http::request_header<>& header);

/// The answer to what is no request, or too large. Throws `error` if the connection has failed.
Response AnswerTo(const boost::beast::error_code& error);

/// Answers requests whose tokens a gate accepts. Thread-safe.
class Guard {
 public:
  explicit Guard(std::shared_ptr<const SsoClient::Access::TokenGate> gate)
      : gate_(std::move(gate)) {}

  /// `sender` names the peer in the log.
  Response Answer(const Request& request, const SsoClient::Access::Presenter& presenter,
                  const std::string& sender) const;

 private:
  std::shared_ptr<const SsoClient::Access::TokenGate> gate_;
};

}  // namespace GuardedServer

#endif
