#include "xml/xml_chars.h"

#include <cstddef>
#include <cstdint>
#include <cstring>

#include "xml/name_chars.h"

namespace Tarnik::Xml {

namespace {

constexpr char32_t kInvalid = 0xFFFFFFFF;

char32_t Continuation(std::string_view text, std::size_t index) noexcept {
  if (index >= text.size()) {
    return kInvalid;
  }
  const auto byte = static_cast<unsigned char>(text[index]);
  return (byte & 0xC0) == 0x80 ? byte & 0x3F : kInvalid;
}

// Removes the first character from `text`. RFC 3629, section 4 defines the valid sequences.
char32_t TakeCharacter(std::string_view& text) noexcept {
  const auto lead = static_cast<unsigned char>(text.front());
  if (lead < 0x80) {
    text.remove_prefix(1);
    return lead;
  }
  const std::size_t length = lead < 0xE0 ? 2 : lead < 0xF0 ? 3 : 4;
  if (lead < 0xC2 || lead > 0xF4) {
    return kInvalid;
  }
  char32_t character = lead & (0xFF >> (length + 1));
  for (std::size_t index = 1; index < length; ++index) {
    const char32_t bits = Continuation(text, index);
    if (bits == kInvalid) {
      return kInvalid;
    }
    character = character << 6 | bits;
  }
  const bool overlong = (length == 3 && character < 0x800) || (length == 4 && character < 0x10000);
  const bool surrogate = character >= 0xD800 && character <= 0xDFFF;
  if (overlong || surrogate || character > 0x10FFFF) {
    return kInvalid;
  }
  text.remove_prefix(length);
  return character;
}

bool IsXmlCharacter(char32_t character) noexcept {
  if (character < 0x20) {
    return character == '\t' || character == '\n' || character == '\r';
  }
  return character != 0xFFFE && character != 0xFFFF && character != kInvalid;
}

// Skips octets from 0x20 to 0x7F at the front of `text`, eight at a time: most text has no others.
void SkipPlainText(std::string_view& text) noexcept {
  constexpr std::uint64_t kBlanks = 0x2020202020202020;
  constexpr std::uint64_t kHighBits = 0x8080808080808080;
  for (std::uint64_t octets = 0; text.size() >= sizeof octets; text.remove_prefix(sizeof octets)) {
    std::memcpy(&octets, text.data(), sizeof octets);
    // Subtracting sets the high bit of the first octet that is less than a blank.
    if (((octets | (octets - kBlanks)) & kHighBits) != 0) {
      return;
    }
  }
}

}  // namespace

bool IsXmlText(std::string_view text) noexcept {
  for (SkipPlainText(text); !text.empty(); SkipPlainText(text)) {
    if (!IsXmlCharacter(TakeCharacter(text))) {
      return false;
    }
  }
  return true;
}

bool IsNCName(std::string_view name) noexcept {
  if (name.empty() || !IsNameStart(TakeCharacter(name))) {
    return false;
  }
  while (!name.empty()) {
    if (!IsNameCharacter(TakeCharacter(name))) {
      return false;
    }
  }
  return true;
}

bool IsQualifiedName(std::string_view name) noexcept {
  const std::size_t colon = name.find(':');
  if (colon == std::string_view::npos) {
    return IsNCName(name);
  }
  return IsNCName(name.substr(0, colon)) && IsNCName(name.substr(colon + 1));
}

}  // namespace Tarnik::Xml
