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

// WS-Security 1.1, section 6.3.
inline constexpr char kBase64Binary[] =
    "http://docs.oasis-open.org/wss/2004/01/"
    "oasis-200401-wss-soap-message-security-1.0#Base64Binary";

// RFC 4648, section 4, in one line.
std::string ToBase64(const Octets& octets);

// White space anywhere is ignored. Throws XmlError.
Octets FromBase64(std::string text);

using Time = std::chrono::sys_time<std::chrono::milliseconds>;

Time Now();

// xs:dateTime in UTC with milliseconds (XML Schema 1.0 Part 2, section 3.2.7).
std::string TimeToText(Time time);

// Reads an xs:dateTime that names its zone; fractions below a millisecond are cut.
std::optional<Time> TimeFromText(std::string_view text);

}  // namespace DevSts

#endif
