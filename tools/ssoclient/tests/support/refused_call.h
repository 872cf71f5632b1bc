#ifndef SSOCLIENT_TOOL_TESTS_SUPPORT_REFUSED_CALL_H
#define SSOCLIENT_TOOL_TESTS_SUPPORT_REFUSED_CALL_H

#include <cstdint>

namespace SsoClient::Tool::Testing {

/// Lets the system refuse a system call to this process with EMFILE until it ends, as a process
/// without free descriptors would see it. `number` is one of __NR_*. Unlike a limit on descriptors,
/// it does not disturb sanitizers. Async-signal-safe, for `ToolOptions::prepare`; ends the process
/// when the system does not permit it.
void RefuseSystemCall(std::uint32_t number);

}  // namespace SsoClient::Tool::Testing

#endif
