#ifndef SSOCLIENT_TOOL_INPUT_DECIMAL_TEXT_H
#define SSOCLIENT_TOOL_INPUT_DECIMAL_TEXT_H

#include <cstddef>
#include <string_view>

namespace SsoClient::Tool {

/// Whether the text is a number of 1 to `mostDigits` decimal digits, without a sign. Numbers that
/// begin with 0, except 0 itself, are refused, since CLI11 reads "010" as eight; so is "-1", which
/// some versions of CLI11 convert to a large number.
bool IsDecimal(std::string_view text, std::size_t mostDigits);

}  // namespace SsoClient::Tool

#endif
