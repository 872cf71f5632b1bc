#include "usage_message.h"

#include <algorithm>
#include <cstddef>
#include <string_view>
#include <utility>
#include <vector>

namespace SsoClient::Tool {
namespace {

bool IsOption(const std::string& argument) {
  return argument.size() > 1 && argument.front() == '-';
}

// The name of an option without a value, which may be a password: "--name" of "--name=value" and
// "-n" of "-nvalue".
std::string NameOfOption(const std::string& argument) {
  constexpr std::size_t kShortName = 2;
  const bool isLong = argument.compare(0, kShortName, "--") == 0;
  return argument.substr(0, isLong ? argument.find('=') : kShortName);
}

std::string MessageWithoutCommand(int argc, const char* const* argv) {
  if (argc < 2) {
    return "there is no command";
  }
  const std::string first = argv[1];
  return IsOption(first) ? "there is no option " + NameOfOption(first) + " without a command"
                         : "there is no command '" + first + "'";
}

// Returns whether the command has the option, and it is before the command in the arguments.
bool IsBeforeCommand(const std::string& option, const CLI::App& command,
                     const std::vector<std::string>& arguments) {
  const auto end = std::find(arguments.begin(), arguments.end(), command.get_name());
  return command.get_option_no_throw(option) != nullptr &&
         std::any_of(arguments.begin(), end,
                     [&](const std::string& each) { return NameOfOption(each) == option; });
}

// For arguments that the command does not have, or that are before its name.
std::string MessageOfExtras(const std::vector<std::string>& extras, const CLI::App& command,
                            const std::vector<std::string>& arguments) {
  const auto extra = std::find_if(extras.begin(), extras.end(), IsOption);
  if (extra == extras.end()) {
    return "there are more arguments than the command has";
  }
  const std::string option = NameOfOption(*extra);
  return IsBeforeCommand(option, command, arguments)
             ? option + " must follow the command: ssoclient " + command.get_name() + " " + option
             : "there is no option " + option;
}

// Where the name is a word of the text, or npos.
std::size_t PlaceOf(std::string_view name, std::string_view text) {
  for (std::size_t at = text.find(name); at != std::string_view::npos;
       at = text.find(name, at + 1)) {
    const std::string_view after = text.substr(at + name.size());
    const bool isStart = at == 0 || text[at - 1] == ' ';
    if (isStart && (after.empty() || after.front() == ' ' || after.front() == ':')) {
      return at;
    }
  }
  return std::string_view::npos;
}

// The options and arguments of the command that the library's text names, in its order. A text
// about the value of a flag begins with its name without hyphens.
std::vector<const CLI::Option*> OptionsIn(std::string_view text, const CLI::App& command) {
  std::vector<std::pair<std::size_t, const CLI::Option*>> found;
  for (const CLI::Option* option : command.get_options({})) {
    const bool isFirst = option->check_lname(std::string(text.substr(0, text.find(' '))));
    const std::size_t place = isFirst ? 0 : PlaceOf(option->get_name(), text);
    if (place != std::string_view::npos) {
      found.emplace_back(place, option);
    }
  }
  std::sort(found.begin(), found.end());
  std::vector<const CLI::Option*> options;
  options.reserve(found.size());
  for (const auto& [place, option] : found) {
    options.push_back(option);
  }
  return options;
}

bool IsFlag(const CLI::Option& option) {
  return option.get_expected_max() == 0;
}

std::string CheckFilled(const std::string& value) {
  return value.empty() ? "it must not be empty" : std::string();
}

// Of the wrong number of values.
std::string MessageOfMismatch(const CLI::Option& option) {
  if (IsFlag(option)) {
    return option.get_name() + " takes no value";
  }
  if (option.count() > static_cast<std::size_t>(option.get_items_expected_max())) {
    return option.get_name() + " can be given only once";
  }
  return option.get_name() + " needs its value: " + option.get_type_name();
}

template <class Class>
bool Is(const CLI::ParseError& error) {
  return dynamic_cast<const Class*>(&error) != nullptr;
}

// In what the library says of a value that it cannot convert, the value is after this.
constexpr const char* kBeforeValue = " = ";

std::string MessageOf(const CLI::ParseError& error, const CLI::App& command) {
  const std::string text = error.what();
  const auto options = OptionsIn(text.substr(0, text.find(kBeforeValue)), command);
  const std::string first = options.empty() ? "an option" : options.front()->get_name();
  if (Is<CLI::ArgumentMismatch>(error) && !options.empty()) {
    return MessageOfMismatch(*options.front());
  }
  if (Is<CLI::ExcludesError>(error) && options.size() > 1) {
    return first + " and " + options.back()->get_name() + " exclude each other";
  }
  if (Is<CLI::RequiresError>(error) && options.size() > 1) {
    return first + " needs " + options.back()->get_name();
  }
  if (Is<CLI::RequiredError>(error)) {
    return first + " is required";
  }
  // All values have checks of ours, whose texts follow the name of the option.
  return Is<CLI::ValidationError>(error) ? text : "the value of " + first + " is not usable";
}

}  // namespace

void RefuseWrongValues(CLI::App& command) {
  for (CLI::Option* option : command.get_options({})) {
    if (IsFlag(*option)) {
      option->disable_flag_override();
    } else {
      option->check(CheckFilled);
    }
  }
}

std::vector<std::string> ArgumentsToParse(int argc, const char* const* argv) {
  std::vector<std::string> arguments;
  bool areOptions = true;
  for (int i = 1; i < argc; ++i) {
    std::string argument = argv[i];
    areOptions = areOptions && argument != "--";
    const bool isWithoutValue =
        areOptions && argument.starts_with("--") && argument.find('=', 3) == argument.size() - 1;
    if (isWithoutValue) {
      argument.pop_back();
    }
    arguments.push_back(std::move(argument));
    if (isWithoutValue) {
      arguments.emplace_back();
    }
  }
  std::reverse(arguments.begin(), arguments.end());
  return arguments;
}

std::string UsageMessage(const CLI::ParseError& error, const CLI::App& program, int argc,
                         const char* const* argv) {
  const std::vector<CLI::App*> chosen = program.get_subcommands();
  if (chosen.empty()) {
    return MessageWithoutCommand(argc, argv);
  }
  // The library notices first what is missing, perhaps because an option was misspelt.
  const std::vector<std::string> extras = program.remaining(true);
  return Is<CLI::ExtrasError>(error) || std::any_of(extras.begin(), extras.end(), IsOption)
             ? MessageOfExtras(extras, *chosen.front(), {argv + 1, argv + argc})
             : MessageOf(error, *chosen.front());
}

}  // namespace SsoClient::Tool
