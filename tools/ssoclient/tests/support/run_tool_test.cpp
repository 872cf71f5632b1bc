#include "support/run_tool.h"

#include <gtest/gtest.h>

namespace SsoClient::Tool::Testing {
namespace {

TEST(RunToolTest, ReturnsWhatTheToolHasWrittenAndItsStatus) {
  const ToolResult version = RunTool({"--version"});
  EXPECT_EQ(version.status, 0);
  EXPECT_EQ(version.out.substr(0, 10), "ssoclient ");
  EXPECT_EQ(version.err, "");

  const ToolResult wrong = RunTool({"--nothing"});
  EXPECT_EQ(wrong.status, 2);
  EXPECT_EQ(wrong.out, "");
  EXPECT_NE(wrong.err, "");
}

TEST(RunToolTest, TheTerminalIsOneOfTheStreams) {
  ToolOptions options;
  options.arguments = {"--version"};
  options.hasTerminal = true;
  options.out = Stream::kTerminal;
  const ToolResult result = RunTool(options);
  EXPECT_EQ(result.status, 0);
  EXPECT_EQ(result.out, "");
  EXPECT_NE(result.terminal.find("ssoclient "), std::string::npos);
}

}  // namespace
}  // namespace SsoClient::Tool::Testing
