#ifndef SSOCLIENT_TOOL_EXIT_STATUS_H
#define SSOCLIENT_TOOL_EXIT_STATUS_H

namespace SsoClient::Tool {

/// The exit status of the program. Scripts depend on the numbers.
enum class ExitStatus {
  kDone = 0,
  kRefused = 1,      ///< the service refused the request, or a check refused the token
  kUsage = 2,        ///< the command line is wrong
  kUnreachable = 3,  ///< no usable answer: the network, TLS, HTTP, a time-out or a broken answer
  kLocal = 4,        ///< a file, a key, a secret or a resource of this machine
};

/// The name in lower case, such as "refused"; valid for the lifetime of the process.
const char* NameOf(ExitStatus status) noexcept;

}  // namespace SsoClient::Tool

#endif
