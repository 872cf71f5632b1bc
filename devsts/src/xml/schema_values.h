#ifndef DEVSTS_XML_SCHEMA_VALUES_H
#define DEVSTS_XML_SCHEMA_VALUES_H

#include <chrono>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace DevSts {

// Values of XML Schema's simple types as text: base64Binary and dateTime.

using Octets = std::vector<unsigned char>;

// The EncodingType of a binary token (WS-Security 1.1, section 6.3).
inline constexpr char kBase64Binary[] =
    "http://docs.oasis-open.org/wss/2004/01/"
    "oasis-200401-wss-soap-message-security-1.0#Base64Binary";

// Whether the text is UTF-8 without the character 0.
bool IsUtf8(const std::string& text);

// Base64 (RFC 4648, section 4) without line breaks.
std::string ToBase64(const Octets& octets);

// Ignores white space. Throws XmlError if the text is not Base64.
Octets FromBase64(std::string text);

using Time = std::chrono::sys_time<std::chrono::milliseconds>;

Time Now();

// xs:dateTime in UTC with milliseconds (XML Schema 1.0 Part 2, section 3.2.7).
std::string TimeToText(Time time);

// Reads an xs:dateTime that has a time zone; fractions of a millisecond are truncated.
std::optional<Time> TimeFromText(std::string_view text);

}  // namespace DevSts

#endif
