// The examples of token sources.
#include <cstddef>
#include <ctime>
#include <fstream>
#include <string>
#include <thread>

#include <gmock/gmock.h>

#include <devsts/server.h>
#include <tarnik/http/connection_specs.h>
#include <tarnik/http/http_request.h>
#include <tarnik/http/http_response.h>
#include <tarnik/http/http_url.h>
#include <tarnik/http/http_user_agent.h>

#include "integration/holder_of_key_fixture.h"
#include "support/child_process.h"
#include "support/temporary_file.h"

namespace SsoClient::Access {
namespace {

using SsoClient::Testing::Holder;
using SsoClient::Testing::kPassword;
using SsoClient::Testing::kUser;
using SsoClient::Testing::Stranger;
using Tarnik::Testing::CommandResult;
using testing::HasSubstr;
using testing::MatchesRegex;
using testing::StartsWith;

constexpr char kEnd[] = "[0-9]{4}-[0-9T:.-]+Z";

/// The output is that of both streams.
CommandResult RunExample(const std::string& command) {
  return Tarnik::Testing::RunInShell(EXAMPLES_FOLDER "/" + command + " 2>&1");
}

class AccessExamplesTest : public SsoClient::Testing::HolderOfKeyTest {
 protected:
  std::string WritePassword(const std::string& password) const {
    return folder_.Write("password", password + "\n");
  }
  /// The arguments of most examples.
  std::string Service() const { return Sts().HttpsUrl() + " " + trust_ + " " + kUser + " "; }

