#include "host_model.h"

#include <cstddef>
#include <regex>

#include <arpa/inet.h>

namespace Fuzz {

std::string AddressBytes(const std::string& text) {
  char bytes[sizeof(in6_addr)];
  if (text.find('\0') != std::string::npos) {
    return "";
  }
  if (inet_pton(AF_INET, text.c_str(), bytes) == 1) {
    return {bytes, sizeof(in_addr)};
  }
  if (inet_pton(AF_INET6, text.c_str(), bytes) == 1) {
    return {bytes, sizeof(in6_addr)};
  }
  return "";
}

bool IsHostToCall(const std::string& text) {
  constexpr std::size_t kMaxLength = 253;
  static const std::regex name(
      "([A-Za-z0-9_]([A-Za-z0-9_-]{0,61}[A-Za-z0-9_])?[.])*"
      "[A-Za-z0-9_]([A-Za-z0-9_-]{0,61}[A-Za-z0-9_])?[.]?");
  static const std::regex number("(.*[.])?([0-9]+|0[xX][0-9A-Fa-f]*)[.]?");
  if (!AddressBytes(text).empty()) {
    return true;
  }
  const bool hasRoot = text.size() > 1 && text.back() == '.';
  return text.size() <= kMaxLength + (hasRoot ? 1 : 0) && std::regex_match(text, name) &&
         !std::regex_match(text, number);
}

}  // namespace Fuzz
