#ifndef SSOCLIENT_TOOL_USAGE_MESSAGE_H
#define SSOCLIENT_TOOL_USAGE_MESSAGE_H

#include <string>
#include <vector>

#include <CLI/CLI.hpp>

namespace SsoClient::Tool {

/// Lets no flag of the command have a value, as "--json=1" would, and no option an empty one, which
/// is a variable that is not set more often than a wish: the option would be as if it were missing.
void RefuseWrongValues(CLI::App& command);

/// The arguments after the program's name as `CLI::App::parse` takes them: from the last to the
/// first. "--name=" becomes two, since the library would take the argument after it as the value.
std::vector<std::string> ArgumentsToParse(int argc, const char* const* argv);

/// What is wrong with a command line that `program` has refused with `error`, in one line. The
/// words are our own, since those of the library depend on its version, and repeat only what cannot
/// be a password: names of options and commands, and values that a check of ours has refused.
std::string UsageMessage(const CLI::ParseError& error, const CLI::App& program, int argc,
                         const char* const* argv);

}  // namespace SsoClient::Tool

#endif
