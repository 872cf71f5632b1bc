#include "commands/commands.h"

namespace SsoClient::Tool {

std::vector<std::unique_ptr<Command>> MakeCommands() {
  std::vector<std::unique_ptr<Command>> all;
  all.push_back(MakeShowCommand());
  all.push_back(MakeVerifyCommand());
  all.push_back(MakeDoctorCommand());
  return all;
}

}  // namespace SsoClient::Tool
