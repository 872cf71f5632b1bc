#ifndef SSOCLIENT_TOOL_COMMANDS_COMMANDS_H
#define SSOCLIENT_TOOL_COMMANDS_COMMANDS_H

#include <memory>
#include <vector>

#include "commands/command.h"

namespace SsoClient::Tool {

std::unique_ptr<Command> MakeLoginCommand();
std::unique_ptr<Command> MakeRenewCommand();
std::unique_ptr<Command> MakeValidateCommand();
std::unique_ptr<Command> MakeExchangeCommand();
std::unique_ptr<Command> MakeShowCommand();
std::unique_ptr<Command> MakeVerifyCommand();
std::unique_ptr<Command> MakeDoctorCommand();

/// All commands, in the order of the help.
std::vector<std::unique_ptr<Command>> MakeCommands();

}  // namespace SsoClient::Tool

#endif
