// What commands read from standard input, and what they write to standard output.
#include "input/standard_input.h"

#include <string>
#include <utility>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <nlohmann/json.hpp>

#include "support/key_texts.h"
#include "support/service_fixture.h"
#include "support/test_pki.h"

namespace SsoClient::Tool::Testing {
namespace {

using testing::HasSubstr;
using testing::Not;

class StandardInputTest : public ServiceTest {
 protected:
  static ToolResult RunWith(const std::string& input, const std::vector<std::string>& arguments) {
    ToolOptions options;
    options.arguments = arguments;
    options.input = input;
    return RunTool(options);
  }
  std::vector<std::string> WithKey(const std::string& command,
                                   const std::vector<std::string>& arguments) const {
    return Command(command, Joined(Key(), arguments));
  }
  static std::string SubjectOf(const ToolResult& result) {
    EXPECT_EQ(result.status, 0) << result.out << result.err;
    return result.Json()["token"]["subject"]["name"];
  }
};

TEST_F(StandardInputTest, ValidateReadsAToken) {
  const std::string token = Content(LogIn("token", PasswordLogin()));
  const std::vector<std::string> command = UntrustedCommand("validate", {"-"});
  const ToolResult valid = RunWith(token, command);
  EXPECT_EQ(valid.status, 0) << valid.err;
  EXPECT_THAT(valid.out, HasSubstr("valid: alice@EXAMPLE.COM"));
  const ToolResult empty = RunWith("", command);
  EXPECT_EQ(empty.status, 4);
  EXPECT_THAT(empty.err, HasSubstr("standard input contains no token"));
}

TEST_F(StandardInputTest, ExchangeReadsATokenAndWritesTheNewOne) {
  const std::string own = Content(LogIn("own", KeyLogin()));
  for (const std::vector<std::string>& output : {std::vector<std::string>{}, {"-o", "-"}}) {
    const ToolResult result =
        RunWith(own, WithKey("exchange", Joined(output, {"--audience", "https://a.example", "-"})));
    EXPECT_EQ(result.status, 0) << result.err;
    EXPECT_THAT(result.err, HasSubstr("machine@EXAMPLE.COM"));
    EXPECT_THAT(result.err, Not(HasSubstr("Assertion")));
    WritePrivate("new", result.out);
    nlohmann::json shown = RunTool({"show", "--json", PathOf("new")}).Json();
    EXPECT_EQ(shown["audiences"], nlohmann::json({"https://a.example"}));
  }
}

TEST_F(StandardInputTest, LoginWritesTheTokenToStandardOutputWhenAsked) {
  const ToolResult result = RunTool(PasswordLogin({"-o", "-"}));
  EXPECT_EQ(result.status, 0) << result.err;
  WritePrivate("new", result.out);
  EXPECT_EQ(RunTool({"show", "--json", PathOf("new")}).Json()["subject"]["name"], "alice");
}

TEST_F(StandardInputTest, TheTokenToActAsCanBeRead) {
  const std::string own = LogIn("own", KeyLogin());
  const std::string alice = Content(LogIn("alice", PasswordLogin({"--delegable"})));
  const std::vector<std::string> actAs{"--act-as", "-", "--json", "-o", PathOf("new")};
  EXPECT_EQ(SubjectOf(RunWith(alice, KeyLogin(actAs))), "alice");
  EXPECT_EQ(SubjectOf(RunWith(alice, WithKey("exchange", Joined(actAs, {own})))), "alice");
}

TEST_F(StandardInputTest, ATokenSharesItWithNothing) {
  const std::string own = Content(LogIn("own", KeyLogin()));
  Sts().ClearRequests();
  const std::vector<std::pair<std::vector<std::string>, std::string>> wrong{
      {WithKey("exchange", {"--act-as", "-", "-"}), "FILE and --act-as"},
      {WithKey("exchange", {"--passphrase-fd", "0", "-"}), "FILE and --passphrase-fd"},
      {WithKey("exchange", {"--passphrase-fd", "0", "--act-as", "-", PathOf("own")}),
       "--act-as and --passphrase-fd"},
      {WithKey("renew", {"--passphrase-fd", "0", "-"}), "FILE and --passphrase-fd"},
      {Command("login", {"--user", "alice", "--password-fd", "0", "--act-as", "-"}),
       "--act-as and --password-fd"},
      {KeyLogin({"--passphrase-fd", "0", "--act-as", "-"}), "--act-as and --passphrase-fd"}};
  for (const auto& [arguments, inputs] : wrong) {
    const ToolResult result = RunWith(own, Joined(arguments, {"--json", "-o", PathOf("new")}));
    EXPECT_EQ(result.status, 2) << result.out;
    const nlohmann::json error = result.Json()["error"];
    EXPECT_EQ(error.value("kind", ""), "usage");
    EXPECT_EQ(error.value("message", ""), inputs + " both want standard input");
    EXPECT_EQ(error.value("remedy", ""), "name a file for one of them");
  }
  EXPECT_TRUE(Sts().Requests().empty());
}

TEST_F(StandardInputTest, SecretsAreLinesOfIt) {
  const std::string passphrase = "open-sesame";
  const auto identity = Tarnik::Testing::MakeIdentity({.rsaBits = 2048}, nullptr);
  const std::string key = Tarnik::Testing::ToPkcs8Pem(identity.key.get(), &passphrase);
  const ToolResult result = RunWith(
      passphrase + "\nsecret\n",
      Command("login", {"--user", "alice@EXAMPLE.COM", "--password-fd", "0", "--certificate",
                        WritePrivate("c.pem", identity.Pem()), "--key", WritePrivate("c.key", key),
                        "--passphrase-fd", "0", "--json", "-o", PathOf("new")}));
  EXPECT_EQ(SubjectOf(result), "alice");
}

}  // namespace
}  // namespace SsoClient::Tool::Testing
