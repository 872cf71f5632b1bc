#ifndef SSOCLIENT_TOOL_OUTPUT_DURATION_TEXT_H
#define SSOCLIENT_TOOL_OUTPUT_DURATION_TEXT_H

#include <chrono>
#include <optional>
#include <string>
#include <string_view>

#include <tarnik/system/date_time.h>

namespace SsoClient::Tool {

/// A duration for people in its largest unit and the next one: "2 h 5 min", "3 min", "31 d", "0 s".
/// The rest is left out. The sign is too.
std::string DurationText(std::chrono::seconds duration);

/// The reverse for the command line: a whole number and one of the units "s", "m" or "min",
/// "h" and "d", or seconds without a unit, such as "90", "5m" and "31d". None for anything else and
/// for more than 36500 days.
std::optional<std::chrono::seconds> ParseDuration(std::string_view text);

/// The time to the second, such as "2026-11-22 16:30:00 UTC".
std::string TimeText(const Tarnik::System::DateTime& time);

/// The time from `from` until `to` in whole seconds, rounded down; negative if `to` is earlier.
std::chrono::seconds SecondsBetween(const Tarnik::System::DateTime& from,
                                    const Tarnik::System::DateTime& to);

}  // namespace SsoClient::Tool

#endif
