#ifndef SSOCLIENT_TOOL_OPTIONS_DURATION_CHECKS_H
#define SSOCLIENT_TOOL_OPTIONS_DURATION_CHECKS_H

#include <string>

namespace SsoClient::Tool {

/// For `CLI::Option::check`: what is wrong with a duration, or an empty text. `ParseDuration` reads
/// those that are accepted.
std::string CheckDuration(const std::string& text);
/// The same, and 0 is wrong.
std::string CheckPositiveDuration(const std::string& text);

}  // namespace SsoClient::Tool

#endif
