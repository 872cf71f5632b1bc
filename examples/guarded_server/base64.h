#ifndef GUARDED_SERVER_BASE64_H
#define GUARDED_SERVER_BASE64_H

#include <optional>
#include <string>
#include <string_view>

namespace GuardedServer {

/// The bytes of a Base64 text in either alphabet of RFC 4648, with its padding or without it;
/// nothing for any other text.
std::optional<std::string> DecodeBase64(std::string_view text);

}  // namespace GuardedServer

#endif
