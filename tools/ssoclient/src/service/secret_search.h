#ifndef SSOCLIENT_TOOL_SERVICE_SECRET_SEARCH_H
#define SSOCLIENT_TOOL_SERVICE_SECRET_SEARCH_H

#include <string_view>

namespace SsoClient::Tool {

/// Whether `text`, which a service has a part in, contains `secret`: as it is, with characters
/// escaped as in XML (1.0, section 4.1), several times over, with other white space or control
/// characters, or, if four or more bytes of it, cut at the end of the text. False for an empty
/// secret.
bool ContainsSecret(std::string_view text, std::string_view secret);

}  // namespace SsoClient::Tool

#endif
