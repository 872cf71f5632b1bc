#ifndef SSOCLIENT_XML_XML_DATE_TIME_H
#define SSOCLIENT_XML_XML_DATE_TIME_H

#include <cstdint>
#include <string>

#include <tarnik/system/date_time.h>

#include "xml/builders.h"

namespace SsoClient {

/// XML Schema's dateTime form (XML Schema Part 2, section 3.2.7) with exactly three digits of
/// fraction: "2024-03-05T07:08:09.010Z".
std::string FormatXmlDateTime(const Tarnik::System::DateTime& time);

/// The UTC time `minutes` after `time`. The distance is a 32-bit count of microseconds: it is exact
/// up to 35 minutes and wraps beyond.
Tarnik::System::DateTime AddMinutes(const Tarnik::System::DateTime& time, std::uint32_t minutes);

/// Appends wsu:Created and wsu:Expires (Web Services Security: SOAP Message Security 1.0, section
/// 10) to `element`, which declares the prefix.
void AddCreatedAndExpires(XMLCompositeBuilder& element, const Tarnik::System::DateTime& created,
                          const Tarnik::System::DateTime& expires);

}  // namespace SsoClient

#endif
