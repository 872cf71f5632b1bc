#ifndef TARNIK_TEXT_STRING_UTIL_H
#define TARNIK_TEXT_STRING_UTIL_H

#include <string>
#include <string_view>
#include <vector>

#include <tarnik/export.h>

namespace Tarnik::StringUtil {

/// The standard Base64 text of `bytes` (RFC 4648, section 4), padded, in one line.
TARNIK_EXPORT std::string Base64Encode(const std::vector<unsigned char>& bytes);

/// Decodes standard Base64 (RFC 4648, section 4) into `bytes`, replacing its content. White space
/// (tab, line feed, carriage return, blank) is skipped, as XML Schema's base64Binary allows.
/// Throws `Base64FormatException` on any other character, missing or misplaced padding, or
/// non-zero bits after the last byte; `bytes` is then unchanged.
TARNIK_EXPORT void Base64Decode(std::string_view text, std::vector<unsigned char>& bytes);

/// A random UUID (RFC 4122, version 4) in its 36-character lower-case form.
TARNIK_EXPORT std::string GenerateUuid();

/// `text` with the ASCII letters A-Z in lower case; other bytes are unchanged.
TARNIK_EXPORT std::string ToLower(std::string_view text);

/// Overwrites the bytes of `text` in a way that is not optimised away, then empties it.
TARNIK_EXPORT void Cleanse(std::string& text) noexcept;

/// The same for bytes.
TARNIK_EXPORT void Cleanse(std::vector<unsigned char>& bytes) noexcept;

}  // namespace Tarnik::StringUtil

#endif
