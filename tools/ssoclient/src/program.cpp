#include "program.h"

#include <algorithm>
#include <exception>
#include <memory>
#include <ostream>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include <CLI/CLI.hpp>
#include <nlohmann/json.hpp>

#include "commands/commands.h"
#include "failure.h"
#include "help/help_formatter.h"
#include "output/safe_text.h"
#include "usage_message.h"

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
    RefuseWrongValues(*subcommand);
    all.push_back({std::move(command), subcommand});
  }
  return all;
}

void PrintJson(const Console& console, const std::string& command, ExitStatus status,
               const Json& members) {
  Json result = Json::object();
  if (!command.empty()) {
    result["command"] = command;
  }
  result["status"] = NameOf(status);
  result.update(members);
  // Text that is not UTF-8 cannot come from a token, but may come from a file name.
  console.out << SafeJson(result.dump(2, ' ', false, Json::error_handler_t::replace)) << '\n';
}

void PrintFailure(const Console& console, const Failure& failure) {
  console.err << console.PaintError(Colour::kBad, "ssoclient: ")
              << SafeText(console, failure.message) << '\n';
  if (!failure.remedy.empty()) {
    console.err << "  remedy: " << SafeText(console, failure.remedy) << '\n';
  }
}

// The command is empty if the command line names none.
ExitStatus ReportFailure(const Console& console, const std::string& command, bool wantsJson,
                         const Failure& failure) {
  if (!wantsJson) {
    PrintFailure(console, failure);
    return failure.status;
  }
  Json error = {{"kind", failure.kind}, {"message", failure.message}};
  if (!failure.remedy.empty()) {
    error["remedy"] = failure.remedy;
  }
  PrintJson(console, command, failure.status, {{"error", error}});
  return failure.status;
}

// The options of a wrong command line may not have been parsed.
bool IsJsonWanted(int argc, const char* const* argv) {
  return std::any_of(argv, argv + argc,
                     [](const char* each) { return std::string_view(each) == "--json"; });
}

ExitStatus ReportUsage(const Console& console, const CLI::App& program, bool isJson,
                       const std::string& message) {
  const std::vector<CLI::App*> chosen = program.get_subcommands();
  const std::string name = chosen.empty() ? std::string() : chosen.front()->get_name();
  const std::string help = program.get_name() + (name.empty() ? "" : " " + name) + " --help";
  return ReportFailure(console, name, isJson,
                       {ExitStatus::kUsage, "usage", message, "see '" + help + "'"});
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
    return ReportFailure(console, chosen.subcommand->get_name(), chosen.command->WantsJson(),
                         FailureOf(exception));
  }
}

ExitStatus RunCommandLine(int argc, const char* const* argv, const Console& console) {
  CLI::App program("Obtains, renews and checks SAML tokens of a Security Token Service.",
                   "ssoclient");
  program.set_version_flag("--version", std::string("ssoclient ") + SSOCLIENT_TOOL_VERSION,
                           "Print the version");
  program.require_subcommand(1);
  program.formatter(std::make_shared<HelpFormatter>());
  const std::vector<Registered> commands = AddCommands(program);
  try {
    program.parse(ArgumentsToParse(argc, argv));
  } catch (const CLI::Success& asked) {
    // --help or --version
    program.exit(asked, console.out, console.err);
    return ExitStatus::kDone;
  } catch (const CLI::ParseError& error) {
    return ReportUsage(console, program, IsJsonWanted(argc, argv),
                       UsageMessage(error, program, argc, argv));
  }
  const auto chosen = std::find_if(commands.begin(), commands.end(), [](const Registered& each) {
    return each.subcommand->parsed();
  });
  return RunCommand(console, *chosen);
}

}  // namespace

ExitStatus RunProgram(int argc, const char* const* argv, const Console& console) {
  try {
    return RunCommandLine(argc, argv, console);
  } catch (const std::exception& exception) {
    // Such as a lack of memory while a failure is reported. What is written here needs no memory.
    console.err << "ssoclient: " << exception.what() << '\n';
    return ExitStatus::kLocal;
  }
}

}  // namespace SsoClient::Tool
