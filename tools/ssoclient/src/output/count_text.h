#ifndef SSOCLIENT_TOOL_OUTPUT_COUNT_TEXT_H
#define SSOCLIENT_TOOL_OUTPUT_COUNT_TEXT_H

#include <string>

namespace SsoClient::Tool {

/// A count with its noun, such as "1 day" and "2 days". The plural ends in `pluralEnding`, as in
/// "0 addresses" for `CountText(0, "address", "es")`.
std::string CountText(long count, const std::string& noun, const std::string& pluralEnding = "s");

}  // namespace SsoClient::Tool

#endif
