#include "failure.h"

#include <utility>

#include <ssoclient/exceptions.h>
#include <tarnik/core/exception.h>

#include "token_remedy.h"

namespace SsoClient::Tool {
namespace {

using Access::FailureKind;

ExitStatus StatusOf(FailureKind kind) {
  switch (kind) {
    case FailureKind::kRefusedLogin:
    case FailureKind::kExpiredPassword:
    case FailureKind::kFault:
      return ExitStatus::kRefused;
    case FailureKind::kSecretFailed:
    case FailureKind::kAbandoned:
    case FailureKind::kLocal:
      return ExitStatus::kLocal;
    default:
      return ExitStatus::kUnreachable;
  }
}

std::string RemedyFor(FailureKind kind) {
  switch (kind) {
    case FailureKind::kRefusedLogin:
      return "check the user name, the password or the key";
    case FailureKind::kFault:
      return "look for the reason in the log of the service";
    case FailureKind::kExpiredPassword:
      return "set a new password at the service";
    case FailureKind::kUnreachable:
    case FailureKind::kTlsTrust:
    case FailureKind::kTlsName:
    case FailureKind::kTls:
    case FailureKind::kHttpStatus:
    case FailureKind::kBadAnswer:
      return "run 'ssoclient doctor' with the same URL and CA";
    case FailureKind::kTimedOut:
      return "run 'ssoclient doctor', or allow more time with --timeout";
    default:
      return "";
  }
}

}  // namespace

Failure::Failure(ExitStatus exitStatus, KindName name, std::string text, std::string advice)
    : status(exitStatus), kind(name.Text()), message(std::move(text)), remedy(std::move(advice)) {}

ToolException::ToolException(Failure failure)
    : std::runtime_error(failure.message), failure_(std::move(failure)) {}

Failure MakeFailure(FailureKind kind, std::string message) {
  return {StatusOf(kind), KindName::Find(Access::NameOf(kind)), std::move(message),
          RemedyFor(kind)};
}

Failure MakeFailure(FailureKind kind, std::string message, const Tarnik::Exception& cause) {
  Failure failure = MakeFailure(kind, std::move(message));
  if (kind == FailureKind::kBadToken) {
    failure.remedy = TokenRemedy(cause);
  }
  return failure;
}

Failure FailureOf(const std::exception& exception) {
  if (const auto* own = dynamic_cast<const ToolException*>(&exception)) {
    return own->GetFailure();
  }
  if (const auto* known = dynamic_cast<const Tarnik::Exception*>(&exception)) {
    return MakeFailure(Access::Classify(*known), known->what(), *known);
  }
  return {ExitStatus::kLocal, "local", exception.what(), ""};
}

}  // namespace SsoClient::Tool
