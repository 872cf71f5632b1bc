#include <chrono>
#include <string>

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <nlohmann/json.hpp>

#include "support/service_fixture.h"

namespace SsoClient::Tool::Testing {
namespace {

using testing::AllOf;
using testing::HasSubstr;
using testing::Not;

DevSts::Credential SelfSigned(const std::string& name) {
  DevSts::CertificateSpec spec;
  spec.commonName = name;
  spec.keyType = DevSts::KeyType::Rsa2048;
  return DevSts::MakeCertificate(spec);
}

class LoginFailureTest : public ServiceTest {
 protected:
  // Expects that a login with these arguments fails, and returns its error.
  nlohmann::json Fail(const std::vector<std::string>& arguments, int status,
                      const std::string& kind) const {
    const ToolResult result = RunTool(Joined(arguments, {"--json", "-o", PathOf("token")}));
    EXPECT_EQ(result.status, status) << result.out;
    const nlohmann::json json = result.Json();
    EXPECT_EQ(json["error"]["kind"], kind) << result.out;
    EXPECT_EQ(Content(PathOf("token")), "");
    return json["error"];
  }

  std::vector<std::string> LoginTo(const std::string& url) const {
    return {"login",
            "--url",
            url,
            "--ca",
            PathOf("ca.pem"),
            "--sts-certificate",
            PathOf("sts.pem"),
            "--user",
            "alice@EXAMPLE.COM",
            "--password-file",
            PathOf("password")};
  }
};

TEST_F(LoginFailureTest, ARefusalByTheServiceHasStatus1) {
  WritePrivate("password", "wrong\n");
  EXPECT_NE(Fail(PasswordLogin(), 1, "refused-login")["remedy"], nullptr);
  WritePrivate("password", "expired-secret\n");
  Fail(Command("login", {"--user", "expired@EXAMPLE.COM", "--password-file", PathOf("password")}),
       1, "expired-password");
  DevSts::Misbehavior fault;
  fault.fault = DevSts::FaultAnswer{"urn:other", "Busy", "Come back", false, 500};
  Sts().SetMisbehavior(fault);
  EXPECT_THAT(Fail(PasswordLogin(), 1, "fault")["message"].get<std::string>(), HasSubstr("Busy"));
}

TEST_F(LoginFailureTest, ThePasswordIsNeverInAMessage) {
  WritePrivate("password", "s<cret & word\n");
  for (const std::string text : {"no: s<cret & word", "no: s&amp;lt;cret &amp;amp; word"}) {
    DevSts::Misbehavior fault;
    fault.fault = DevSts::FaultAnswer{"http://docs.oasis-open.org/ws-sx/ws-trust/200512",
                                      "FailedAuthentication", text, false, 500};
    Sts().SetMisbehavior(fault);
    const ToolResult result = RunTool(PasswordLogin({"-o", PathOf("token")}));
    EXPECT_EQ(result.status, 1);
    EXPECT_THAT(result.err, Not(HasSubstr("cret")));
    EXPECT_THAT(result.err, HasSubstr("not shown"));
  }
}

TEST_F(LoginFailureTest, TheServicesReasonIsShownUnlessItHasThePassword) {
  const auto refuse = [this](const std::string& reason) {
    DevSts::Misbehavior fault;
    fault.fault = DevSts::FaultAnswer{
        "http://docs.oasis-open.org/wss/2004/01/oasis-200401-wss-wssecurity-utility-1.0.xsd",
        "MessageExpired", reason, false, 500};
    Sts().SetMisbehavior(fault);
    const ToolResult result = RunTool(PasswordLogin({"-o", PathOf("token")}));
    EXPECT_EQ(result.status, 1);
    return result.err;
  };
  EXPECT_THAT(refuse("Your clock is slow"),
              HasSubstr("ssoclient: The service answered with fault `wsu:MessageExpired': Your "
                        "clock is slow\n"));
  const std::string hidden = refuse("Your clock is slow, and your password secret");
  EXPECT_THAT(hidden, HasSubstr("MessageExpired"));
  EXPECT_THAT(hidden, Not(HasSubstr("password secret")));
  EXPECT_THAT(refuse("turned\xe2\x80\xae"), Not(HasSubstr("\xe2\x80\xae")));
}

TEST_F(LoginFailureTest, WithoutAUsableAnswerTheStatusIs3) {
  Fail(LoginTo("https://127.0.0.1:1/"), 3, "unreachable");
  Fail(LoginTo("https://localhost:" + std::to_string(Sts().HttpPort()) + "/sts"), 3, "tls");
  WritePrivate("ca.pem", SelfSigned("Stranger").certificatePem);
  EXPECT_THAT(Fail(PasswordLogin(), 3, "tls-trust")["remedy"].get<std::string>(),
              HasSubstr("doctor"));
}

TEST_F(LoginFailureTest, TheNameOfTheServiceCounts) {
  Fail(PasswordLogin({"--peer-name", "elsewhere.example"}), 3, "tls-name");
  EXPECT_EQ(RunTool(PasswordLogin({"--peer-name", "localhost"})).status, 0);
}

TEST_F(LoginFailureTest, AnswersThatAreNotOfAServiceHaveTheirKinds) {
  const auto answer = [](int status, const std::string& body) {
    DevSts::Misbehavior misbehavior;
    misbehavior.httpAnswer = DevSts::HttpAnswer{status, "x", {}, body};
    Sts().SetMisbehavior(misbehavior);
  };
  answer(503, "busy");
  Fail(PasswordLogin(), 3, "http-status");
  answer(200, "<html/>");
  Fail(PasswordLogin(), 3, "bad-answer");
  answer(401, "no");
  Fail(PasswordLogin(), 1, "refused-login");
  DevSts::Misbehavior cut;
  cut.cutOff = DevSts::CutOff{10, DevSts::CutStyle::Orderly};
  Sts().SetMisbehavior(cut);
  Fail(PasswordLogin(), 3, "cut-off");
}

TEST_F(LoginFailureTest, ATokenOfAnotherSignerIsNotWritten) {
  WritePrivate("sts.pem", Sts().StrangerCredential().certificatePem);
  EXPECT_THAT(Fail(PasswordLogin(), 3, "bad-token")["remedy"].get<std::string>(),
              HasSubstr("--sts-certificate"));
}

TEST_F(LoginFailureTest, TheRemedyOfATokenFitsTheReason) {
  const auto remedy = [this](const DevSts::AssertionOptions& assertion) {
    Sts().SetAssertionOptions(assertion);
    return Fail(PasswordLogin(), 3, "bad-token")["remedy"].get<std::string>();
  };
  const auto isAboutAlgorithms =
      AllOf(HasSubstr("supported algorithm"), Not(HasSubstr("certificate")));
  DevSts::AssertionOptions signature;
  signature.signing.signature = DevSts::SignatureAlgorithm::RsaSha1;
  EXPECT_THAT(remedy(signature), isAboutAlgorithms);
  DevSts::AssertionOptions digest;
  digest.signing.digest = DevSts::DigestAlgorithm::Sha1;
  EXPECT_THAT(remedy(digest), isAboutAlgorithms);
  DevSts::AssertionOptions late;
  late.notBeforeOffset = std::chrono::hours(-1);
  EXPECT_THAT(remedy(late), AllOf(HasSubstr("clocks"), Not(HasSubstr("certificate"))));
}

TEST_F(LoginFailureTest, TheTimeLimitsTheWholeCall) {
  DevSts::Misbehavior silent;
  silent.stall = DevSts::Stall::BeforeAnswer;
  Sts().SetMisbehavior(silent);
  const auto begun = std::chrono::steady_clock::now();
  const auto error = Fail(PasswordLogin({"--timeout", "0.3"}), 3, "timed-out");
  EXPECT_LT(std::chrono::steady_clock::now() - begun, std::chrono::seconds(20));
  EXPECT_THAT(error["remedy"].get<std::string>(), HasSubstr("--timeout"));
}

TEST_F(LoginFailureTest, AClockThatIsWrongIsTheRemedyOfARefusal) {
  DevSts::Misbehavior fault;
  fault.fault = DevSts::FaultAnswer{"urn:other", "Old", "Too old", false, 500};
  fault.extraHeaders = {{"Date", "Tue, 01 Jan 2030 00:00:00 GMT"}};
  Sts().SetMisbehavior(fault);
  EXPECT_THAT(Fail(PasswordLogin(), 1, "fault")["remedy"].get<std::string>(), HasSubstr("clock"));
}

TEST_F(LoginFailureTest, FilesThatCannotBeUsedAreLocal) {
  Fail(Command("login", {"--certificate", PathOf("none"), "--key", PathOf("machine.key")}), 4,
       "key-file");
  Fail(Command("login", {"--certificate", PathOf("machine.pem"), "--key", PathOf("ca.pem")}), 4,
       "key");
  WritePrivate("other.key", SelfSigned("Other").privateKeyPem);
  Fail(Command("login", {"--certificate", PathOf("machine.pem"), "--key", PathOf("other.key")}), 4,
       "key-mismatch");
  Fail(PasswordLogin({"--sts-certificate", PathOf("none")}), 4, "sts-certificate");
  Fail(PasswordLogin({"--ca", PathOf("none")}), 4, "tls-files");
  Fail(PasswordLogin({"--act-as", PathOf("ca.pem")}), 4, "not-a-token");
  Fail(PasswordLogin({"--act-as", PathOf("none")}), 4, "token-file");
  EXPECT_TRUE(Sts().Requests().empty());
}

}  // namespace
}  // namespace SsoClient::Tool::Testing
