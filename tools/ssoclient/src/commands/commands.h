#ifndef SSOCLIENT_TOOL_COMMANDS_COMMANDS_H
#define SSOCLIENT_TOOL_COMMANDS_COMMANDS_H

#include <memory>

#include "commands/command.h"

namespace SsoClient::Tool {

std::unique_ptr<Command> MakeShowCommand();
std::unique_ptr<Command> MakeVerifyCommand();
std::unique_ptr<Command> MakeDoctorCommand();

}  // namespace SsoClient::Tool

#endif
