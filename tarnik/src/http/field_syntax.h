#ifndef TARNIK_HTTP_FIELD_SYNTAX_H
#define TARNIK_HTTP_FIELD_SYNTAX_H

#include <algorithm>
#include <string_view>

#include "support/ascii.h"

namespace Tarnik::Http {

/// tchar of RFC 9110, section 5.6.2.
constexpr bool IsTokenCharacter(char c) noexcept {
  return IsDigit(c) || IsLetter(c) ||
         (c != '\0' && std::string_view("!#$%&'*+-.^_`|~").find(c) != std::string_view::npos);
}

/// True for a token of RFC 9110, section 5.6.2.
inline bool IsToken(std::string_view text) noexcept {
  return !text.empty() && std::all_of(text.begin(), text.end(), IsTokenCharacter);
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
