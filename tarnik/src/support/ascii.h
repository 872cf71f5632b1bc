#ifndef TARNIK_SUPPORT_ASCII_H
#define TARNIK_SUPPORT_ASCII_H

#include <algorithm>
#include <string_view>

namespace Tarnik {

// Classes of ASCII characters, independent of the locale.

constexpr bool IsAscii(char c) noexcept {
  return static_cast<unsigned char>(c) < 0x80;
}

constexpr bool IsDigit(char c) noexcept {
  return c >= '0' && c <= '9';
}

constexpr bool IsHexDigit(char c) noexcept {
  return IsDigit(c) || (c >= 'a' && c <= 'f') || (c >= 'A' && c <= 'F');
}

constexpr bool IsLetter(char c) noexcept {
  return (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z');
}

/// CTL of RFC 5234, appendix B.1.
constexpr bool IsControl(char c) noexcept {
  return static_cast<unsigned char>(c) < 0x20 || c == 0x7F;
}

/// True for one or more digits.
inline bool AreDigits(std::string_view text) noexcept {
  return !text.empty() && std::all_of(text.begin(), text.end(), IsDigit);
}

constexpr char ToLowerAscii(char c) noexcept {
  return c >= 'A' && c <= 'Z' ? static_cast<char>(c - 'A' + 'a') : c;
}

/// Compares without regard to the case of ASCII letters.
inline bool EqualsIgnoringCase(std::string_view a, std::string_view b) noexcept {
  return std::equal(a.begin(), a.end(), b.begin(), b.end(),
                    [](char x, char y) { return ToLowerAscii(x) == ToLowerAscii(y); });
}

}  // namespace Tarnik

#endif
