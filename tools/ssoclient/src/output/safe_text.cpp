#include "output/safe_text.h"

#include <array>
#include <cstdio>

#include <tarnik/text/display_text.h>

#include "output/text_width.h"

namespace SsoClient::Tool {
namespace {

constexpr std::size_t kMaxShownBytes = 4000;

std::string Formatted(const char* format, unsigned value) {
  std::array<char, 16> text{};
  std::snprintf(text.data(), text.size(), format, value);  // NOLINT(cert-err33-c): always fits
  return text.data();
}

bool IsUnsafe(std::string_view character) {
  return character != "?" && character != "\n" && Tarnik::ToDisplayText(character, 4) == "?";
}

// Calls `write` with each character, and appends what it returns.
template <typename Write>
std::string Rewritten(std::string_view text, Write write) {
  std::string result;
  result.reserve(text.size());
  while (!text.empty()) {
    const std::size_t length = FirstCharacterLength(text);
    result += write(text.substr(0, length));
    text.remove_prefix(length);
  }
  return result;
}

}  // namespace

std::string SafeText(const Console& console, std::string_view text) {
  std::string shown = Tarnik::ToDisplayText(text, kMaxShownBytes);
  if (console.isUtf8) {
    return shown;
  }
  return Rewritten(shown, [](std::string_view character) {
    return character.size() == 1
               ? std::string(character)
               : Formatted("<U+%04X>", static_cast<unsigned>(CodePointOf(character)));
  });
}

std::string SafeJson(std::string_view json) {
  return Rewritten(json, [](std::string_view character) {
    // All of them are below U+10000, where one escape is enough.
    return IsUnsafe(character) ? Formatted("\\u%04x", static_cast<unsigned>(CodePointOf(character)))
                               : std::string(character);
  });
}

}  // namespace SsoClient::Tool
