#ifndef SSOCLIENT_TOOL_SERVICE_CLOCK_OFFSET_H
#define SSOCLIENT_TOOL_SERVICE_CLOCK_OFFSET_H

namespace SsoClient::Tool {

/// When the clocks of this machine and the service differ by more than this, in seconds, every
/// command points it out: requests are valid only for a short time, which may be a minute.
inline constexpr long kLargeClockOffsetSec = 30;

}  // namespace SsoClient::Tool

#endif
