#include <chrono>
#include <csignal>
#include <string>

#include <fcntl.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <unistd.h>

#include "support/service_fixture.h"

namespace SsoClient::Tool::Testing {
namespace {

using testing::HasSubstr;
using testing::Not;

constexpr const char* kPrompt = "Password for alice@EXAMPLE.COM: ";

class TerminalTest : public ServiceTest {
 protected:
  ToolOptions Login() const {
    ToolOptions options;
    options.arguments = Command("login", {"--user", "alice@EXAMPLE.COM", "-o", PathOf("token")});
    options.hasTerminal = true;
    options.err = Stream::kTerminal;
    return options;
  }
};

TEST_F(TerminalTest, AsksForThePasswordWithoutEcho) {
  ToolProcess tool(Login());
  ASSERT_TRUE(tool.WaitFor(kPrompt));
  EXPECT_FALSE(tool.IsEchoing());
  tool.Type("secret\n");
  const ToolResult result = tool.Finish();
  EXPECT_EQ(result.status, 0) << result.terminal;
  EXPECT_THAT(result.terminal, Not(HasSubstr("secret")));
  EXPECT_THAT(Content(PathOf("token")), HasSubstr("alice"));
}

TEST_F(TerminalTest, ADescriptorThatIsATerminalIsReadWithoutEcho) {
  ToolOptions options = Login();
  options.arguments = Joined(options.arguments, {"--password-fd", "0"});
  options.in = Stream::kTerminal;
  ToolProcess tool(options);
  ASSERT_TRUE(tool.WaitFor(kPrompt));
  EXPECT_FALSE(tool.IsEchoing());
  tool.Type("secret\n");
  const ToolResult result = tool.Finish();
  EXPECT_EQ(result.status, 0) << result.terminal;
  EXPECT_THAT(result.terminal, Not(HasSubstr("secret")));
}

TEST_F(TerminalTest, ATerminalThatCanOnlyBeReadHasNoPromptAndNoEcho) {
  ToolOptions options = Login();
  options.arguments = Joined(options.arguments, {"--password-fd", "7"});
  options.prepare = [] { dup2(open("/dev/tty", O_RDONLY | O_NOCTTY), 7); };
  ToolProcess tool(options);
  // Nothing is shown when it begins to read.
  const auto end = std::chrono::steady_clock::now() + std::chrono::seconds(30);
  while (tool.IsEchoing() && std::chrono::steady_clock::now() < end) {
    ASSERT_FALSE(tool.WaitFor(kPrompt, std::chrono::milliseconds(1)));
  }
  ASSERT_FALSE(tool.IsEchoing());
  tool.Type("secret\n");
  const ToolResult result = tool.Finish();
  EXPECT_EQ(result.status, 0) << result.terminal;
  EXPECT_THAT(result.terminal, Not(HasSubstr("secret")));
  EXPECT_THAT(result.terminal, Not(HasSubstr(kPrompt)));
}

TEST_F(TerminalTest, ThePromptHasNoControlCharacters) {
  ToolOptions options = Login();
  options.arguments = Command("login", {"--user", "al\x1b[2Jice\u202E", "-o", PathOf("token")});
  ToolProcess tool(options);
  EXPECT_TRUE(tool.WaitFor("Password for al?[2Jice?: "));
}

TEST_F(TerminalTest, ALongLineIsNotKept) {
  ToolProcess tool(Login());
  ASSERT_TRUE(tool.WaitFor(kPrompt));
  // Ctrl-D passes on what has been typed without ending the line.
  tool.Type(std::string(600, 'a') + "\x04");
  tool.Type(std::string(600, 'a') + "\x04");
  const ToolResult result = tool.Finish();
  EXPECT_EQ(result.status, 4);
  EXPECT_THAT(result.terminal, HasSubstr("longer than 1024 bytes"));
}

TEST_F(TerminalTest, ASignalRestoresTheTerminalAndEndsTheProcess) {
  for (const int signal : {SIGINT, SIGTERM, SIGHUP, SIGQUIT, SIGALRM, SIGXCPU, SIGUSR1}) {
    ToolProcess tool(Login());
    ASSERT_TRUE(tool.WaitFor(kPrompt));
    ASSERT_FALSE(tool.IsEchoing());
    signal == SIGINT ? tool.Type("\x03") : tool.Signal(signal);
    // The line feed is written after the terminal has been restored.
    ASSERT_TRUE(tool.WaitFor("\n"));
    EXPECT_TRUE(tool.IsEchoing());
    EXPECT_EQ(tool.Finish().signal, signal);
  }
  EXPECT_TRUE(Sts().Requests().empty());
}

TEST_F(TerminalTest, AStoppedProcessLeavesAUsableTerminalAndAsksAgain) {
  ToolProcess tool(Login());
  ASSERT_TRUE(tool.WaitFor(kPrompt));
  tool.Type("half\x1a");
  ASSERT_TRUE(tool.WaitUntilStopped());
  EXPECT_TRUE(tool.IsEchoing());
  tool.Signal(SIGCONT);
  ASSERT_TRUE(tool.WaitFor(kPrompt));
  EXPECT_FALSE(tool.IsEchoing());
  tool.Type("secret\n");
  const ToolResult result = tool.Finish();
  EXPECT_EQ(result.status, 0) << result.terminal;
  EXPECT_THAT(result.terminal, Not(HasSubstr("half")));
}

TEST_F(TerminalTest, WithoutATerminalItSaysWhereAPasswordCanComeFrom) {
  ToolOptions options = Login();
  options.hasTerminal = false;
  options.err = Stream::kPipe;
  const ToolResult result = RunTool(options);
  EXPECT_EQ(result.status, 2);
  EXPECT_THAT(result.err, HasSubstr("--password-file"));
}

TEST_F(TerminalTest, OtherProcessesDoNotSeeThePassword) {
  DevSts::Misbehavior silent;
  silent.stall = DevSts::Stall::BeforeAnswer;
  Sts().SetMisbehavior(silent);
  ToolProcess tool(Login());
  ASSERT_TRUE(tool.WaitFor(kPrompt));
  tool.Type("secret\n");
  ASSERT_TRUE(Sts().WaitUntil([](const auto& counters) { return counters.stalled > 0; }));
  const std::string folder = "/proc/" + std::to_string(tool.Id());
  EXPECT_THAT(Content(folder + "/cmdline"), HasSubstr("alice"));
  EXPECT_THAT(Content(folder + "/cmdline"), Not(HasSubstr("secret")));
  const std::string environment = Content(folder + "/environ");
  if (geteuid() == 0) {
    EXPECT_THAT(environment, HasSubstr("TERM=xterm"));
    EXPECT_THAT(environment, Not(HasSubstr("secret")));
  } else {
    EXPECT_EQ(environment, "");  // only root may read it
  }
}

TEST_F(TerminalTest, ALongWaitShowsItsStageAndCtrlCEndsIt) {
  DevSts::Misbehavior silent;
  silent.stall = DevSts::Stall::BeforeAnswer;
  Sts().SetMisbehavior(silent);
  ToolOptions options = Login();
  options.arguments = PasswordLogin({"-o", PathOf("token")});
  ToolProcess tool(options);
  ASSERT_TRUE(tool.WaitFor("waiting for the answer (") && tool.WaitFor(" s of 30 s)"));
  tool.Type("\x03");
  const ToolResult result = tool.Finish();
  EXPECT_EQ(result.signal, SIGINT);
  // The line is removed: blanks, and the cursor in the first column.
  EXPECT_THAT(result.terminal, testing::EndsWith(" \r"));
  EXPECT_EQ(FilesInFolder(), (std::vector<std::string>{"ca.pem", "machine.key", "machine.pem",
                                                       "password", "sts.pem"}));
}

TEST_F(TerminalTest, WithoutATerminalThereIsNoProgress) {
  DevSts::Misbehavior silent;
  silent.stall = DevSts::Stall::BeforeAnswer;
  Sts().SetMisbehavior(silent);
  ToolOptions options;
  options.arguments = PasswordLogin({"--timeout", "2.3"});
  const ToolResult result = RunTool(options);
  EXPECT_EQ(result.status, 3);
  EXPECT_THAT(result.err, Not(HasSubstr("\r")));
  EXPECT_THAT(result.err, Not(HasSubstr("\x1b")));
}

}  // namespace
}  // namespace SsoClient::Tool::Testing
