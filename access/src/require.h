#ifndef SSOCLIENT_ACCESS_REQUIRE_H
#define SSOCLIENT_ACCESS_REQUIRE_H

#include <string>
#include <string_view>

#include <tarnik/core/exception.h>

namespace SsoClient::Access {

/// Throws an `InvalidArgumentException` with `message` unless `condition` is true.
inline void Require(bool condition, std::string_view message) {
  if (!condition) {
    throw Tarnik::InvalidArgumentException(std::string(message));
  }
}

}  // namespace SsoClient::Access

#endif
