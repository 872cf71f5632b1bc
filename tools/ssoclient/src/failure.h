#ifndef SSOCLIENT_TOOL_FAILURE_H
#define SSOCLIENT_TOOL_FAILURE_H

#include <exception>
#include <stdexcept>
#include <string>

#include <ssoclient/access/failure_kind.h>
#include <tarnik/core/exception.h>

#include "exit_status.h"
#include "failure_kinds.h"

namespace SsoClient::Tool {

/// Why a command failed. The texts contain no secret and no token text.
struct Failure {
  Failure(ExitStatus exitStatus, KindName name, std::string text, std::string advice);

  ExitStatus status;
  std::string kind;     ///< for programs, one of `kFailureKinds`
  std::string message;  ///< one line for people
  std::string remedy;   ///< what the user can do; may be empty
};

/// Thrown by the parts of the program for failures of their own.
class ToolException : public std::runtime_error {
 public:
  explicit ToolException(Failure failure);
  const Failure& GetFailure() const noexcept { return failure_; }

 private:
  Failure failure_;
};

/// A failure of the kind, with its status and its remedy.
Failure MakeFailure(Access::FailureKind kind, std::string message);
/// The same for an exception of the libraries. The remedy of `kBadToken` depends on it.
Failure MakeFailure(Access::FailureKind kind, std::string message, const Tarnik::Exception& cause);

/// The failure that an exception of this program or of the libraries means.
Failure FailureOf(const std::exception& exception);

}  // namespace SsoClient::Tool

#endif
