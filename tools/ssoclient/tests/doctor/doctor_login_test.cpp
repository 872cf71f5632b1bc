// Findings about logins and their tokens, each produced for real.
#include <map>
#include <optional>
#include <string>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/stat.h>

#include <tarnik/system/date_time.h>

#include "devsts/kerberos_realm.h"
#include "devsts/server.h"
#include "support/doctor_run.h"
#include "support/kerberos_service.h"
#include "support/peer.h"
#include "support/temporary_file.h"

namespace SsoClient::Tool::Testing {
namespace {

using DevSts::Misbehavior;
using Tarnik::Testing::TemporaryFile;
using testing::EndsWith;
using testing::HasSubstr;
using testing::Not;

// Lets the periods of validity of the assertion end in `seconds` from now.
void ReplaceEnds(std::string& assertion, long seconds) {
  constexpr long kMicroseconds = 1000000;
  const long now = Tarnik::System::GetUtcDateTime().GetUtcTime();
  const auto end = Tarnik::System::DateTimeFromUtc(now + seconds * kMicroseconds, false);
  const std::string name = "NotOnOrAfter=\"";
  for (std::size_t at = assertion.find(name); at != std::string::npos;
       at = assertion.find(name, at + 1)) {
    const std::size_t begin = at + name.size();
    assertion.replace(begin, assertion.find('"', begin) - begin, end.ToString());
  }
}

class DoctorLoginTest : public testing::Test {
 protected:
  DoctorRun Run(const std::vector<std::string>& arguments, const std::string& password = "",
                const std::string& signerFile = "") {
    ToolOptions options;
    options.arguments = {"doctor",
                         "--json",
                         "--url",
                         sts.HttpsUrl(),
                         "--ca",
                         ca.Path(),
                         "--sts-certificate",
                         signerFile.empty() ? signer.Path() : signerFile};
    options.arguments.insert(options.arguments.end(), arguments.begin(), arguments.end());
    if (!password.empty()) {
      options.arguments.insert(options.arguments.end(), {"--password-fd", "5"});
      options.descriptors = {{5, password + "\n"}};
    }
    options.environment = environment;
    return DoctorRun(options);
  }

  DoctorRun RunAlice(const std::string& password = "secret", const std::string& signerFile = "") {
    return Run({"--user", "alice@EXAMPLE.COM"}, password, signerFile);
  }

