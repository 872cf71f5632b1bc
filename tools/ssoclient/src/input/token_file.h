#ifndef SSOCLIENT_TOOL_INPUT_TOKEN_FILE_H
#define SSOCLIENT_TOOL_INPUT_TOKEN_FILE_H

#include <string>

#include "input/secret_text.h"

namespace SsoClient::Tool {

/// Whether the path is "-", which is standard input or output.
bool IsStandardStream(const std::string& path);

/// The text of the token in the file, without the white space around it; "-" is standard input.
/// Throws `ToolException` when the file cannot be read, is empty or larger than 16 MiB, and, unless
/// `mayBeOpen`, when its group or others may read or write it, since whoever has a bearer token can
/// use it.
SecretText ReadTokenFile(const std::string& path, bool mayBeOpen);

/// Throws `ToolException` when `WriteTokenFile` would certainly fail, so that no token is requested
/// that cannot be kept: with the kind "output-terminal" when "-" is a terminal, which would show
/// the token; for a path that is a symbolic link or not a file; and for a folder that does not
/// exist or cannot be written to.
void CheckTokenFile(const std::string& path);

/// Writes the text and a line feed; "-" is standard output. The file is written whole under another
/// name in the same folder, readable and writable only by its owner (0600), and then renamed, so
/// that readers see the old or the new token. A path that is a symbolic link is refused: to follow
/// it, or to replace it, could surprise. Throws `ToolException` and leaves the old file when that
/// fails. Signals that end the process are delayed meanwhile, so that no other file remains.
void WriteTokenFile(const std::string& path, const std::string& text);

}  // namespace SsoClient::Tool

#endif
