#ifndef SSOCLIENT_TOOL_INPUT_PRIVATE_FILE_H
#define SSOCLIENT_TOOL_INPUT_PRIVATE_FILE_H

#include <cstddef>
#include <string>

#include "input/secret_text.h"

namespace CLI {
class App;
}

namespace SsoClient::Tool {

/// Adds --allow-open-files, which sets `mayBeOpen`, to the command.
void AddOpenFilesOption(CLI::App& command, bool& mayBeOpen);

/// A file whose content only its owner may know.
struct PrivateFile {
  std::string path{};
  /// What the file contains, for messages: "token", for example. The kinds of failures begin with
  /// it: "token-file", and "token-file-open" for a file that others can use.
  std::string what{};
  std::size_t maxBytes = 0;
  /// Whether others may read or write it.
  bool mayBeOpen = false;
};

/// The content of the file, which may be a pipe. Throws `ToolException` when it cannot be read, is
/// a folder or has more than `maxBytes`, and when its group or others may read or write it, unless
/// `mayBeOpen`.
SecretText ReadPrivateFile(const PrivateFile& file);

/// Reads `descriptor` to its end or until there are more than `maxBytes`; `name` is for messages.
SecretText ReadDescriptor(int descriptor, const std::string& name, const std::string& what,
                          std::size_t maxBytes);

}  // namespace SsoClient::Tool

#endif