  DevSts::Server sts;
  TemporaryFile ca{sts.CaCertificatePem()};
  TemporaryFile signer{sts.SigningCertificatePem()};
  std::map<std::string, std::optional<std::string>> environment;
};

TEST_F(DoctorLoginTest, APasswordThatIsAcceptedGivesAToken) {
  const DoctorRun run = RunAlice();
  EXPECT_EQ(run.Status(), 0) << run.Text();
  EXPECT_EQ(run.Finding("login"), "ok");
  EXPECT_EQ(run.Finding("token"), "ok");
  EXPECT_EQ(run.Detail("token", "/subject"), "\"alice@EXAMPLE.COM\"");
  EXPECT_EQ(sts.GetCounters().tokensIssued, 1U);
  EXPECT_THAT(run.Text(), Not(HasSubstr("secret")));
}

TEST_F(DoctorLoginTest, ARefusedLoginIsFoundAndTriedOnce) {
  const DoctorRun run = RunAlice("wrong-one");
  ExpectFailure(run, "login", "login-refused", 1, "token");
  EXPECT_THAT(run.Text(), Not(HasSubstr("wrong-one")));
  EXPECT_EQ(sts.Requests().size(), 2U);  // the harmless one and the login
}

TEST_F(DoctorLoginTest, AnExpiredPasswordIsFound) {
  ExpectFailure(Run({"--user", "expired@EXAMPLE.COM"}, "expired-secret"), "login",
                "password-expired", 1, "token");
}

TEST_F(DoctorLoginTest, AnotherSignerIsFoundAndNamed) {
  const TemporaryFile other(sts.StrangerCredential().certificatePem);
  const DoctorRun run = RunAlice("secret", other.Path());
  ExpectFailure(run, "login", "signer-mismatch", 3, "token");
  EXPECT_THAT(run.Detail("login", "/claimedSigners/0/fingerprint"), HasSubstr(":"));
  const std::string fingerprint = run.Detail("login", "/claimedSigners/0/fingerprint");
  EXPECT_THAT(run.Message("login"), HasSubstr(fingerprint.substr(1, fingerprint.size() - 2)));
}

TEST_F(DoctorLoginTest, WithoutASigningCertificateTheSignerIsAWarning) {
  ToolOptions options;
  options.arguments = {"doctor",        "--json",  "--url",  sts.HttpsUrl(),
                       "--ca",          ca.Path(), "--user", "alice@EXAMPLE.COM",
                       "--password-fd", "5"};
  options.descriptors = {{5, "secret\n"}};
  const DoctorRun run(options);
  EXPECT_EQ(run.Status(), 0) << run.Text();
  ExpectWarning(run, "login", "signature-not-verified");
  EXPECT_THAT(run.Message("login"), HasSubstr("SHA-256"));
}

TEST_F(DoctorLoginTest, OtherFaultsAndTokensAreFound) {
  Misbehavior fault;
  fault.fault = DevSts::FaultAnswer{"http://docs.oasis-open.org/ws-sx/ws-trust/200512",
                                    "RequestFailed", "not today", false, 500};
  sts.SetMisbehavior(fault);
  ExpectFailure(RunAlice(), "login", "login-fault", 1, "token");

  sts.ClearMisbehavior();
  DevSts::AssertionOptions late;
  late.notBeforeOffset = std::chrono::seconds(-3600);
  sts.SetAssertionOptions(late);
  ExpectFailure(RunAlice(), "login", "token-rejected", 3, "token");

  DevSts::AssertionOptions weak;
  weak.signing.signature = DevSts::SignatureAlgorithm::RsaSha1;
  sts.SetAssertionOptions(weak);
  const DoctorRun run = RunAlice();
  ExpectFailure(run, "login", "token-rejected", 3, "token");
  EXPECT_THAT(run.Remedy("login"), HasSubstr("supported algorithm"));
}

TEST_F(DoctorLoginTest, ThePasswordIsNeverInAReport) {
  const std::string password = "s<cret & word";
  ToolOptions forPeople;
  forPeople.arguments = {"doctor",  "--url",  sts.HttpsUrl(),      "--ca",
                         ca.Path(), "--user", "alice@EXAMPLE.COM", "--password-fd",
                         "5"};
  forPeople.descriptors = {{5, password + "\n"}};
  for (const std::string text : {"no: s<cret & word", "no: s&amp;lt;cret &amp;amp; word"}) {
    Misbehavior fault;
    fault.fault = DevSts::FaultAnswer{"http://docs.oasis-open.org/ws-sx/ws-trust/200512",
                                      "FailedAuthentication", text, false, 500};
    sts.MisbehaveNext({});
    sts.MisbehaveNext(fault);
    const DoctorRun run = RunAlice(password);
    ExpectFailure(run, "login", "login-refused", 1, "token");
    EXPECT_THAT(run.Text(), Not(HasSubstr("cret")));
    EXPECT_THAT(run.Message("login"), HasSubstr("not shown"));

    sts.MisbehaveNext({});
    sts.MisbehaveNext(fault);
    const ToolResult result = RunTool(forPeople);
    EXPECT_EQ(result.status, 1) << result.out;
    EXPECT_THAT(result.out + result.err, Not(HasSubstr("cret")));
    EXPECT_THAT(result.out, HasSubstr("first cause: the service's text is not shown"));
  }
}

TEST_F(DoctorLoginTest, ATokenThatBeginsLaterIsAWarning) {
  DevSts::AssertionOptions late;
  late.notBeforeOffset = std::chrono::seconds(-200);
  sts.SetAssertionOptions(late);
  const DoctorRun run = RunAlice();
  EXPECT_EQ(run.Status(), 0) << run.Text();
  ExpectWarning(run, "token", "token-not-yet-valid");
}

TEST_F(DoctorLoginTest, ATokenThatHasExpiredIsAWarning) {
  DevSts::AssertionOptions early;
  early.notBeforeOffset = std::chrono::seconds(300);
  early.beforeSigning = [](std::string& assertion) { ReplaceEnds(assertion, -100); };
  sts.SetAssertionOptions(early);
  const DoctorRun run = RunAlice();
  EXPECT_EQ(run.Status(), 0) << run.Text();
  ExpectWarning(run, "token", "token-already-expired");
  EXPECT_EQ(run.FirstCause(), "token-already-expired");
}

TEST_F(DoctorLoginTest, AnAnswerThatEndsDuringTheLoginIsFound) {
  sts.MisbehaveNext({});
  Misbehavior cut;
  cut.cutOff = DevSts::CutOff{20, DevSts::CutStyle::Orderly};
  sts.MisbehaveNext(cut);
  ExpectFailure(RunAlice(), "login", "login-unanswered", 3, "token");
}

TEST_F(DoctorLoginTest, NoPasswordIsSentWhileTheClockIsFarOff) {
  Misbehavior misbehavior;
  misbehavior.extraHeaders = {{"Date", "Sun, 06 Nov 1994 08:49:37 GMT"}};
  sts.SetMisbehavior(misbehavior);
  ExpectFailure(RunAlice(), "clock", "clock-far-off", 4, "login");
  EXPECT_EQ(sts.Requests().size(), 1U);
}

TEST_F(DoctorLoginTest, NoPasswordIsSentOverHttpUnlessThatIsAllowed) {
  ToolOptions options;
  options.arguments = {"doctor",        "--json", "--url",
                       sts.HttpUrl(),   "--user", "alice@EXAMPLE.COM",
                       "--password-fd", "5"};
  options.descriptors = {{5, "secret\n"}};
  const DoctorRun run(options);
  ExpectFailure(run, "login", "plain-http", 2, "token");
  EXPECT_THAT(run.Remedy("login"), HasSubstr("--allow-http"));
  ASSERT_EQ(sts.Requests().size(), 1U);  // the harmless one
  EXPECT_THAT(sts.Requests()[0].body, Not(HasSubstr("secret")));

  options.arguments.push_back("--allow-http");
  const DoctorRun allowed(options);
  EXPECT_EQ(allowed.Status(), 0) << allowed.Text();
  ExpectWarning(allowed, "login", "signature-not-verified");
}

TEST_F(DoctorLoginTest, AMissingPasswordIsFound) {
  ExpectFailure(Run({"--user", "alice@EXAMPLE.COM"}), "login", "no-password", 2, "token");
}

TEST_F(DoctorLoginTest, ACertificateLogsIn) {
  const DevSts::Credential client = sts.MakeClientCredential("bob");
  sts.RegisterCertificate("bob@EXAMPLE.COM", client.certificatePem);
  const TemporaryFile certificate(client.certificatePem);
  const TemporaryFile key(client.privateKeyPem);
  chmod(key.Path().c_str(), 0600);
  const DoctorRun run = Run({"--certificate", certificate.Path(), "--key", key.Path()});
  EXPECT_EQ(run.Status(), 0) << run.Text();
  EXPECT_EQ(run.Finding("credentials"), "ok");
  EXPECT_EQ(run.Detail("token", "/subject"), "\"bob@EXAMPLE.COM\"");
}

TEST_F(DoctorLoginTest, KerberosLogsInWithTicketsOrAKeytab) {
  const Kerberos& kerberos = TheKerberos();
  const TemporaryFile ofRealm(kerberos.sts->CaCertificatePem());
  const TemporaryFile signerOfRealm(kerberos.sts->SigningCertificatePem());
  ToolOptions options;
  options.environment = {{"KRB5_CONFIG", kerberos.realm.ConfigPath()},
                         {"KRB5CCNAME", "FILE:/nonexistent/cache"}};
  const auto run = [&](const std::string& option, const std::string& value) {
    options.arguments = {"doctor",
                         "--json",
                         "--url",
                         kerberos.sts->HttpsUrl(),
                         "--ca",
                         ofRealm.Path(),
                         "--sts-certificate",
                         signerOfRealm.Path(),
                         "--kerberos",
                         "--service",
                         "HTTP@sts.example",
                         option,
                         value};
    return DoctorRun(options);
  };
  const DoctorRun byTickets = run("--ccache", kerberos.aliceCache);
  EXPECT_EQ(byTickets.Status(), 0) << byTickets.Text();
  EXPECT_EQ(byTickets.Finding("login"), "ok");
  EXPECT_EQ(byTickets.Detail("token", "/subject"), "\"alice@EXAMPLE.COM\"");
  const DoctorRun byKeytab = run("--keytab", kerberos.machineKeytab);
  EXPECT_EQ(byKeytab.Status(), 0) << byKeytab.Text();
  EXPECT_EQ(byKeytab.Finding("credentials"), "ok");
  EXPECT_EQ(byKeytab.Detail("token", "/subject"), "\"machine@EXAMPLE.COM\"");
}

TEST_F(DoctorLoginTest, KerberosWithoutTicketsIsFound) {
  environment = {{"KRB5CCNAME", "FILE:/nonexistent/cache"}, {"KRB5_CONFIG", "/dev/null"}};
  const DoctorRun run = Run({"--kerberos"});
  ExpectFailure(run, "login", "kerberos-failed", 4, "token");
  EXPECT_THAT(run.Remedy("login"), HasSubstr("kinit"));
}

TEST_F(DoctorLoginTest, TheProgressIsRemovedBeforeThePasswordIsAskedFor) {
  ToolOptions options;
  options.arguments = {"doctor",  "--url",  sts.HttpsUrl(),     "--ca",
                       ca.Path(), "--user", "alice@EXAMPLE.COM"};
  options.environment = {{"TERM", "dumb"}};
  options.hasTerminal = true;
  options.err = Stream::kTerminal;
  ToolProcess tool(options);
  ASSERT_TRUE(tool.WaitFor("alice@EXAMPLE.COM: "));
  tool.Type("secret\n");
  const ToolResult result = tool.Finish();
  EXPECT_EQ(result.status, 0) << result.out;
  const std::string before = result.terminal.substr(0, result.terminal.find("Password"));
  EXPECT_THAT(before, HasSubstr("examining: sts"));
  EXPECT_THAT(before, EndsWith(" \r"));
  EXPECT_THAT(result.terminal, Not(HasSubstr("\x1b")));
}

TEST_F(DoctorLoginTest, KerberosThatIsNotAnsweredEndsInTime) {
  DevSts::KerberosRealm realm;
  const std::string keytab = realm.AddKeytab("machine");
  const Peer silent(Silent());
  const std::string authority = silent.Url().substr(8, silent.Url().rfind('/') - 8);
  const TemporaryFile config(
      "[libdefaults]\ndefault_realm = EXAMPLE.COM\ndns_lookup_kdc = false\n"
      "udp_preference_limit = 1\n[realms]\nEXAMPLE.COM = {\nkdc = " +
      authority + "\n}\n");
  environment = {{"KRB5_CONFIG", config.Path()}};
  const DoctorRun run = Run({"--kerberos", "--service", "HTTP@sts.example", "--principal",
                             "machine", "--keytab", keytab, "--timeout", "3"});
  ExpectFailure(run, "login", "kerberos-failed", 4, "token");
  EXPECT_THAT(run.Message("login"), HasSubstr("The time is over"));
  EXPECT_LT(run.DurationMs("login"), 5000);
}

}  // namespace
}  // namespace SsoClient::Tool::Testing
