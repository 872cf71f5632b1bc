#ifndef SSOCLIENT_TESTS_CHAOS_CLOCK_JUMP_H
#define SSOCLIENT_TESTS_CHAOS_CLOCK_JUMP_H

#include <chrono>

namespace SsoClient::Testing {

/// Sets how much the clock of this process, as C++, OpenSSL and the C library's `time` read it,
/// differs from the system's. Steady clocks do not change.
void SetClockOffset(std::chrono::seconds offset) noexcept;

}  // namespace SsoClient::Testing

#endif
