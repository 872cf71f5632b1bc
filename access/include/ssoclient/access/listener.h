#ifndef SSOCLIENT_ACCESS_LISTENER_H
#define SSOCLIENT_ACCESS_LISTENER_H

#include <chrono>
#include <cstdint>
#include <memory>
#include <string>

#include <ssoclient/access/export.h>
#include <ssoclient/access/failure_kind.h>

namespace SsoClient::Access {

/// What an attempt asks the service for.
enum class AttemptOperation { kLogin, kRenewal, kExchange };

/// One request, or one negotiation, to one endpoint.
struct AttemptRecord {
  std::string endpoint;  ///< the URL as configured
  AttemptOperation operation = AttemptOperation::kLogin;
  bool isRefresh = false;  ///< begun in the background, for a key that has a valid token
  /// The following are set when the attempt has ended.
  std::chrono::microseconds duration{0};
  FailureKind failure = FailureKind::kNone;
  std::string message;  ///< of the failure; empty without one
  int httpStatus = 0;   ///< of the last answer; 0 without an answer
};

enum class CircuitState { kClosed, kOpen, kHalfOpen };

struct CircuitRecord {
  std::string endpoint;
  CircuitState state = CircuitState::kClosed;
  /// For an open circuit, when the endpoint is tried again.
  std::chrono::milliseconds retryAfter{0};
};

/// An answer whose `Date` differs from this system's clock by more than 30 seconds.
struct ClockRecord {
  std::string endpoint;
  /// The service's clock minus this system's.
  std::chrono::milliseconds offset{0};
};

/// A field of an issued token that is not what the request asked for. The token is handed out
/// nevertheless, as the client does; a listener may be stricter.
struct DeviationRecord {
  std::string endpoint;
  std::string field;      ///< "subject", "audiences", "lifetime", "confirmation", "delegable", ...
  std::string requested;  ///< as text
  std::string issued;     ///< as text
};

enum class CacheEvent {
  kHit,      ///< a token was in the cache, with enough life left
  kMiss,     ///< there was none, so that one was requested
  kShared,   ///< there was none, and another caller's request is under way
  kStale,    ///< a refresh has failed, and the last token was served
  kRefused,  ///< a login that was refused earlier was answered from memory
  kDropped,  ///< a key was dropped instead of refreshed, or evicted for lack of space
};

/// Sees what a token source does. Records never contain a password, a key, or the text of a token.
/// All functions do nothing unless they are overridden. They run on the threads that do the work,
/// possibly several at once, must be thread-safe, should return quickly, and must not throw or call
/// the source. Functions may be added at the end in later versions.
class SSOCLIENT_ACCESS_EXPORT AccessListener {
 public:
  virtual ~AccessListener();
  virtual void OnAttemptBegun(const AttemptRecord& attempt);
  virtual void OnAttemptEnded(const AttemptRecord& attempt);
  /// For `kHit`, on the thread of the caller: keep it short.
  virtual void OnCache(CacheEvent event);
  virtual void OnCircuit(const CircuitRecord& circuit);
  virtual void OnClock(const ClockRecord& clock);
  virtual void OnDeviation(const DeviationRecord& deviation);
};

/// Writes a line to the library's log for each record except cache hits: failures at level 3,
/// circuits, clocks and deviations at level 4, the others at level 6.
SSOCLIENT_ACCESS_EXPORT std::shared_ptr<AccessListener> CreateLogListener();

}  // namespace SsoClient::Access

#endif
