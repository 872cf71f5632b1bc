#ifndef SSOCLIENT_TOOL_INPUT_TOKEN_FILE_H
#define SSOCLIENT_TOOL_INPUT_TOKEN_FILE_H

#include <string>

namespace SsoClient::Tool {

/// The text of the token in the file, without the white space around it; "-" is standard input.
/// Throws `ToolException` when the file cannot be read, is empty or larger than 16 MiB, and, unless
/// `mayBeOpen`, when its group or others may read it, since whoever has a bearer token can use it.
std::string ReadTokenFile(const std::string& path, bool mayBeOpen);

/// Writes the text and a line feed; "-" is standard output. The file is written whole under another
/// name in the same folder, readable and writable only by its owner (0600), and then renamed, so
/// that readers see the old or the new token. Throws `ToolException` and leaves the old file when
/// that fails.
void WriteTokenFile(const std::string& path, const std::string& text);

}  // namespace SsoClient::Tool

#endif
