#include "commands/command.h"

#include <CLI/CLI.hpp>

namespace SsoClient::Tool {

void Command::AddJsonOption(CLI::App& command) {
  command.add_flag("--json", wantsJson_, "Print one JSON object instead of text");
}

void Command::SetExample(CLI::App& command, const std::string& example) {
  // HelpFormatter prints it first.
  command.footer(example);
}

}  // namespace SsoClient::Tool
