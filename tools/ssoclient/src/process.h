#ifndef SSOCLIENT_TOOL_PROCESS_H
#define SSOCLIENT_TOOL_PROCESS_H

#include "exit_status.h"
#include "output/console.h"

namespace SsoClient::Tool {

/// Prepares the process for secrets and for failures of its output. Called once, before anything
/// else: failed writes are errors and not signals, and no file that the program opens takes the
/// place of a standard stream that is closed. The system makes no core dump of the process, and
/// lets no other process of the user read its memory or trace it; root still can.
void PrepareProcess();

/// Writes out what is left in `console`. Returns `status`, but `kLocal` after a message if the
/// result of a command that has succeeded is lost.
ExitStatus FinishOutput(const Console& console, ExitStatus status);

/// Ends the process. Without running destructors if a call still uses what they would destroy.
[[noreturn]] void EndProcess(ExitStatus status);

}  // namespace SsoClient::Tool

#endif
