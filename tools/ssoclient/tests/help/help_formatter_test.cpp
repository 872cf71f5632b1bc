#include <sstream>
#include <string>
#include <vector>

#include <gtest/gtest.h>
#include <nlohmann/json.hpp>

#include "output/text_width.h"
#include "support/token_files.h"

namespace SsoClient::Tool::Testing {
namespace {

using Words = std::vector<std::string>;

// The commands that the help of the program lists.
Words Commands() {
  const std::string help = RunInUtf8({"--help"}).out;
  std::istringstream lines(help.substr(help.find("\nCommands:\n") + 11));
  Words commands;
  std::string line;
  while (std::getline(lines, line) && !line.empty()) {
    commands.push_back(line.substr(2, line.find(' ', 2) - 2));
  }
  return commands;
}

void ExpectGoodLines(const std::string& help) {
  std::istringstream lines(help);
  std::string line;
  while (std::getline(lines, line)) {
    EXPECT_LE(DisplayWidth(line), 80U) << line;
    EXPECT_FALSE(line.ends_with(' ')) << line;
  }
}

TEST(HelpFormatterTest, TheHelpOfTheProgramSaysItsExitStatus) {
  const ToolResult help = RunInUtf8({"--help"});
  EXPECT_EQ(help.status, 0);
  EXPECT_EQ(help.err, "");
  ExpectGoodLines(help.out);
  for (const char* text :
       {"Usage: ssoclient COMMAND [OPTION]...\n", "\n  show ", "\n  verify ",
        "\nExit status:\n  0  done", "\n  1  the service refused", "\n  2  the command line",
        "\n  3  no usable answer", "\n  4  a local problem"}) {
    EXPECT_NE(help.out.find(text), std::string::npos) << text << help.out;
  }
}

TEST(HelpFormatterTest, TheHelpOfEachCommandStartsWithAnExample) {
  const Words commands = Commands();
  EXPECT_GE(commands.size(), 2U);
  for (const std::string& command : commands) {
    const ToolResult help = RunInUtf8({command, "--help"});
    EXPECT_EQ(help.status, 0);
    EXPECT_TRUE(help.out.starts_with("Example:\n  ssoclient " + command + " ")) << help.out;
    EXPECT_NE(help.out.find("\nUsage: ssoclient " + command + " "), std::string::npos) << help.out;
    EXPECT_NE(help.out.find("\n  -h, --help "), std::string::npos) << help.out;
    EXPECT_NE(help.out.find("\n  --json "), std::string::npos) << help.out;
    EXPECT_EQ(RunInUtf8({command, "-h"}).out, help.out);
    ExpectGoodLines(help.out);
  }
}

TEST(HelpFormatterTest, OptionsHaveTheirValuesAndDefaults) {
  const std::string help = RunInUtf8({"verify", "--help"}).out;
  EXPECT_NE(help.find("Usage: ssoclient verify --audience NAME [OPTION]... FILE\n"),
            std::string::npos)
      << help;
  EXPECT_NE(help.find("  --bearer accept|refuse    Whether bearer tokens are accepted (default: "
                      "refuse)\n"),
            std::string::npos)
      << help;
  EXPECT_NE(help.find("\n  --deepest-delegation NUMBER\n                            How many"),
            std::string::npos)
      << help;
}

TEST(HelpFormatterTest, AWrongCommandLineIsExplained) {
  EXPECT_EQ(RunInUtf8({"shwo"}).err,
            "ssoclient: there is no command 'shwo'\n  remedy: see 'ssoclient --help'\n");
  EXPECT_EQ(RunInUtf8({}).err,
            "ssoclient: there is no command\n  remedy: see 'ssoclient --help'\n");
  EXPECT_EQ(RunInUtf8({"--wrong"}).err,
            "ssoclient: there is no option --wrong without a command\n"
            "  remedy: see 'ssoclient --help'\n");
  const ToolResult unknown = RunInUtf8({"show", "--wrong", "token.xml"});
  EXPECT_NE(unknown.err.find("--wrong"), std::string::npos);
  EXPECT_NE(unknown.err.find("\n  remedy: see 'ssoclient show --help'\n"), std::string::npos);
  for (const Words& arguments : {Words{"shwo"}, Words{}, Words{"--wrong"}, Words{"show"},
                                 Words{"show", "--wrong", "token.xml"}}) {
    const ToolResult result = RunInUtf8(arguments);
    EXPECT_EQ(result.status, 2);
    EXPECT_EQ(result.out, "");
  }
}

TEST(HelpFormatterTest, AWrongCommandLineIsAJsonObjectWhenOneIsWanted) {
  const ToolResult result = RunInUtf8({"show", "--json"});
  EXPECT_EQ(result.status, 2);
  EXPECT_EQ(result.err, "");
  EXPECT_EQ(result.Json().at("command"), "show");
  EXPECT_EQ(result.Json().at("status"), "usage");
  EXPECT_EQ(result.Json().at("error").at("kind"), "usage");
  EXPECT_FALSE(RunInUtf8({"shwo", "--json"}).Json().contains("command"));
}

}  // namespace
}  // namespace SsoClient::Tool::Testing
