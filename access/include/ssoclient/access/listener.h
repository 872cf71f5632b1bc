#ifndef SSOCLIENT_ACCESS_LISTENER_H
#define SSOCLIENT_ACCESS_LISTENER_H

#include <chrono>
#include <cstdint>
#include <memory>
#include <string>

#include <boost/optional.hpp>

#include <ssoclient/access/export.h>
#include <ssoclient/access/failure_kind.h>
#include <tarnik/system/date_time.h>

namespace SsoClient::Access {

/// What an attempt asks the service for.
enum class AttemptOperation {
  kLogin,     ///< a token by the login of the source
  kRenewal,   ///< the token that the source has, with a new lifetime
  kExchange,  ///< a token by the token of another source
};

/// The name of the operation in lower case: "login", "renewal" or "exchange"; valid for the
/// lifetime of the process.
SSOCLIENT_ACCESS_EXPORT const char* NameOf(AttemptOperation operation) noexcept;

/// One request, or one negotiation, at one endpoint; or a failed call of the function of a
/// `PasswordLogin`, which no endpoint is chosen for.
struct AttemptRecord {
  std::string source;    ///< `TokenSourceConfig::name`
  std::uint64_t id = 0;  ///< the same when it begins and when it ends; unique in the source
  std::string endpoint;  ///< the URL as configured; empty if no endpoint was chosen
  AttemptOperation operation = AttemptOperation::kLogin;  ///< what it asks for
  bool isRefresh = false;  ///< begun in the background, for a key that has a usable token
  int number = 1;          ///< 1 for the first attempt of a request, 2 for the second
  /// The rest is set when the attempt has ended.
  std::chrono::microseconds duration{0};
  FailureKind failure = FailureKind::kNone;  ///< `kNone` if the attempt succeeded
  /// Of the failure, without control characters and without the password, and at most 1000 bytes
  /// long; empty without a failure.
  std::string message;
  int httpStatus = 0;  ///< of the last answer; 0 without an answer
};

/// Whether requests go to an endpoint.
enum class CircuitState {
  kClosed,    ///< all of them
  kOpen,      ///< none, until its next probe
  kHalfOpen,  ///< only the probe that is under way
};

/// The name of the state in lower case: "closed", "open" or "half-open"; valid for the lifetime of
/// the process.
SSOCLIENT_ACCESS_EXPORT const char* NameOf(CircuitState state) noexcept;

/// An endpoint's circuit has changed.
struct CircuitRecord {
  std::string source;                          ///< `TokenSourceConfig::name`
  std::string endpoint;                        ///< the URL as configured
  CircuitState state = CircuitState::kClosed;  ///< from now on
  std::chrono::milliseconds retryAfter{0};     ///< for an open circuit, until the next probe
};

/// The `Date` of an endpoint's answers began, or ceased, to differ from this system's clock by more
/// than 30 seconds. Only the answers of the service itself count: issued tokens and SOAP faults.
struct ClockRecord {
  std::string source;                   ///< `TokenSourceConfig::name`
  std::string endpoint;                 ///< the URL as configured
  std::chrono::milliseconds offset{0};  ///< the service's clock minus this system's
};

/// A field of an issued token that is not what the request asked for. The token is handed out
/// nevertheless, as the client does. What is compared:
///  - "subject": with a user name of the form "name@domain", with the subject of the token to
///    renew or to exchange, or with that of the act-as token;
///  - "audiences": as sets;
///  - "lifetime": from the answer to the end, by the service's clock, if the difference is larger
///    than two seconds, a hundredth and the duration of the exchange together;
///  - "confirmation": bearer or holder-of-key, and the key;
///  - "delegable" and "renewable".
struct DeviationRecord {
  std::string source;     ///< `TokenSourceConfig::name`
  std::string endpoint;   ///< the URL as configured
  std::string field;      ///< as listed above
  std::string requested;  ///< as text
  std::string issued;     ///< as text
};

/// A refresh has failed, and the last token is served until it is no longer usable; or the first
/// request for a token of `TokenSourceConfig::keepFresh` has failed.
struct RefreshFailureRecord {
  std::string source;  ///< `TokenSourceConfig::name`
  /// Of the last attempt.
  FailureKind failure = FailureKind::kNone;
  std::string message;  ///< as in `AttemptRecord`
  /// None when there is no token.
  boost::optional<Tarnik::System::DateTime> usableUntil{};
  std::chrono::milliseconds nextAttempt{0};  ///< from now
};

/// Sees what a token source does. Records never contain a password, a key, or the text of a token;
/// where a service repeats the password in a text, there are asterisks in its place, also if the
/// text is escaped as in XML. When memory runs out, records other than those of attempts may be
/// missing.
///
/// The functions do nothing unless they are overridden. They run on worker threads of the platform
/// (on others only when no worker can be started), several at once. They should return quickly, and
/// must not call the source. Exceptions of any type that leave them are ignored. Later versions add
/// no functions here, but may add an interface that is derived from this one.
class SSOCLIENT_ACCESS_EXPORT AccessListener {
 public:
  virtual ~AccessListener();
  /// An attempt begins; its duration, failure, message and status are not set.
  virtual void OnAttemptBegun(const AttemptRecord& attempt);
  /// An attempt has ended. Called once for each call of `OnAttemptBegun`, with the same `id`.
  virtual void OnAttemptEnded(const AttemptRecord& attempt);
  /// A refresh, or the first request for a token that is kept fresh, has failed.
  virtual void OnRefreshFailed(const RefreshFailureRecord& refresh);
  /// The circuit of an endpoint has changed.
  virtual void OnCircuit(const CircuitRecord& circuit);
  /// An endpoint's clock began, or ceased, to differ.
  virtual void OnClock(const ClockRecord& clock);
  /// An issued token differs from the request. Called once for each field.
  virtual void OnDeviation(const DeviationRecord& deviation);
};

/// Writes a line to the log of the platform for each record: failures at level 3, refused logins at
/// level 2, circuits, clocks and deviations at level 4, other attempts at level 6.
SSOCLIENT_ACCESS_EXPORT std::shared_ptr<AccessListener> CreateLogListener();

}  // namespace SsoClient::Access

#endif
