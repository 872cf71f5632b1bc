#include "exit_status.h"

namespace SsoClient::Tool {

const char* NameOf(ExitStatus status) noexcept {
  switch (status) {
    case ExitStatus::kDone:
      return "done";
    case ExitStatus::kRefused:
      return "refused";
    case ExitStatus::kUsage:
      return "usage";
    case ExitStatus::kUnreachable:
      return "unreachable";
    case ExitStatus::kLocal:
      return "local";
  }
  return "unknown";
}

}  // namespace SsoClient::Tool
