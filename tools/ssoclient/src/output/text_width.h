#ifndef SSOCLIENT_TOOL_OUTPUT_TEXT_WIDTH_H
#define SSOCLIENT_TOOL_OUTPUT_TEXT_WIDTH_H

#include <cstddef>
#include <string>
#include <string_view>
#include <vector>

namespace SsoClient::Tool {

/// The columns of a terminal that the UTF-8 text takes: none for combining characters, two for wide
/// ones. A byte that is not part of UTF-8 counts one.
std::size_t DisplayWidth(std::string_view text);

/// The text with spaces after it, so that it takes at least `width` columns.
std::string PaddedTo(std::string_view text, std::size_t width);

/// The text in lines of at most `width` columns, which must be positive: broken at spaces, which
/// are left out, and within words that are longer than a line. A line feed begins a new line. Never
/// empty.
std::vector<std::string> WrappedLines(std::string_view text, std::size_t width);

/// The length in bytes of the character at the start of `text`, which is not empty: that of a
/// UTF-8 sequence (RFC 3629, section 3), or 1 for a byte that begins none.
std::size_t FirstCharacterLength(std::string_view text);

/// The code point of a UTF-8 sequence of `FirstCharacterLength` bytes; the byte itself if it is
/// only one.
char32_t CodePointOf(std::string_view character);

}  // namespace SsoClient::Tool

#endif
