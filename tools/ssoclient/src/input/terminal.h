#ifndef SSOCLIENT_TOOL_INPUT_TERMINAL_H
#define SSOCLIENT_TOOL_INPUT_TERMINAL_H

#include <cstddef>
#include <string>

#include "input/secret_text.h"

namespace SsoClient::Tool {

/// Whether the process has a terminal, whatever its standard streams are.
bool HasTerminal();

/// Writes `prompt` to the terminal of the process and reads a line without echo; the line feed is
/// not part of the result. After more than `maxBytes` it returns what it has. The terminal is
/// restored in any case: when a signal ends or stops the process, it does so after that; when the
/// process continues, it asks again. Only one thread may call this. Throws `ToolException` when the
/// terminal cannot be used.
SecretText ReadFromTerminal(const std::string& prompt, std::size_t maxBytes);
/// The same at the terminal that `descriptor` refers to, which may be for reading only: there is no
/// prompt then.
SecretText ReadFromTerminal(int descriptor, const std::string& prompt, std::size_t maxBytes);

}  // namespace SsoClient::Tool

#endif
