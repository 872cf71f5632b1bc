#include "program.h"

#include <ostream>
#include <sstream>
#include <streambuf>
#include <string>
#include <utility>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <nlohmann/json.hpp>

#include "support/run_tool.h"

namespace SsoClient::Tool::Testing {
namespace {

using testing::EndsWith;
using testing::HasSubstr;
using testing::Not;
using testing::StartsWith;

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
  EXPECT_THAT(RunTool({"--json", "show", "x"}).Json()["error"]["message"].get<std::string>(),
              HasSubstr("--json must follow the command: ssoclient show --json"));
  EXPECT_THAT(RunTool({"--bogus", "show", "x"}).err, HasSubstr("there is no option --bogus\n"));
  EXPECT_THAT(RunTool({"show", "--bogus"}).err, HasSubstr("there is no option --bogus\n"));
  EXPECT_THAT(RunTool(Login({"-xyz"})).err, HasSubstr("ssoclient: there is no option -x\n"));
  EXPECT_THAT(RunTool(Login({"surplus"})).err,
              HasSubstr("ssoclient: there are more arguments than the command has\n"));
  EXPECT_THAT(RunTool({"--wrong=value"}).err,
              HasSubstr("there is no option --wrong without a command\n"));
}

TEST(ProgramTest, WhatIsWrongIsSaidInOneWay) {
  const std::vector<std::pair<std::vector<std::string>, std::string>> wrong = {
      {Login({"--password-fd", "x"}), "--password-fd: it must be the number of a descriptor"},
      {Login({"--kerberos=maybe"}), "--kerberos takes no value"},
      {Login({"--delegable=no"}), "--delegable takes no value"},
      {Login({"--timeout"}), "--timeout needs its value: DURATION"},
      {Login({"--output"}), "--output needs its value: FILE"},
      {Login({"--user", "bob"}), "--user can be given only once"},
      {Login({"--kerberos"}), "--user and --kerberos exclude each other"},
      {Login({"--service", "HTTP@sts.example"}), "--service needs --kerberos"},
      {{"login", "--user", "alice"}, "--url is required"},
      {{"show"}, "FILE is required"},
      {{"verify", "--trust-for", "issuer"}, "--trust-for needs its value: ISSUER PATH"},
      {{"verify", "--audience", "a", "--largest-token", "0", "token.xml"},
       "--largest-token: it must not be 0"},
      {{"verify", "--audience", "a", "--largest-token", "-1", "token.xml"},
       "--largest-token: '-1' is not a whole number"},
      {{"verify", "--audience", "a", "--largest-token", "010", "token.xml"},
       "--largest-token: '010' is not a whole number"},
      {Login({"--password-fd", "010"}), "--password-fd: it must be the number of a descriptor"},
  };
  for (const auto& [arguments, message] : wrong) {
    const ToolResult result = RunTool(arguments);
    EXPECT_EQ(result.status, 2);
    EXPECT_EQ(result.err.substr(0, result.err.find('\n')), "ssoclient: " + message);
  }
}

// Such as "$FILE" of a variable that is not set: the token would be printed, for example.
TEST(ProgramTest, AnEmptyValueIsNotAMissingOption) {
  const std::vector<std::string> options = {
      "--output",   "--password-file", "--certificate", "--act-as", "--delegate-to",
      "--audience", "--peer-name",     "--ca",          "--tls-crl"};
  for (const std::string& option : options) {
    for (const auto& value : {std::vector<std::string>{option, ""}, {option + "="}}) {
      const ToolResult result = RunTool(Login(value));
      EXPECT_EQ(result.status, 2);
      EXPECT_THAT(result.err, HasSubstr("ssoclient: " + option + ": it must not be empty\n"));
    }
  }
  EXPECT_THAT(RunTool({"show", ""}).err, HasSubstr("FILE: it must not be empty"));
  EXPECT_THAT(RunTool({"verify", "--audience", "a", "--trust-for", "", "sts.pem", "token"}).err,
              HasSubstr("--trust-for: it must not be empty"));
}

TEST(ProgramTest, TheNextArgumentIsNotTheValueOfAnOptionWithoutOne) {
  const ToolResult result = RunTool(Login({"--output=", "--json"}));
  EXPECT_EQ(result.status, 2);
  EXPECT_THAT(result.out, HasSubstr("--output: it must not be empty"));
  EXPECT_THAT(RunTool({"show", "--", "--name="}).err, HasSubstr("the token file --name=: "));
}

// Has no place for any character.
class FullBuffer : public std::streambuf {};

// A stream that throws, as anything may when the memory is used up.
TEST(ProgramTest, AReportThatCannotBeMadeIsALocalFailure) {
  FullBuffer full;
  std::ostream out(&full);
  out.exceptions(std::ostream::badbit);
  std::ostringstream err;
  const char* const arguments[] = {"ssoclient", "show", "--json", "--unknown"};
  EXPECT_EQ(RunProgram(4, arguments, Console{out, err}), ExitStatus::kLocal);
  EXPECT_THAT(err.str(), StartsWith("ssoclient: "));
  EXPECT_THAT(err.str(), EndsWith("\n"));
}

}  // namespace
}  // namespace SsoClient::Tool::Testing
