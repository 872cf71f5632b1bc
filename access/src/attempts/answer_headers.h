#ifndef SSOCLIENT_ACCESS_ATTEMPTS_ANSWER_HEADERS_H
#define SSOCLIENT_ACCESS_ATTEMPTS_ANSWER_HEADERS_H

#include <chrono>
#include <optional>
#include <string>
#include <string_view>

namespace SsoClient::Access {

/// A moment on a system clock. In milliseconds, which cover all years of four digits.
using WallTime = std::chrono::sys_time<std::chrono::milliseconds>;

/// The moment of an HTTP-date in one of its three forms (RFC 9110, section 5.6.7); none for any
/// other text. A year of two digits is the one that is at most 50 years after `now`.
std::optional<WallTime> ParseHttpDate(std::string_view text, WallTime now);

/// How long a Retry-After asks to wait, given in seconds or as an HTTP-date (RFC 9110, section
/// 10.2.3), by the clock of the peer, which reads `peerNow`. Zero for any other text and for the
/// past; at most a year.
std::chrono::milliseconds ParseRetryAfter(std::string_view text, WallTime peerNow);

/// The peer's clock minus this system's: the least difference with which an answer that was
/// received between `sent` and `received` can contain `date`, which is in whole seconds.
std::chrono::milliseconds EstimateClockOffset(WallTime date, WallTime sent, WallTime received);

/// "2024-03-05T07:08:09.010Z".
std::string FormatWallTime(WallTime time);

}  // namespace SsoClient::Access

#endif
