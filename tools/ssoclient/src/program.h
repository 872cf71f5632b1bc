#ifndef SSOCLIENT_TOOL_PROGRAM_H
#define SSOCLIENT_TOOL_PROGRAM_H

#include "exit_status.h"
#include "output/console.h"

namespace SsoClient::Tool {

/// Reads the command line, runs the command and reports its failure: with --json as an object with
/// the member "error" on `console.out`, otherwise as text on `console.err`. Returns `kLocal` if
/// that report itself fails.
ExitStatus RunProgram(int argc, const char* const* argv, const Console& console);

}  // namespace SsoClient::Tool

#endif