  const Tarnik::Testing::TemporaryFolder folder_;
  const std::string trust_ = folder_.Write("ca.pem", Sts().CaCertificatePem()) + " " +
                             folder_.Write("signing.pem", Sts().SigningCertificatePem());
  const std::string lines_ = folder_.Write("lines", "one\ntwo\nthree\n");
};

TEST_F(AccessExamplesTest, KeepFreshUsesOneTokenForAllLines) {
  const CommandResult run =
      RunExample("keep_fresh " + Service() + WritePassword(kPassword) + " <" + lines_);
  EXPECT_EQ(run.status, 0);
  const std::string line = "a token valid until " + std::string(kEnd) + "\n";
  EXPECT_THAT(run.output, MatchesRegex(line + line + line));
  EXPECT_EQ(Sts().Requests().size(), 1U);
}

TEST_F(AccessExamplesTest, KeepFreshSendsAWrongPasswordOnce) {
  const CommandResult run =
      RunExample("keep_fresh " + Service() + WritePassword("wrong") + " <" + lines_);
  EXPECT_EQ(run.status, 0);
  std::size_t count = 0;
  for (std::size_t at = run.output.find("no token now: "); at != std::string::npos;
       at = run.output.find("no token now: ", at + 1)) {
    ++count;
  }
  EXPECT_EQ(count, 3U) << run.output;
  EXPECT_THAT(run.output, HasSubstr("refused-login"));
  EXPECT_EQ(Sts().Requests().size(), 1U);
}

TEST_F(AccessExamplesTest, KeepFreshNamesAPasswordFileThatIsMissing) {
  const CommandResult run =
      RunExample("keep_fresh " + Service() + folder_.Path() + "/none <" + lines_);
  EXPECT_EQ(run.status, 0);
  EXPECT_THAT(run.output, HasSubstr("no token now: cannot read " + folder_.Path() + "/none\n"));
  EXPECT_TRUE(Sts().Requests().empty());
}

TEST_F(AccessExamplesTest, FailoverAsksTheNextServiceUntilOneDecides) {
  DevSts::Server broken;
  DevSts::Misbehavior unavailable;
  unavailable.httpAnswer = DevSts::HttpAnswer{503, "Service Unavailable", {}, ""};
  broken.SetMisbehavior(unavailable);
  const std::string nobody = "http://127.0.0.1:1/sts";
  const std::string password = " <" + WritePassword(kPassword);

  const CommandResult run = RunExample("failover " + trust_ + " " + kUser + " " + nobody + " " +
                                       broken.HttpUrl() + " " + Sts().HttpUrl() + password);
  EXPECT_EQ(run.status, 0);
  EXPECT_THAT(run.output,
              MatchesRegex("attempt 1 at " + nobody + "\nunreachable: [^\n]+\nattempt 2 at " +
                           broken.HttpUrl() + "\nhttp-status: [^\n]+\nattempt 3 at " +
                           Sts().HttpUrl() + "\na token valid until " + kEnd + "\n"));

  const std::string wrong = " <" + WritePassword("wrong");
  const CommandResult refused = RunExample("failover " + trust_ + " " + kUser + " " + nobody + " " +
                                           Sts().HttpUrl() + " " + broken.HttpUrl() + wrong);
  EXPECT_EQ(refused.status, 1);
  EXPECT_THAT(refused.output, HasSubstr("\nNo token: "));
  EXPECT_EQ(broken.Requests().size(), 1U);
}

TEST_F(AccessExamplesTest, AwaitTokenRequestsBothTokens) {
  const std::string command = "await_token " + Service() + " <";
  const CommandResult run = RunExample(command + WritePassword(kPassword));
  EXPECT_EQ(run.status, 0);
  EXPECT_THAT(run.output, MatchesRegex("https://orders.example.com: until " + std::string(kEnd) +
                                       "\nhttps://stock.example.com: until " + kEnd + "\n"));
  EXPECT_EQ(Sts().Requests().size(), 2U);

  const CommandResult refused = RunExample(command + WritePassword("wrong"));
  EXPECT_EQ(refused.status, 1);
  EXPECT_THAT(refused.output, StartsWith("No token: "));
  EXPECT_EQ(Sts().Requests().size(), 3U);
}

TEST_F(AccessExamplesTest, ActAsFreshExchangesOnceForAllLines) {
  const auto user = AcquireBound();
  Sts().ClearRequests();
  const std::string command = "act_as_fresh " + Sts().HttpsUrl() + " " + trust_ + " " +
                              folder_.Write("client.pem", Holder().certificatePem) + " " +
                              folder_.Write("key.pem", Holder().privateKeyPem) + " ";
  const CommandResult run =
      RunExample(command + folder_.Write("users.xml", user->Xml()) + " <" + lines_);
  EXPECT_EQ(run.status, 0);
  const std::string line = "a token for alice valid until " + std::string(kEnd) + "\n";
  EXPECT_THAT(run.output, MatchesRegex(line + line + line));
  // The server's own token, and the exchange.
  EXPECT_EQ(Sts().Requests().size(), 2U);

  const CommandResult missing = RunExample(command + "/nonexistent/token.xml <" + lines_);
  EXPECT_EQ(missing.status, 1);
  EXPECT_THAT(missing.output, StartsWith("No token: "));
}

TEST_F(AccessExamplesTest, CheckCallerPrintsEachCheck) {
  TokenSpec spec = SsoClient::Testing::TenMinutes();
  spec.audienceRestriction = {"https://orders.example.com"};
  const auto token = AcquireBound(spec);
  const std::string command = "check_caller " + token->Issuer() + " " + folder_.Path() +
                              "/signing.pem https://orders.example.com ";
  const std::string file = folder_.Write("token.xml", token->Xml()) + " ";
  const std::string peer = folder_.Write("client.pem", Holder().certificatePem);

  const CommandResult run = RunExample(command + file + peer);
  EXPECT_EQ(run.status, 0);
  EXPECT_THAT(run.output, StartsWith("accepted\n  size: passed"));
  EXPECT_THAT(run.output, HasSubstr("\n  possession: passed"));

  const CommandResult thief = RunExample(command + file);
  EXPECT_EQ(thief.status, 1);
  EXPECT_THAT(thief.output, StartsWith("refused (no-proof): "));
  EXPECT_THAT(thief.output, HasSubstr("\n  possession: failed"));

  const CommandResult missing = RunExample(command + "/nonexistent/token.xml " + peer);
  EXPECT_EQ(missing.status, 2);
  EXPECT_EQ(missing.output, "check_caller: cannot read /nonexistent/token.xml\n");
}

TEST_F(AccessExamplesTest, ProvePossessionSignsAChallenge) {
  TokenSpec spec = SsoClient::Testing::TenMinutes();
  spec.audienceRestriction = {"https://orders.example.com"};
  const auto token = AcquireBound(spec);
  const std::string command = "prove_possession " + token->Issuer() + " " + folder_.Path() +
                              "/signing.pem https://orders.example.com " +
                              folder_.Write("token.xml", token->Xml()) + " ";
  const CommandResult run = RunExample(command + folder_.Write("key.pem", Holder().privateKeyPem));
  EXPECT_EQ(run.status, 0);
  EXPECT_THAT(run.output, StartsWith("orders: accepted\n"));
  const CommandResult thief =
      RunExample(command + folder_.Write("other.pem", Stranger().privateKeyPem));
  EXPECT_EQ(thief.status, 1);
  EXPECT_THAT(thief.output, StartsWith("orders: refused (wrong-proof): "));
}

TEST_F(AccessExamplesTest, FakeTokenSourceNeedsNoService) {
  const auto token = Acquire();
  const CommandResult run = RunExample("fake_token_source " + folder_.Write("t.xml", token->Xml()));
  EXPECT_EQ(run.status, 0);
  EXPECT_EQ(run.output, "please try again later\nuser alice\n");
  EXPECT_EQ(RunExample("fake_token_source /nonexistent/token.xml").status, 1);
}

#if EXAMPLES_EXPORT_METRICS

std::string Get(const std::string& url) {
  bool isHttps = true;
  std::string host;
  int port = 0;
  std::string path;
  Tarnik::Http::ParseHttpURL(url, isHttps, host, port, path);
  const auto spec = Tarnik::Http::CreateTCPConnectionSpec(host, port);
  const auto agent = Tarnik::Http::CreateHttpUserAgent(spec.get(), nullptr, nullptr);
  Tarnik::Ref<Tarnik::Http::ClientRequest> request;
  Tarnik::Http::CreateHttpRequest(Tarnik::Http::Method::GET, path, request);
  const auto pending = agent->SendAsync(
      request.get(), [](auto&&...) {}, 0);
  const auto body = agent->Wait(pending.get(), 0)->Body();
  std::string text;
  char buffer[4096];
  while (const std::size_t count = body->Read(buffer, sizeof buffer)) {
    text.append(buffer, count);
  }
  return text;
}

TEST_F(AccessExamplesTest, ExportMetricsOffersCountersAndDurations) {
  const std::string input = folder_.Path() + "/input";
  const std::string output = folder_.Path() + "/output";
  ASSERT_EQ(Tarnik::Testing::RunInShell("mkfifo " + input + " " + output).status, 0);
  const std::string command = "export_metrics " + Service() + WritePassword(kPassword);
  CommandResult run;
  std::thread program([&] {
    run = Tarnik::Testing::RunInShell(EXAMPLES_FOLDER "/" + command + " <" + input + " >" + output);
  });
  std::ofstream lines(input);
  std::ifstream answers(output);
  std::string url;
  std::getline(answers, url);
  EXPECT_THAT(url, MatchesRegex("http://127.0.0.1:[0-9]+/metrics"));
  for (int i = 0; i < 2; ++i) {
    std::string end;
    lines << "a line" << std::endl;
    std::getline(answers, end);
    EXPECT_THAT(end, MatchesRegex(kEnd));
  }

  // The record of an attempt follows its answer.
  const std::string attempts =
      "token_attempt_seconds_count{endpoint=\"" + Sts().HttpsUrl() + "\",failure=\"none\"} 1\n";
  std::string text;
  for (int i = 0; i < 1000 && text.find(attempts) == std::string::npos; ++i) {
    text = Get(url);
  }
  EXPECT_THAT(text, HasSubstr(attempts));
  for (const char* counter : {"hits", "misses", "logins"}) {
    EXPECT_THAT(text, HasSubstr("\ntoken_" + std::string(counter) + "_total 1\n"));
  }
  for (const char* counter : {"shared", "refused_from_memory", "evictions", "renewals", "exchanges",
                              "refresh_failures", "deviations"}) {
    EXPECT_THAT(text, HasSubstr("\ntoken_" + std::string(counter) + "_total 0\n"));
  }
  // The end of the token, which was requested for an hour, in seconds since 1970.
  const std::string gauge = "\ntoken_earliest_expiration_seconds ";
  const std::size_t at = text.find(gauge);
  const double end = at == std::string::npos ? 0 : std::stod(text.substr(at + gauge.size()));
  EXPECT_NEAR(end - static_cast<double>(std::time(nullptr)), 3600, 300);

  lines.close();
  program.join();
  EXPECT_EQ(run.status, 0);
}

#endif

}  // namespace
}  // namespace SsoClient::Access
