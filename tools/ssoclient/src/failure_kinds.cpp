#include "failure_kinds.h"

#include <stdexcept>

namespace SsoClient::Tool {

KindName KindName::Find(std::string_view name) {
  const auto* const found = std::lower_bound(kFailureKinds.begin(), kFailureKinds.end(), name);
  if (found == kFailureKinds.end() || *found != name) {
    throw std::logic_error("there is no kind of failures '" + std::string(name) + "'");
  }
  return {*found, Listed()};
}

}  // namespace SsoClient::Tool
