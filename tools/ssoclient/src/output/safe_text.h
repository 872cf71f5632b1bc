#ifndef SSOCLIENT_TOOL_OUTPUT_SAFE_TEXT_H
#define SSOCLIENT_TOOL_OUTPUT_SAFE_TEXT_H

#include <string>
#include <string_view>

#include "output/console.h"

namespace SsoClient::Tool {

/// Text of a token, a certificate or a file name as it may be written for people: control
/// characters, those that change the direction of text, and bytes that are not UTF-8 are question
/// marks. In a locale that is not UTF-8, where the bytes of other characters could be controls,
/// these are written as "<U+00E9>". Texts above 4000 bytes are cut and end in "...".
std::string SafeText(const Console& console, std::string_view text);

/// JSON with the same meaning in which these characters, which only occur in strings, are escaped
/// (RFC 8259, section 7). `json` is UTF-8.
std::string SafeJson(std::string_view json);

}  // namespace SsoClient::Tool

#endif
