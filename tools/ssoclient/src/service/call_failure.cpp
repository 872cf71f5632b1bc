#include "service/call_failure.h"

#include <cstdlib>
#include <string>
#include <utility>

#include <ssoclient/access/failure_kind.h>
#include <ssoclient/exceptions.h>
#include <tarnik/text/display_text.h>

#include "service/clock_offset.h"
#include "service/secret_search.h"

namespace SsoClient::Tool {
namespace {

using Access::FailureKind;

// The client's text, which distinguishes failures of one class. It never changes.
constexpr std::string_view kUnexpectedFault = "Unexpected SOAP fault: ";

constexpr std::size_t kMaxMessageBytes = 1000;
constexpr int kUnauthorized = 401;
constexpr int kInternalServerError = 500;

template <class Class>
bool Is(const Tarnik::Exception& exception) {
  return dynamic_cast<const Class*>(&exception) != nullptr;
}

FailureKind KindOfExchange(const ExchangeNotes& notes) {
  if (const auto* cause = dynamic_cast<const Tarnik::Exception*>(notes.failure.get())) {
    return Access::Classify(*cause);
  }
  if (notes.httpStatus == 0) {
    return FailureKind::kUnreachable;
  }
  if (notes.httpStatus == kUnauthorized) {
    return FailureKind::kRefusedLogin;  // RFC 9110, section 15.5.2
  }
  return IsReadStatus(notes.httpStatus) ? FailureKind::kBadAnswer : FailureKind::kHttpStatus;
}

FailureKind KindOf(const Tarnik::Exception& exception, const ExchangeNotes& notes) {
  if (Is<CommunicationException>(exception)) {
    return KindOfExchange(notes);
  }
  const FailureKind kind = Access::Classify(exception);
  if (notes.httpStatus == 0 && kind == FailureKind::kBadToken) {
    return FailureKind::kLocal;  // nothing was answered, so that it is the request that failed
  }
  const bool isFault = exception.Message().rfind(kUnexpectedFault, 0) == 0;
  if (kind == FailureKind::kFault && !isFault) {
    return notes.httpStatus == kInternalServerError ? FailureKind::kHttpStatus
                                                    : FailureKind::kBadAnswer;
  }
  return kind;
}

std::string ClockText(long offsetSec) {
  return "this machine's clock is " + std::to_string(std::labs(offsetSec)) + " seconds " +
         (offsetSec > 0 ? "behind" : "ahead of") +
         " the service's, and requests are valid only for a short time: correct the clock";
}

}  // namespace

Failure FailureOfCall(const Tarnik::Exception& exception, const ExchangeNotes& notes,
                      std::string_view secret, const std::string& remedyOfRefusal) {
  const FailureKind kind = KindOf(exception, notes);
  const std::string message = Tarnik::ToDisplayText(exception.what(), kMaxMessageBytes);
  Failure failure =
      MakeFailure(kind,
                  ContainsSecret(exception.what(), secret)
                      ? "the service's text is not shown, since it contains the password"
                      : message,
                  exception);
  if (failure.status == ExitStatus::kRefused && !remedyOfRefusal.empty()) {
    failure.remedy = remedyOfRefusal;
  }
  const bool isOff =
      notes.clockOffsetSec && std::labs(*notes.clockOffsetSec) > kLargeClockOffsetSec;
  if (failure.status == ExitStatus::kRefused && isOff) {
    failure.remedy = ClockText(*notes.clockOffsetSec);
  }
  return failure;
}

}  // namespace SsoClient::Tool
