#ifndef TARNIK_TEXT_DISPLAY_TEXT_H
#define TARNIK_TEXT_DISPLAY_TEXT_H

#include <cstddef>
#include <string>
#include <string_view>

#include <tarnik/export.h>

namespace Tarnik {

/// `text` of a peer in a form that is safe in messages and log lines. Text of up to `maxBytes`
/// bytes of UTF-8 (RFC 3629) without control characters is returned as it is. Longer text is cut at
/// the start of a character and ends in "...". Each control character (C0, C1 and DEL, and those
/// that end a line or change the direction of text in Unicode) and each byte that is not part of
/// UTF-8 becomes a question mark. Thread-safe.
TARNIK_EXPORT std::string ToDisplayText(std::string_view text, std::size_t maxBytes);

}  // namespace Tarnik

#endif
