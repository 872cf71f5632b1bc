#ifndef FUZZ_WRITTEN_REQUEST_H
#define FUZZ_WRITTEN_REQUEST_H

#include <optional>
#include <string>
#include <utility>
#include <vector>

namespace Fuzz {

/// A request as its receiver reads it.
struct WrittenRequest {
  std::string method;
  std::string target;
  std::vector<std::pair<std::string, std::string>> headers;
  std::string body;
};

std::string LowerCase(std::string text);

/// Reads one request of RFC 9112 strictly and removes it from `wire`.
WrittenRequest TakeRequest(std::string& wire);

/// The value of a header, which may not occur twice.
std::optional<std::string> HeaderOf(const WrittenRequest& request, const std::string& name);

}  // namespace Fuzz

#endif
