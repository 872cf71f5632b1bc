#ifndef SSOCLIENT_TOOL_COMMANDS_COMMAND_H
#define SSOCLIENT_TOOL_COMMANDS_COMMAND_H

#include <memory>
#include <string>
#include <vector>

#include <nlohmann/json_fwd.hpp>

#include "exit_status.h"
#include "output/console.h"

namespace CLI {
class App;
}

namespace SsoClient::Tool {

/// What a command has done.
struct Outcome {
  ExitStatus status = ExitStatus::kDone;
  /// With --json: the members that the command adds to the printed object, next to "command" and
  /// "status". Names are in camelCase, times are xs:dateTime in UTC, durations are in seconds, and
  /// what is not known is missing.
  std::shared_ptr<nlohmann::json> json;
};

/// A subcommand of the program. Its options are members that `AddTo` binds.
class Command {
 public:
  virtual ~Command() = default;
  /// Adds the subcommand, with its options and its help, which starts with an example. Returns it.
  virtual CLI::App* AddTo(CLI::App& program) = 0;
  /// Runs after the command line has been read. Writes the result to `console.out` unless
  /// `WantsJson`. Throws `ToolException` and the exceptions of the libraries.
  virtual Outcome Run(const Console& console) = 0;

  bool WantsJson() const noexcept { return wantsJson_; }

 protected:
  /// Adds --json to the subcommand.
  void AddJsonOption(CLI::App& command);
  /// Sets the command line, or several in lines, with which the subcommand's help starts. The first
  /// line of its description is what the help of the program says about it.
  static void SetExample(CLI::App& command, const std::string& example);

 private:
  bool wantsJson_ = false;
};

}  // namespace SsoClient::Tool

#endif
