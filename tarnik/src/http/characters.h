#ifndef TARNIK_HTTP_CHARACTERS_H
#define TARNIK_HTTP_CHARACTERS_H

#include <algorithm>
#include <string_view>

namespace Tarnik::Http {

inline bool IsDigit(char c) noexcept {
  return c >= '0' && c <= '9';
}

inline bool IsLetter(char c) noexcept {
  return (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z');
}

inline bool IsHexDigit(char c) noexcept {
  return IsDigit(c) || (c >= 'a' && c <= 'f') || (c >= 'A' && c <= 'F');
}

/// CTL of RFC 5234, appendix B.1.
inline bool IsControl(char c) noexcept {
  return static_cast<unsigned char>(c) < 0x20 || c == 0x7F;
}

inline bool IsAscii(char c) noexcept {
  return static_cast<unsigned char>(c) < 0x80;
}

/// tchar of RFC 9110, section 5.6.2.
inline bool IsTokenCharacter(char c) noexcept {
  return IsDigit(c) || IsLetter(c) ||
         (c != '\0' && std::string_view("!#$%&'*+-.^_`|~").find(c) != std::string_view::npos);
}

inline bool IsToken(std::string_view text) noexcept {
  return !text.empty() && std::all_of(text.begin(), text.end(), IsTokenCharacter);
}

inline bool AreDigits(std::string_view text) noexcept {
  return !text.empty() && std::all_of(text.begin(), text.end(), IsDigit);
}

inline char AsciiLower(char c) noexcept {
  return c >= 'A' && c <= 'Z' ? static_cast<char>(c - 'A' + 'a') : c;
}

/// Equality without regard to the case of ASCII letters, whatever the locale.
inline bool EqualsIgnoringCase(std::string_view a, std::string_view b) noexcept {
  return std::equal(a.begin(), a.end(), b.begin(), b.end(),
                    [](char x, char y) { return AsciiLower(x) == AsciiLower(y); });
}

/// `text` without the blanks and tabs at its ends.
inline std::string_view TrimBlanks(std::string_view text) noexcept {
  const auto first = text.find_first_not_of(" \t");
  if (first == std::string_view::npos) {
    return {};
  }
  return text.substr(first, text.find_last_not_of(" \t") - first + 1);
}

}  // namespace Tarnik::Http

#endif
