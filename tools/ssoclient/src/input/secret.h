#ifndef SSOCLIENT_TOOL_INPUT_SECRET_H
#define SSOCLIENT_TOOL_INPUT_SECRET_H

#include <string>

#include "output/console.h"

namespace CLI {
class App;
}

namespace SsoClient::Tool {

/// A password or a passphrase: from a file, a descriptor or the terminal, never from an argument.
class SecretOption {
 public:
  /// Adds --NAME-file and --NAME-fd, which exclude each other, to the command; `name` is
  /// "password", for example.
  void AddTo(CLI::App& command, const std::string& name);

  /// The secret: the first line of the file or the descriptor, or what the user types at the
  /// terminal of the process without echo after `prompt`. Throws `ToolException` when there is
  /// neither, when it is empty, when a file can be read by others, and when it cannot be read.
  std::string Read(const Console& console, const std::string& prompt) const;

 private:
  std::string name_;
  std::string file_;
  int descriptor_ = -1;
};

}  // namespace SsoClient::Tool

#endif
