#ifndef SSOCLIENT_ACCESS_ATTEMPTS_EXCHANGE_OBSERVER_H
#define SSOCLIENT_ACCESS_ATTEMPTS_EXCHANGE_OBSERVER_H

#include <chrono>
#include <memory>
#include <optional>

#include <tarnik/core/exception.h>
#include <tarnik/core/ref.h>
#include <tarnik/http/http_user_agent.h>

#include "attempts/answer_headers.h"

namespace SsoClient::Access {

/// The clocks at one answer.
struct ClockReading {
  WallTime service;  ///< the answer's Date
  WallTime system;   ///< when it was received
  /// The service's clock minus this system's.
  std::chrono::milliseconds offset;
};

/// The SOAP fault in an answer, also in one whose body the client does not read because of its HTTP
/// status. The namespace of the code does not matter, since services confuse them.
enum class SeenFault {
  kNone,
  kFailedAuthentication,
  kInvalidSecurityToken,
  /// Of the request (Web Services Security: SOAP Message Security 1.1, section 10; a code of the
  /// family is also sent for other faults).
  kRefusedTimestamp,
  kOther
};

/// Whether the fault refuses the credentials or the token of the request.
bool IsRefusal(SeenFault fault) noexcept;

/// What the exchanges of one attempt have shown. Used by the thread that makes the attempt.
struct Observation {
  bool hasSent = false;
  /// Why the last exchange failed; null if it was answered.
  std::shared_ptr<const Tarnik::Throwable> failure;
  int httpStatus = 0;                       ///< of the last answer; 0 without one
  SeenFault fault = SeenFault::kNone;       ///< of the last answer
  std::chrono::milliseconds retryAfter{0};  ///< what the last answer asked for
  std::optional<ClockReading> clock;        ///< of the last answer with a Date
};

/// Whether the client reads answers with this status (SOAP 1.1, section 6.2).
bool IsReadStatus(int httpStatus) noexcept;

/// An agent that sends by `inner` and records in `seen`, which it refers to, how exchanges end. It
/// is used by one thread, and only by `Wait`ing for each exchange.
Tarnik::Ref<Tarnik::Http::UserAgent> CreateObservingUserAgent(Tarnik::Http::UserAgent* inner,
                                                              Observation& seen);

}  // namespace SsoClient::Access

#endif
