#ifndef SSOCLIENT_XML_XML_DATE_TIME_H
#define SSOCLIENT_XML_XML_DATE_TIME_H

#include <cstdint>
#include <string>

#include <tarnik/system/date_time.h>

namespace SsoClient {

/// XML Schema's dateTime form (XML Schema Part 2, section 3.2.7) with exactly three digits of
/// fraction: "2024-03-05T07:08:09.010Z".
std::string FormatXmlDateTime(const Tarnik::System::DateTime& time);

/// `time` moved by `minutes`, told in UTC. The distance is a 32-bit count of microseconds: it is
/// exact up to 35 minutes and wraps beyond.
Tarnik::System::DateTime AddMinutes(const Tarnik::System::DateTime& time, std::uint32_t minutes);

}  // namespace SsoClient

#endif
