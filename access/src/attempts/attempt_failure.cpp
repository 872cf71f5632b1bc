#include "attempts/attempt_failure.h"

#include <string_view>

#include <ssoclient/exceptions.h>
#include <tarnik/xml/security/xml_security_exception.h>

#include "secret_text.h"

namespace SsoClient::Access {

namespace {

// Texts of the client, which distinguish failures of one class. They never change.
constexpr std::string_view kUnexpectedFault = "Unexpected SOAP fault: ";
constexpr std::string_view kFaultWithoutCode = "Invalid SOAP response: missing faultcode.";

constexpr int kUnauthorized = 401;
constexpr int kInternalServerError = 500;

template <class Class>
const Class* As(const Tarnik::Exception& failure) noexcept {
  return dynamic_cast<const Class*>(&failure);
}

FailureKind KindOfStatus(const Observation& seen) noexcept {
  if (seen.fault != SeenFault::kNone) {
    return IsRefusal(seen.fault) ? FailureKind::kRefusedLogin : FailureKind::kFault;
  }
  // RFC 9110, section 15.5.2. Asking another endpoint could lock the account.
  return seen.httpStatus == kUnauthorized ? FailureKind::kRefusedLogin : FailureKind::kHttpStatus;
}

FailureKind KindOfExchange(const AttemptEvidence& evidence) noexcept {
  const Observation& seen = evidence.seen;
  if (const auto* cause = dynamic_cast<const Tarnik::Exception*>(seen.failure.get())) {
    return Classify(*cause);
  }
  // An exchange that the limit refused was not seen.
  if (evidence.limit.IsCancelled()) {
    return FailureKind::kAbandoned;
  }
  if (Tarnik::Http::CallLimit::Clock::now() >= evidence.limit.Deadline()) {
    return FailureKind::kTimedOut;
  }
  if (seen.httpStatus == 0) {
    return FailureKind::kAbandoned;  // the process is ending
  }
  return IsReadStatus(seen.httpStatus) ? FailureKind::kBadAnswer : KindOfStatus(seen);
}

FailureKind KindOfAnswer(const Tarnik::Exception& failure, const Observation& seen) noexcept {
  // The client knows these codes only in their namespaces.
  if (IsRefusal(seen.fault)) {
    return FailureKind::kRefusedLogin;
  }
  const std::string_view message = failure.Message();
  if (message.starts_with(kUnexpectedFault)) {
    return FailureKind::kFault;
  }
  const bool isFault = message == kFaultWithoutCode || As<ParseException>(failure) != nullptr;
  return seen.httpStatus == kInternalServerError && !isFault ? FailureKind::kHttpStatus
                                                             : FailureKind::kBadAnswer;
}

FailureKind KindOf(const Tarnik::Exception& failure, const AttemptEvidence& evidence) noexcept {
  const Observation& seen = evidence.seen;
  if (evidence.tokenFailure != FailureKind::kNone) {
    return evidence.tokenFailure;
  }
  if (evidence.hasLoginFailed) {
    return seen.hasSent ? FailureKind::kLocal : FailureKind::kSecretFailed;
  }
  if (As<CommunicationException>(failure) != nullptr) {
    return KindOfExchange(evidence);
  }
  if (As<InvalidCredentialsException>(failure) != nullptr ||
      As<PasswordExpiredException>(failure) != nullptr) {
    return Classify(failure);
  }
  if (As<Tarnik::IOException>(failure) != nullptr) {
    return Classify(failure);  // the exchange could not begin
  }
  const bool isAnswer = As<SsoException>(failure) != nullptr ||
                        As<Tarnik::Xml::Security::XmlSecurityException>(failure) != nullptr;
  return isAnswer && seen.httpStatus != 0 ? KindOfAnswer(failure, seen) : FailureKind::kLocal;
}

std::string DescribeClocks(const ClockReading& clock) {
  return " The service's clock reads " + FormatWallTime(clock.service) + ", this system's " +
         FormatWallTime(clock.system) + ".";
}

// `exception` as its caller receives it.
std::exception_ptr Explain(const std::exception_ptr& exception, const Tarnik::Exception& failure,
                           FailureKind kind, const Observation& seen) {
  if (kind == FailureKind::kFault && seen.clock && seen.fault == SeenFault::kRefusedTimestamp) {
    const std::string text = failure.Message() + DescribeClocks(*seen.clock);
    return As<CommunicationException>(failure) == nullptr
               ? std::make_exception_ptr(SsoException(text, failure.Where()))
               : std::make_exception_ptr(CommunicationException(text, failure.Where()));
  }
  if (kind == FailureKind::kTimedOut) {
    // Without the words about a deadline of the caller, since it is that of the attempt.
    const auto* cause = dynamic_cast<const Tarnik::TimeoutException*>(seen.failure.get());
    return std::make_exception_ptr(CommunicationException(
        cause == nullptr ? "The time of the attempt is over." : cause->Message(), failure.Where()));
  }
  return exception;
}

std::string MessageOf(const std::exception_ptr& exception) {
  try {
    std::rethrow_exception(exception);
  } catch (const std::exception& failure) {
    return failure.what();
  } catch (...) {
    return "An object was thrown that is not an exception.";
  }
}

}  // namespace

void SetFailure(AttemptOutcome& outcome, const std::exception_ptr& exception,
                const AttemptEvidence& evidence) {
  outcome.failure = exception;
  try {
    std::rethrow_exception(exception);
  } catch (const Tarnik::Exception& failure) {
    outcome.kind = KindOf(failure, evidence);
    outcome.failure = Explain(exception, failure, outcome.kind, evidence.seen);
  } catch (...) {
    outcome.kind = evidence.hasLoginFailed && !evidence.seen.hasSent ? FailureKind::kSecretFailed
                                                                     : FailureKind::kLocal;
  }
  outcome.isAuthenticationRefused = outcome.kind == FailureKind::kRefusedLogin &&
                                    evidence.seen.fault != SeenFault::kInvalidSecurityToken;
  // A service may repeat what it was sent.
  outcome.message = ToRecordText(HideSecret(MessageOf(outcome.failure), evidence.secret));
}

}  // namespace SsoClient::Access
