#ifndef DEVSTS_TIME_TEXT_H
#define DEVSTS_TIME_TEXT_H

#include <chrono>
#include <optional>
#include <string>
#include <string_view>

namespace DevSts {

using Time = std::chrono::sys_time<std::chrono::milliseconds>;

Time Now();

// xs:dateTime in UTC with milliseconds (XML Schema 1.0 Part 2, section 3.2.7).
std::string TimeToText(Time time);

// Reads an xs:dateTime that names its zone; fractions below a millisecond are cut.
std::optional<Time> TimeFromText(std::string_view text);

}  // namespace DevSts

#endif
