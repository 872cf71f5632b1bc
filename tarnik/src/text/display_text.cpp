#include <algorithm>

#include <tarnik/text/display_text.h>

namespace Tarnik {
namespace {

unsigned char ByteAt(std::string_view text, std::size_t index) noexcept {
  return static_cast<unsigned char>(text[index]);
}

// The length that the first byte of a character announces, or 0 (RFC 3629, section 3).
std::size_t AnnouncedLength(unsigned char first) noexcept {
  if (first < 0x80) {
    return 1;
  }
  if (first >= 0xC2 && first <= 0xDF) {
    return 2;
  }
  if (first >= 0xE0 && first <= 0xEF) {
    return 3;
  }
  return first >= 0xF0 && first <= 0xF4 ? 4 : 0;
}

// Excludes overlong forms, surrogates and numbers above U+10FFFF (RFC 3629, section 4).
bool IsSecondByte(unsigned char first, unsigned char second) noexcept {
  const unsigned char lowest = first == 0xE0 ? 0xA0 : first == 0xF0 ? 0x90 : 0x80;
  const unsigned char highest = first == 0xED ? 0x9F : first == 0xF4 ? 0x8F : 0xBF;
  return second >= lowest && second <= highest;
}

/// The length of the character that `text` starts with; 0 when it starts with none.
std::size_t CharacterLength(std::string_view text) noexcept {
  const std::size_t length = AnnouncedLength(ByteAt(text, 0));
  if (length > text.size() || (length > 1 && !IsSecondByte(ByteAt(text, 0), ByteAt(text, 1)))) {
    return 0;
  }
  for (std::size_t i = 2; i < length; ++i) {
    if ((ByteAt(text, i) & 0xC0) != 0x80) {
      return 0;
    }
  }
  return length;
}

bool IsControl(std::string_view character) noexcept {
  const unsigned char first = ByteAt(character, 0);
  return first < 0x20 || first == 0x7F || (first == 0xC2 && ByteAt(character, 1) < 0xA0);
}

/// Ends a line, or changes the order in which the text around it is shown: U+2028 and U+2029, and
/// the characters with the property Bidi_Control (Unicode Standard Annex #9, section 2).
bool MovesOtherText(std::string_view character) noexcept {
  if (character == "\u061C") {
    return true;
  }
  return (character >= "\u200E" && character <= "\u200F") ||
         (character >= "\u2028" && character <= "\u202E") ||
         (character >= "\u2066" && character <= "\u2069");
}

}  // namespace

std::string ToDisplayText(std::string_view text, std::size_t maxBytes) {
  std::string shown;
  shown.reserve(std::min(text.size(), maxBytes) + 3);
  for (std::size_t position = 0; position < text.size();) {
    const std::size_t length = CharacterLength(text.substr(position));
    const std::string_view character = text.substr(position, std::max<std::size_t>(length, 1));
    if (position + character.size() > maxBytes) {
      return shown.append("...");
    }
    if (length == 0 || IsControl(character) || MovesOtherText(character)) {
      shown.push_back('?');
    } else {
      shown.append(character);
    }
    position += character.size();
  }
  return shown;
}

}  // namespace Tarnik
