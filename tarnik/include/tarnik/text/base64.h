#ifndef TARNIK_TEXT_BASE64_H
#define TARNIK_TEXT_BASE64_H

#include <cstddef>

#include <tarnik/export.h>

namespace Tarnik {

// `StringUtil::Base64Decode` (tarnik/text/string_util.h) decodes.

/// Length in characters of the Base64 text of `length` bytes at `data`: four for each group of
/// three or fewer bytes, without line breaks and without a terminating NUL. Throws
/// `InvalidArgumentException` when `data` is null and `length` is not 0, and when the length of the
/// text does not fit into `std::size_t`.
TARNIK_EXPORT std::size_t Base64_EncodedLength(const unsigned char* data, std::size_t length);

/// Writes the standard, padded Base64 text (RFC 4648, section 4) of `length` bytes at `data` to
/// `buffer`, in one line and without a terminating NUL, and sets `written` to its length, which
/// `Base64_EncodedLength` also returns. Throws `InvalidArgumentException` as that function does,
/// when `written` is null, when `bufferSize` characters are too few, and when `buffer` is null but
/// `length` is not 0; nothing is written then. `data` and `buffer` must not overlap.
TARNIK_EXPORT void Base64_Encode(const unsigned char* data, std::size_t length, char* buffer,
                                 std::size_t bufferSize, std::size_t* written);

}  // namespace Tarnik

#endif
