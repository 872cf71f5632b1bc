#include "base64.h"

#include <algorithm>
#include <cstddef>

namespace GuardedServer {
namespace {

/// The value of a digit in either alphabet; 64 for other characters.
unsigned ValueOf(char digit) {
  constexpr std::string_view kStandard =
      "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/";
  const char standard = digit == '-' ? '+' : digit == '_' ? '/' : digit;
  return static_cast<unsigned>(std::min<std::size_t>(kStandard.find(standard), 64));
}

}  // namespace

std::optional<std::string> DecodeBase64(std::string_view text) {
  const std::string_view digits = text.substr(0, text.find('='));
  const std::string_view padding = text.substr(digits.size());
  bool isBase64 = digits.size() % 4 != 1 && (padding.empty() || text.size() % 4 == 0) &&
                  (padding.empty() || padding == "=" || padding == "==");
  std::string bytes;
  unsigned bits = 0;
  unsigned count = 0;
  for (const char digit : digits) {
    const unsigned value = ValueOf(digit);
    isBase64 = isBase64 && value < 64;
    bits = (bits << 6U | value) & 0xFFFFU;
    count += 6;
    if (count >= 8) {
      count -= 8;
      bytes += static_cast<char>(bits >> count & 0xFFU);
    }
  }
  return isBase64 ? std::optional(bytes) : std::nullopt;
}

}  // namespace GuardedServer
