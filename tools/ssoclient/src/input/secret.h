#ifndef SSOCLIENT_TOOL_INPUT_SECRET_H
#define SSOCLIENT_TOOL_INPUT_SECRET_H

#include <string>

#include "input/secret_text.h"

namespace CLI {
class App;
}

namespace SsoClient::Tool {

/// A password or a passphrase: from a file, a descriptor or the terminal, never from an argument or
/// the environment, which other processes can see.
class SecretOption {
 public:
  /// Adds --NAME-file and --NAME-fd, which exclude each other, to this group of the command's help;
  /// `name` is "password", for example. The object must live as long as the command.
  void AddTo(CLI::App& command, const std::string& name, const std::string& group);

  bool IsGiven() const { return !file_.empty() || descriptor_ >= 0; }

  /// Whether it comes from the descriptor of standard input.
  bool IsStandardInput() const { return descriptor_ == 0; }

  /// The secret: the first line of the file or the descriptor, or what the user types at the
  /// terminal of the process after `prompt`. A descriptor that is a terminal is read in the same
  /// way: without echo. What is after the first line of another descriptor stays there for others.
  /// Throws `ToolException` when there is neither (with the status `kUsage`), when the secret is
  /// empty or longer than 1024 bytes, when a file can be read by others, unless `mayBeOpen`, and
  /// when it cannot be read.
  SecretText Read(const std::string& prompt, bool mayBeOpen) const;

 private:
  SecretText ReadUnchecked(const std::string& prompt, bool mayBeOpen) const;

  std::string name_;
  std::string file_;
  int descriptor_ = -1;
};

}  // namespace SsoClient::Tool

#endif
