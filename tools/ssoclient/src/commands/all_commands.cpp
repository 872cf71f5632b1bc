#include "commands/command.h"

namespace SsoClient::Tool {

std::vector<std::unique_ptr<Command>> MakeCommands() {
  std::vector<std::unique_ptr<Command>> all;
  return all;
}

}  // namespace SsoClient::Tool
