#include "crypto/der_writer.h"

#include <algorithm>

namespace Tarnik::Crypto {
namespace {

constexpr std::size_t kLongForm = 0x80;

std::string LengthOf(std::string_view content) {
  if (content.size() < kLongForm) {
    return {static_cast<char>(content.size())};
  }
  std::string digits;
  for (std::size_t rest = content.size(); rest != 0; rest >>= 8) {
    digits.insert(digits.begin(), static_cast<char>(rest & 0xFF));
  }
  return static_cast<char>(kLongForm | digits.size()) + digits;
}

}  // namespace

std::string DerOf(DerTag tag, std::string_view content) {
  return static_cast<char>(tag) + LengthOf(content).append(content);
}

std::string DerOfNumber(std::string_view bytes) {
  bytes.remove_prefix(std::min(bytes.find_first_not_of('\0'), bytes.size()));
  // The number is not negative, so the first bit is 0.
  const bool needsZero = bytes.empty() || (static_cast<unsigned char>(bytes.front()) & 0x80) != 0;
  return DerOf(DerTag::kInteger, std::string(needsZero ? 1 : 0, '\0').append(bytes));
}

std::string DerOfBits(std::string_view bytes) {
  return DerOf(DerTag::kBitString, std::string(1, '\0').append(bytes));
}

}  // namespace Tarnik::Crypto
