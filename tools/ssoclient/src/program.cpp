#include "program.h"

#include <algorithm>
#include <exception>
#include <memory>
#include <ostream>
#include <string>
#include <utility>
#include <vector>

#include <CLI/CLI.hpp>
#include <nlohmann/json.hpp>

#include "commands/command.h"
#include "failure.h"

namespace SsoClient::Tool {
namespace {

using Json = nlohmann::json;

struct Registered {
  std::unique_ptr<Command> command;
  CLI::App* subcommand = nullptr;
};

std::vector<Registered> AddCommands(CLI::App& program) {
  std::vector<Registered> all;
  for (std::unique_ptr<Command>& command : MakeCommands()) {
    CLI::App* const subcommand = command->AddTo(program);
    all.push_back({std::move(command), subcommand});
  }
  return all;
}

void PrintJson(const Console& console, const std::string& command, ExitStatus status,
               const Json& members) {
  Json result = Json::object();
  result["command"] = command;
  result["status"] = NameOf(status);
  result.update(members);
  // Text that is not UTF-8 cannot come from a token, but may come from a file name.
  console.out << result.dump(2, ' ', false, Json::error_handler_t::replace) << '\n';
}

void ReportFailure(const Console& console, const Registered& chosen, const Failure& failure) {
  if (chosen.command->WantsJson()) {
    Json error = {{"kind", failure.kind}, {"message", failure.message}};
    if (!failure.remedy.empty()) {
      error["remedy"] = failure.remedy;
    }
    PrintJson(console, chosen.subcommand->get_name(), failure.status, {{"error", error}});
    return;
  }
  console.err << console.PaintError(Colour::kBad, "ssoclient: ") << failure.message << '\n';
  if (!failure.remedy.empty()) {
    console.err << "  remedy: " << failure.remedy << '\n';
  }
}

ExitStatus RunCommand(const Console& console, const Registered& chosen) {
  try {
    const Outcome outcome = chosen.command->Run(console);
    if (chosen.command->WantsJson()) {
      PrintJson(console, chosen.subcommand->get_name(), outcome.status,
                outcome.json ? *outcome.json : Json::object());
    }
    return outcome.status;
  } catch (const std::exception& exception) {
    const Failure failure = FailureOf(exception);
    ReportFailure(console, chosen, failure);
    return failure.status;
  }
}

}  // namespace

ExitStatus RunProgram(int argc, const char* const* argv, const Console& console) {
  CLI::App program("Obtains, renews and checks SAML tokens of a Security Token Service.",
                   "ssoclient");
  program.set_version_flag("--version", std::string("ssoclient ") + SSOCLIENT_TOOL_VERSION);
  program.require_subcommand(1);
  const std::vector<Registered> commands = AddCommands(program);
  try {
    program.parse(argc, argv);
  } catch (const CLI::ParseError& error) {
    const int code = program.exit(error, console.out, console.err);
    return code == 0 ? ExitStatus::kDone : ExitStatus::kUsage;
  }
  const auto chosen = std::find_if(commands.begin(), commands.end(), [](const Registered& each) {
    return each.subcommand->parsed();
  });
  return RunCommand(console, *chosen);
}

}  // namespace SsoClient::Tool
