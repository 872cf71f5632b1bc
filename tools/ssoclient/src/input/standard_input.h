#ifndef SSOCLIENT_TOOL_INPUT_STANDARD_INPUT_H
#define SSOCLIENT_TOOL_INPUT_STANDARD_INPUT_H

#include <initializer_list>

namespace SsoClient::Tool {

/// Something that a command reads.
struct Input {
  /// The option or the argument that says where it is, such as "--act-as"; valid for the lifetime
  /// of the process.
  const char* name = "";
  bool isStandardInput = false;
};

/// Throws `ToolException` with the status `kUsage` when a token and another input are both to be
/// read from standard input, since a token is all that it contains. Secrets can share it: each is
/// one line.
void CheckStandardInput(std::initializer_list<Input> tokens, std::initializer_list<Input> secrets);

}  // namespace SsoClient::Tool

#endif
