#include <chrono>
#include <set>
#include <string>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <nlohmann/json.hpp>
#include <sys/stat.h>

#include "support/service_fixture.h"

namespace SsoClient::Tool::Testing {
namespace {

using testing::HasSubstr;
using testing::Not;

using Names = std::set<std::string>;

Names NamesOf(const nlohmann::json& object) {
  Names names;
  for (const auto& [name, value] : object.items()) {
    names.insert(name);
  }
  return names;
}

class TokenCommandsTest : public ServiceTest {
 protected:
  std::vector<std::string> WithKey(const std::string& command,
                                   const std::vector<std::string>& arguments) const {
    return Command(command, Joined(Key(), arguments));
  }
  std::string IdOf(const std::string& path) const {
    const std::string text = Content(path);
    const std::size_t start = text.find(" ID=\"") + 5;
    return text.substr(start, text.find('"', start) - start);
  }
};

TEST_F(TokenCommandsTest, RenewReplacesTheTokenInItsFile) {
  const std::string path = LogIn("token", KeyLogin({"--renewable", "--lifetime", "10m"}));
  const std::string before = Content(path);
  const ToolResult result = RunTool(WithKey("renew", {"--lifetime", "8h", "--json", path}));
  ASSERT_EQ(result.status, 0) << result.out;
  const nlohmann::json json = result.Json();
  EXPECT_EQ(json["output"], path);
  EXPECT_EQ(json["token"]["lifetime"], 8 * 3600);
  EXPECT_EQ(json["deviations"], nlohmann::json::array());
  EXPECT_NE(Content(path), before);
  EXPECT_EQ(ModeOf(path), 0600U);
}

TEST_F(TokenCommandsTest, RenewKeepsTheFileWhenTheServiceRefuses) {
  const std::string path = LogIn("token", KeyLogin());
  const std::string before = Content(path);
  const ToolResult result = RunTool(WithKey("renew", {"--json", path}));
  EXPECT_EQ(result.status, 1);
  EXPECT_THAT(result.Json()["error"]["remedy"].get<std::string>(), HasSubstr("--renewable"));
  EXPECT_EQ(Content(path), before);
}

TEST_F(TokenCommandsTest, RenewReadsStandardInputAndWritesStandardOutput) {
  const std::string path = LogIn("token", KeyLogin({"--renewable"}));
  ToolOptions options;
  options.arguments = WithKey("renew", {"-"});
  options.input = Content(path);
  const ToolResult result = RunTool(options);
  EXPECT_EQ(result.status, 0) << result.err;
  EXPECT_THAT(result.out, HasSubstr("Assertion"));
  EXPECT_THAT(result.err, HasSubstr("machine@EXAMPLE.COM"));
}

TEST_F(TokenCommandsTest, OnlyATokenOfTheServiceThatIsBoundToTheKeyIsSent) {
  const std::string bearer = LogIn("bearer", PasswordLogin());
  const std::string bound = LogIn("bound", KeyLogin({"--renewable"}));
  Sts().ClearRequests();
  for (const char* const command : {"renew", "exchange"}) {
    const ToolResult result = RunTool(WithKey(command, {"--json", "-o", PathOf("new"), bearer}));
    EXPECT_EQ(result.status, 4);
    EXPECT_EQ(result.Json()["error"]["kind"], "not-bound");
    chmod(bound.c_str(), 0644);
    EXPECT_EQ(RunTool(WithKey(command, {"-o", PathOf("new"), bound})).status, 4);
    chmod(bound.c_str(), 0600);
  }
  WritePrivate("sts.pem", Sts().StrangerCredential().certificatePem);
  const ToolResult stranger = RunTool(WithKey("renew", {"--json", bound}));
  EXPECT_EQ(stranger.status, 1);
  EXPECT_EQ(stranger.Json()["error"]["kind"], "bad-token");
  EXPECT_TRUE(Sts().Requests().empty());
}

TEST_F(TokenCommandsTest, TheRemedyOfATokenThatIsNotFromTheServiceFitsTheReason) {
  const std::string bound = LogIn("bound", KeyLogin({"--renewable"}));
  std::string text = Content(bound);
  const auto remedy = [&] {
    WritePrivate("bound", text);
    const ToolResult result = RunTool(WithKey("renew", {"--json", bound}));
    EXPECT_EQ(result.status, 1) << result.out;
    EXPECT_EQ(result.Json()["error"]["kind"], "bad-token");
    return result.Json()["error"]["remedy"].get<std::string>();
  };
  text.replace(text.find(">machine@"), 9, ">another@");
  EXPECT_THAT(remedy(), HasSubstr("--sts-certificate"));
  const std::string algorithm = "2001/04/xmldsig-more#rsa-sha256";
  ASSERT_NE(text.find(algorithm), std::string::npos);
  text.replace(text.find(algorithm), algorithm.size(), "2000/09/xmldsig#rsa-sha1");
  EXPECT_THAT(remedy(), HasSubstr("supported algorithm"));
}

TEST_F(TokenCommandsTest, ExchangeGetsATokenForOthers) {
  const std::string own = LogIn("own", KeyLogin({"--delegable"}));
  const ToolResult result =
      RunTool(WithKey("exchange", {"--audience", "https://a.example", "--delegate-to",
                                   "bob@EXAMPLE.COM", "-o", PathOf("new"), "--json", own}));
  ASSERT_EQ(result.status, 0) << result.out;
  const nlohmann::json token = result.Json()["token"];
  EXPECT_EQ(token["audiences"], nlohmann::json({"https://a.example"}));
  ASSERT_EQ(token["delegationChain"].size(), 1U);
  EXPECT_EQ(token["delegationChain"][0]["name"], "bob");
  EXPECT_EQ(ModeOf(PathOf("new")), 0600U);
}

TEST_F(TokenCommandsTest, ExchangeActsOnBehalfOfTheSubjectOfAToken) {
  const std::string own = LogIn("own", KeyLogin());
  const std::string alice = LogIn("alice", PasswordLogin({"--delegable"}));
  const ToolResult result =
      RunTool(WithKey("exchange", {"--act-as", alice, "-o", PathOf("new"), "--json", own}));
  ASSERT_EQ(result.status, 0) << result.out;
  EXPECT_EQ(result.Json()["token"]["subject"]["name"], "alice");
  EXPECT_EQ(result.Json()["deviations"], nlohmann::json::array());
}

TEST_F(TokenCommandsTest, ARefusedTokenIsReplacedByALogin) {
  const std::string path = LogIn("token", KeyLogin({"--renewable", "--delegable"}));
  for (const char* code : {"FailedAuthentication", "UnableToRenew"}) {
    DevSts::Misbehavior refusal;
    refusal.fault = DevSts::FaultAnswer{"http://docs.oasis-open.org/ws-sx/ws-trust/200512", code,
                                        "The RenewTarget is unknown", false, 500};
    Sts().SetMisbehavior(refusal);
    for (const char* command : {"renew", "exchange"}) {
      const ToolResult result =
          RunTool(WithKey(command, {"--output", PathOf("new"), "--json", path}));
      EXPECT_EQ(result.status, 1) << result.out;
      EXPECT_THAT(result.Json()["error"]["remedy"].get<std::string>(), HasSubstr("log in again"));
    }
  }
}

TEST_F(TokenCommandsTest, ATokenThatIsNotDelegableIsTheRemedyOfARefusal) {
  const std::string own = LogIn("own", KeyLogin());
  const std::string alice = LogIn("alice", PasswordLogin());
  const auto remedy = [this](const std::vector<std::string>& arguments) {
    const ToolResult result = RunTool(Joined(arguments, {"-o", PathOf("new"), "--json"}));
    EXPECT_EQ(result.status, 1) << result.out;
    return result.Json()["error"]["remedy"].get<std::string>();
  };
  const char* const ofActAs = "the token of --act-as is not delegable";
  EXPECT_THAT(remedy(WithKey("exchange", {"--act-as", alice, own})), HasSubstr(ofActAs));
  EXPECT_THAT(remedy(KeyLogin({"--act-as", alice})), HasSubstr(ofActAs));
  EXPECT_THAT(remedy(WithKey("exchange", {"--delegate-to", "bob@EXAMPLE.COM", own})),
              HasSubstr("the token is not delegable"));
}

TEST_F(TokenCommandsTest, ValidateSaysWhatTheServiceSays) {
  const std::string path = LogIn("token", PasswordLogin());
  const std::vector<std::string> command = UntrustedCommand("validate", {path});
  const ToolResult valid = RunTool(command);
  EXPECT_EQ(valid.status, 0) << valid.err;
  EXPECT_THAT(valid.out, HasSubstr("valid: alice@EXAMPLE.COM, valid for"));
  EXPECT_EQ(RunTool(Joined(command, {"--json"})).Json()["isValid"], true);

  ASSERT_TRUE(Sts().Revoke(IdOf(path)));
  const ToolResult invalid = RunTool(command);
  EXPECT_EQ(invalid.status, 1);
  EXPECT_EQ(invalid.out, "invalid\n");
  EXPECT_EQ(invalid.err, "");
  const nlohmann::json json = RunTool(Joined(command, {"--json"})).Json();
  EXPECT_EQ(json["isValid"], false);
  EXPECT_EQ(json["status"], "refused");
  EXPECT_FALSE(json.contains("error"));
}

// The names of docs/tool.md.
TEST_F(TokenCommandsTest, TheNamesOfTheJsonObjectsAreStable) {
  const Names ofToken{"advice",
                      "audiences",
                      "confirmation",
                      "delegationChain",
                      "elapsedPercent",
                      "groups",
                      "id",
                      "isDelegable",
                      "isRenewable",
                      "isSolution",
                      "issuer",
                      "lifetime",
                      "names",
                      "notBefore",
                      "notOnOrAfter",
                      "now",
                      "remaining",
                      "signatureAlgorithm",
                      "signer",
                      "state",
                      "subject"};
  const Names ofIssued{"command", "deviations", "output", "status", "token"};
  const std::string file = PathOf("alice");
  const nlohmann::json alice = RunTool(PasswordLogin({"--json", "-o", file})).Json();
  EXPECT_EQ(NamesOf(alice), ofIssued);
  EXPECT_EQ(NamesOf(alice.at("token")), ofToken);
  const nlohmann::json answer = RunTool(UntrustedCommand("validate", {"--json", file})).Json();
  EXPECT_EQ(NamesOf(answer), (Names{"command", "isValid", "status", "token"}));
  EXPECT_EQ(NamesOf(answer.at("token")), ofToken);

  Names ofBound = ofToken;
  ofBound.insert("holder");
  const std::string own = LogIn("own", KeyLogin({"--renewable"}));
  DevSts::AssertionOptions options;
  options.maxLifetime = std::chrono::minutes(10);
  Sts().SetAssertionOptions(options);
  for (const char* const command : {"renew", "exchange"}) {
    const nlohmann::json issued =
        RunTool(WithKey(command, {"--json", "-o", PathOf("new"), own})).Json();
    EXPECT_EQ(NamesOf(issued), ofIssued);
    EXPECT_EQ(NamesOf(issued.at("token")), ofBound);
    EXPECT_EQ(NamesOf(issued.at("token").at("holder")),
              (Names{"issuer", "notAfter", "notBefore", "serialNumber", "sha256", "subject"}));
    EXPECT_EQ(NamesOf(issued.at("deviations").at(0)), (Names{"field", "issued", "requested"}));
  }
}

TEST_F(TokenCommandsTest, ColoursAreForTerminalsWithoutNoColor) {
  ToolOptions options;
  options.arguments = UntrustedCommand("validate", {LogIn("token", PasswordLogin())});
  EXPECT_THAT(RunTool(options).out, Not(HasSubstr("\x1b")));
  options.hasTerminal = true;
  options.out = Stream::kTerminal;
  EXPECT_THAT(RunTool(options).terminal, HasSubstr("\x1b[32mvalid\x1b[0m"));
  options.environment["NO_COLOR"] = "1";
  EXPECT_THAT(RunTool(options).terminal, Not(HasSubstr("\x1b")));
}

}  // namespace
}  // namespace SsoClient::Tool::Testing
