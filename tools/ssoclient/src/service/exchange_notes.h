#ifndef SSOCLIENT_TOOL_SERVICE_EXCHANGE_NOTES_H
#define SSOCLIENT_TOOL_SERVICE_EXCHANGE_NOTES_H

#include <memory>
#include <optional>

#include <tarnik/core/exception.h>
#include <tarnik/core/ref.h>
#include <tarnik/http/http_user_agent.h>

namespace SsoClient::Tool {

/// What the exchanges of a call have shown. The client's exceptions do not say whether the
/// connection, TLS or the time was the cause.
struct ExchangeNotes {
  /// Why the last exchange failed; null if it was answered.
  std::shared_ptr<const Tarnik::Throwable> failure{};
  /// The service's clock minus this system's in seconds, by the last answer with a Date.
  std::optional<long> clockOffsetSec{};
  int httpStatus = 0;  ///< of the last answer; 0 without one
};

/// Whether the client reads the bodies of answers with this HTTP status: those of successes, and of
/// 500, which has faults (SOAP 1.1, section 6.2).
constexpr bool IsReadStatus(int status) {
  return status == 500 || (status >= 200 && status <= 299);
}

/// An agent that sends by `inner` and writes to `notes` how exchanges end. It is used by one thread
/// at a time, and keeps `notes` alive.
Tarnik::Ref<Tarnik::Http::UserAgent> CreateNotingUserAgent(Tarnik::Http::UserAgent* inner,
                                                           std::shared_ptr<ExchangeNotes> notes);

}  // namespace SsoClient::Tool

#endif
