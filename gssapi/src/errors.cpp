#include "errors.h"

#include <cstddef>

#include <ssoclient/exceptions.h>

#include "handles.h"

namespace SsoClient {

namespace {

constexpr std::size_t kMaxLength = 500;

bool IsBetween(char c, unsigned char first, unsigned char last) {
  const auto byte = static_cast<unsigned char>(c);
  return first <= byte && byte <= last;
}

std::size_t LengthFor(char lead) {
  if (IsBetween(lead, 0, 0x7f)) {
    return 1;
  }
  if (IsBetween(lead, 0xc2, 0xdf)) {
    return 2;
  }
  if (IsBetween(lead, 0xe0, 0xef)) {
    return 3;
  }
  return IsBetween(lead, 0xf0, 0xf4) ? 4 : 0;
}

// Overlong forms, surrogates, and values beyond Unicode.
bool IsForbidden(char lead, char second) {
  return (lead == '\xe0' && IsBetween(second, 0x80, 0x9f)) ||
         (lead == '\xed' && IsBetween(second, 0xa0, 0xbf)) ||
         (lead == '\xf0' && IsBetween(second, 0x80, 0x8f)) ||
         (lead == '\xf4' && IsBetween(second, 0x90, 0xbf));
}

// The first character of the text in UTF-8 (RFC 3629, section 4); empty if the text does not begin
// with a valid one.
std::string_view FirstCharacter(std::string_view text) {
  const std::string_view character = text.substr(0, LengthFor(text.front()));
  if (character.size() < LengthFor(text.front())) {
    return {};
  }
  for (const char c : character.substr(character.empty() ? 0 : 1)) {
    if (!IsBetween(c, 0x80, 0xbf)) {
      return {};
    }
  }
  const bool isLong = character.size() > 2;
  return isLong && IsForbidden(character[0], character[1]) ? std::string_view() : character;
}

bool IsControl(std::string_view character) {
  const char first = character.front();
  const bool isOfC1 =
      character.size() == 2 && first == '\xc2' && IsBetween(character[1], 0x80, 0x9f);
  return IsBetween(first, 0, 0x1f) || first == '\x7f' || isOfC1;
}

bool IsDroppedAtTheEnd(char c) {
  return c == ' ' || IsControl({&c, 1});
}

std::string TextsOf(OM_uint32 code, int type) {
  std::string texts;
  OM_uint32 next = 0;
  do {
    OM_uint32 minor = 0;
    GssBuffer text;
    if (GSS_ERROR(gss_display_status(&minor, code, type, GSS_C_NO_OID, &next, text.Address())) !=
        0) {
      break;
    }
    texts += texts.empty() ? "" : ", ";
    texts += PlainText({static_cast<const char*>(text.Get().value), text.Get().length});
  } while (next != 0);
  return texts;
}

}  // namespace

std::string PlainText(std::string_view text) {
  while (!text.empty() && IsDroppedAtTheEnd(text.back())) {
    text.remove_suffix(1);
  }
  std::string plain;
  while (!text.empty()) {
    const std::string_view character = FirstCharacter(text);
    const bool isPlain = !character.empty() && !IsControl(character);
    const std::string_view written = isPlain ? character : "?";
    if (plain.size() + written.size() > kMaxLength) {
      return plain + "...";
    }
    plain += written;
    text.remove_prefix(character.empty() ? 1 : character.size());
  }
  return plain;
}

void CheckGssStatus(const std::string& attempt, const GssStatus& status) {
  if (GSS_ERROR(status.major) == 0) {
    return;
  }
  std::string message = attempt + ": " + TextsOf(status.major, GSS_C_GSS_CODE);
  if (status.minor != 0) {
    message += " (" + TextsOf(status.minor, GSS_C_MECH_CODE) + ")";
  }
  throw SsoException(message + ".");
}

}  // namespace SsoClient
