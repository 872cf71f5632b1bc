#ifndef DEVSTS_BASE64_H
#define DEVSTS_BASE64_H

#include <string>
#include <vector>

namespace DevSts {

// WS-Security 1.1, section 6.3.
inline constexpr char kBase64Binary[] =
    "http://docs.oasis-open.org/wss/2004/01/"
    "oasis-200401-wss-soap-message-security-1.0#Base64Binary";

// RFC 4648, section 4, in one line.
std::string ToBase64(const std::vector<unsigned char>& octets);

// White space anywhere is ignored. Throws XmlError.
std::vector<unsigned char> FromBase64(std::string text);

}  // namespace DevSts

#endif
