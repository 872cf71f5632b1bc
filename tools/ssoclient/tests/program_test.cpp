#include "program.h"

#include <string>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <nlohmann/json.hpp>

#include "support/run_tool.h"

namespace SsoClient::Tool::Testing {
namespace {

using testing::HasSubstr;
using testing::Not;

constexpr const char* kSecret = "hunter2";

std::vector<std::string> Login(const std::vector<std::string>& arguments) {
  std::vector<std::string> all{"login", "--url", "https://sts.example", "--user", "alice"};
  all.insert(all.end(), arguments.begin(), arguments.end());
  return all;
}

TEST(ProgramTest, WhatMayBeAPasswordIsNotRepeated) {
  const std::vector<std::vector<std::string>> wrong = {
      Login({"--password", "hunter2"}),
      Login({"--password=hunter2"}),
      Login({"-phunter2"}),
      Login({"hunter2"}),
      Login({"--", "hunter2"}),
      Login({"--password-fd", "hunter2"}),
      Login({"--password-fd=hunter2"}),
      Login({"--passphrase-fd", "hunter2"}),
      Login({"--passphrase", "hunter2", "--certificate", "me.pem"}),
      Login({"--kerberos=hunter2"}),
      Login({"--json=hunter2"}),
      Login({"--password", "hunter2", "more", "hunter2"}),
      {"--password=hunter2", "login"},
      {"-phunter2", "login"},
      {"show", "token.xml", "hunter2"},
      {"doctor", "--url", "https://sts.example", "--user", "alice", "--password", "hunter2"},
  };
  for (const std::vector<std::string>& arguments : wrong) {
    for (const bool isJson : {false, true}) {
      std::vector<std::string> all = arguments;
      if (isJson) {
        all.insert(all.begin() + 1, "--json");
      }
      const ToolResult result = RunTool(all);
      EXPECT_EQ(result.status, 2) << testing::PrintToString(all);
      EXPECT_THAT(result.out + result.err, Not(HasSubstr(kSecret))) << testing::PrintToString(all);
      EXPECT_NE(result.out + result.err, "");
    }
  }
}

TEST(ProgramTest, AnUnknownOptionIsNamed) {
  EXPECT_THAT(RunTool(Login({"--password=hunter2"})).err,
              HasSubstr("ssoclient: there is no option --password\n"));
  EXPECT_THAT(RunTool(Login({"before", "--other", "after"})).err,
              HasSubstr("ssoclient: there is no option --other\n"));
  EXPECT_THAT(RunTool(Login({"-xyz"})).err, HasSubstr("ssoclient: there is no option -x\n"));
  EXPECT_THAT(RunTool(Login({"surplus"})).err,
              HasSubstr("ssoclient: there are more arguments than the command has\n"));
  EXPECT_THAT(RunTool({"--wrong=value"}).err,
              HasSubstr("there is no option --wrong without a command\n"));
}

TEST(ProgramTest, AnOptionWithAWrongValueIsNamed) {
  EXPECT_THAT(RunTool(Login({"--password-fd", "x"})).err,
              HasSubstr("--password-fd: it must be the number of a descriptor\n"));
  EXPECT_THAT(RunTool(Login({"--kerberos=maybe"})).err, HasSubstr("--kerberos"));
}

}  // namespace
}  // namespace SsoClient::Tool::Testing
