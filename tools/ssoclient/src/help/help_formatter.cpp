#include "help/help_formatter.h"

#include <string_view>
#include <vector>

#include "output/text_width.h"

namespace SsoClient::Tool {
namespace {

constexpr std::size_t kColumns = 80;
constexpr std::size_t kTextColumn = 28;
constexpr std::size_t kIndent = 2;
/// The group of options that are in no other one.
constexpr const char* kUsualGroup = "Options";

constexpr std::string_view kExitStatus =
    "\nExit status:\n"
    "  0  done; a token was accepted\n"
    "  1  the service refused the request, or a check refused the token\n"
    "  2  the command line is wrong\n"
    "  3  no usable answer: the network, TLS, HTTP, a time-out or a broken answer\n"
    "  4  a local problem: a file, a key, a secret or a resource of this machine\n";

std::string Paragraph(std::string_view text, std::size_t indent) {
  std::string result;
  for (const std::string& line : WrappedLines(text, kColumns - indent)) {
    result += (line.empty() ? "" : std::string(indent, ' ') + line) + "\n";
  }
  return result;
}

// Command lines are not wrapped.
std::string Indented(std::string text) {
  const std::string indent(kIndent, ' ');
  for (std::size_t end = text.find('\n'); end != std::string::npos;
       end = text.find('\n', end + 1)) {
    text.insert(end + 1, indent);
  }
  return indent + text + "\n";
}

// A name and its text in two columns; the text begins in a line of its own after a long name.
std::string Item(const std::string& name, const std::string& text) {
  const std::string head = std::string(kIndent, ' ') + name;
  const std::string body = Paragraph(text, kTextColumn);
  if (DisplayWidth(head) + kIndent > kTextColumn) {
    return head + "\n" + body;
  }
  return PaddedTo(head, kTextColumn) + body.substr(kTextColumn);
}

std::string FirstLine(const std::string& text) {
  return text.substr(0, text.find('\n'));
}

std::string AfterFirstLine(const std::string& text) {
  const std::size_t end = text.find('\n');
  return end == std::string::npos ? std::string() : text.substr(end + 1);
}

// The type of an option's value without the names of its validators.
std::string ValueName(const CLI::Option& option) {
  if (option.get_type_size() == 0) {
    return {};
  }
  const std::string type = option.get_type_name();
  return type.substr(0, type.find(':'));
}

std::string OptionName(const CLI::Option& option) {
  if (option.get_positional()) {
    return option.get_name(true, false);
  }
  std::string names;
  for (const std::string& name : option.get_snames()) {
    names += (names.empty() ? "-" : ", -") + name;
  }
  for (const std::string& name : option.get_lnames()) {
    names += (names.empty() ? "--" : ", --") + name;
  }
  const std::string value = ValueName(option);
  return value.empty() ? names : names + " " + value;
}

std::string OptionText(const CLI::Option& option) {
  const std::string& text = option.get_description();
  std::string notes;
  const auto add = [&notes](const std::string& note) {
    notes += (notes.empty() ? "" : "; ") + note;
  };
  if (option.get_required() && !option.get_positional()) {
    add("required");
  }
  if (!option.get_default_str().empty()) {
    add("default: " + option.get_default_str());
  }
  if (!option.get_envname().empty()) {
    add("or the variable " + option.get_envname());
  }
  return notes.empty() ? text : text + " (" + notes + ")";
}

std::string Heading(const std::string& title, const std::string& items) {
  return items.empty() ? items : "\n" + title + ":\n" + items;
}

std::string Arguments(const CLI::App& app) {
  std::string items;
  for (const CLI::Option* option : app.get_options({})) {
    items += option->get_positional() ? Item(OptionName(*option), OptionText(*option)) : "";
  }
  return Heading("Arguments", items);
}

// The group that the library begins with comes last, since --json and --help are in it.
std::string Options(const CLI::App& app) {
  std::string others;
  std::string usual;
  for (const std::string& group : app.get_groups()) {
    std::string items;
    for (const CLI::Option* option : app.get_options({})) {
      const bool isShown =
          option->get_group() == group && !option->get_positional() && option != app.get_help_ptr();
      items += isShown ? Item(OptionName(*option), OptionText(*option)) : "";
    }
    if (group == kUsualGroup) {
      usual = items;
    } else if (!group.empty()) {
      others += Heading(group + " options", items);
    }
  }
  return others + Heading(kUsualGroup, usual + Item("-h, --help", "Print this help"));
}

std::string Commands(const CLI::App& program) {
  std::string items;
  for (const CLI::App* command : program.get_subcommands({})) {
    items += Item(command->get_name(), FirstLine(command->get_description()));
  }
  return "\nCommands:\n" + items;
}

std::string Usage(const CLI::App& command, const std::string& name) {
  std::string usage = "Usage: " + name;
  for (const CLI::Option* option : command.get_options({})) {
    if (option->get_required() && !option->get_positional()) {
      usage += " --" + option->get_lnames().front() + " " + ValueName(*option);
    }
  }
  usage += " [OPTION]...";
  for (const CLI::Option* option : command.get_options({})) {
    if (option->get_positional()) {
      const std::string argument = option->get_name(true, false);
      usage += option->get_required() ? " " + argument : " [" + argument + "]";
    }
  }
  return usage + "\n";
}

std::string ProgramHelp(const CLI::App& program) {
  return "Usage: " + program.get_name() + " COMMAND [OPTION]...\n\n" +
         Paragraph(program.get_description(), 0) + Commands(program) + Options(program) +
         std::string(kExitStatus) + "\n'" + program.get_name() +
         " COMMAND --help' describes a command.\n";
}

std::string CommandHelp(const CLI::App& command, const std::string& name) {
  std::string help;
  if (!command.get_footer().empty()) {
    help = "Example:\n" + Indented(command.get_footer()) + "\n";
  }
  help += Usage(command, name) + "\n" + FirstLine(command.get_description()) + ".\n";
  const std::string rest = AfterFirstLine(command.get_description());
  help += rest.empty() ? "" : "\n" + Paragraph(rest, 0);
  return help + Arguments(command) + Options(command);
}

}  // namespace

std::string HelpFormatter::make_help(const CLI::App* app, std::string name,
                                     CLI::AppFormatMode /*mode*/) const {
  return app->get_parent() == nullptr ? ProgramHelp(*app) : CommandHelp(*app, name);
}

}  // namespace SsoClient::Tool
