#ifndef SSOCLIENT_TOOL_SERVICE_HTTP_DATE_H
#define SSOCLIENT_TOOL_SERVICE_HTTP_DATE_H

#include <optional>
#include <string>

namespace SsoClient::Tool {

/// The Unix time of a Date in the form that servers must send (RFC 9110, section 5.6.7); nothing
/// for any other.
std::optional<long> ParseHttpDate(const std::string& text);

}  // namespace SsoClient::Tool

#endif
