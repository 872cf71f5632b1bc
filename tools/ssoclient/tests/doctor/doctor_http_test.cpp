// Findings about HTTP, the clocks and the service, each produced for real.
#include <array>
#include <ctime>
#include <string>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "devsts/server.h"
#include "support/doctor_run.h"
#include "support/temporary_file.h"
#include "support/token_files.h"

namespace SsoClient::Tool::Testing {
namespace {

using DevSts::HttpAnswer;
using DevSts::Misbehavior;
using Tarnik::Testing::TemporaryFile;
using testing::HasSubstr;
using testing::Not;

class DoctorHttpTest : public testing::Test {
 protected:
  DoctorRun Run(const std::string& path = "/sts") const {
    return RunDoctor(sts.HttpsUrl(path), {"--ca", ca.Path(), "--timeout", "20"});
  }

  DoctorRun RunWith(const Misbehavior& misbehavior) {
    sts.SetMisbehavior(misbehavior);
    return Run();
  }

  DoctorRun RunWith(int status, const std::string& body, const std::string& type = "text/html") {
    Misbehavior misbehavior;
    misbehavior.httpAnswer = HttpAnswer{status, "Reason", {{"Content-Type", type}}, body};
    return RunWith(misbehavior);
  }

  DoctorRun RunWithClock(long offset) {
    const std::time_t time = std::time(nullptr) + offset;
    std::tm fields{};
    gmtime_r(&time, &fields);
    std::array<char, 40> date{};
    std::strftime(date.data(), date.size(), "%a, %d %b %Y %H:%M:%S GMT", &fields);
    Misbehavior misbehavior;
    misbehavior.extraHeaders = {{"Date", date.data()}};
    return RunWith(misbehavior);
  }

  DevSts::Server sts;
  TemporaryFile ca{sts.CaCertificatePem()};
};

TEST_F(DoctorHttpTest, AllIsWellWithAnStsThatWorks) {
  const DoctorRun run = RunWithClock(0);
  EXPECT_EQ(run.Status(), 0) << run.Text();
  for (const std::string step :
       {"options", "trust", "dns", "tcp", "tls", "certificate", "http", "clock", "sts"}) {
    EXPECT_EQ(run.Finding(step), "ok") << step;
  }
  EXPECT_EQ(run.Finding("login"), "not-needed");
  EXPECT_EQ(run.FirstCause(), "");
}

TEST_F(DoctorHttpTest, ClocksAreNotComparedWithoutADate) {
  Misbehavior misbehavior;
  misbehavior.omitDate = true;
  const DoctorRun run = RunWith(misbehavior);
  EXPECT_EQ(run.Status(), 0) << run.Text();
  EXPECT_EQ(run.Finding("clock"), "not-needed");
  EXPECT_THAT(run.Message("clock"), HasSubstr("no Date"));
}

TEST_F(DoctorHttpTest, TheRequestHasNoCredentialsAndNoAccount) {
  Run();
  ASSERT_EQ(sts.Requests().size(), 1U);
  const DevSts::ReceivedRequest request = sts.LastRequest();
  EXPECT_THAT(request.body, Not(HasSubstr("UsernameToken")));
  EXPECT_THAT(request.body, Not(HasSubstr("Assertion")));
  EXPECT_THAT(request.body, HasSubstr("/Validate<"));
  // The service misses the token, and nothing else.
  EXPECT_THAT(request.answeredFault, HasSubstr("ValidateTarget"));
  EXPECT_EQ(sts.GetCounters().tokensIssued, 0U);
}

TEST_F(DoctorHttpTest, PagesForPeopleAreFound) {
  const DoctorRun run = RunWith(200, "<!DOCTYPE html><html><title>Guest Wi-Fi</title></html>");
  ExpectFailure(run, "http", "html-page", 3, "sts");
  EXPECT_THAT(run.Message("http"), HasSubstr("Guest Wi-Fi"));
  ExpectFailure(RunWith(511, "<html></html>"), "http", "html-page", 3, "sts");
}

TEST_F(DoctorHttpTest, EachStatusHasItsFinding) {
  const std::pair<int, const char*> cases[] = {
      {401, "http-unauthorized"}, {403, "http-forbidden"},       {404, "wrong-path"},
      {405, "wrong-path"},        {407, "proxy-authentication"}, {500, "http-server-error"},
      {502, "http-server-error"}, {418, "http-status"},
  };
  for (const auto& [status, finding] : cases) {
    const DoctorRun run = RunWith(status, "<html></html>");
    ExpectFailure(run, "http", finding, 3, "sts");
    EXPECT_EQ(run.Detail("http", "/httpStatus"), std::to_string(status));
  }
}

TEST_F(DoctorHttpTest, ARedirectShowsItsTarget) {
  Misbehavior misbehavior;
  misbehavior.httpAnswer = HttpAnswer{302, "Found", {{"Location", "https://login.example/"}}, ""};
  const DoctorRun run = RunWith(misbehavior);
  ExpectFailure(run, "http", "redirect", 3, "sts");
  EXPECT_THAT(run.Message("http"), HasSubstr("https://login.example/"));
}

TEST_F(DoctorHttpTest, AnswersThatAreNotHttpAreFound) {
  Misbehavior misbehavior;
  misbehavior.rawAnswer = "hello, world\r\n\r\n";
  misbehavior.closeConnection = true;
  ExpectFailure(RunWith(misbehavior), "http", "not-http", 3, "sts");
}

TEST_F(DoctorHttpTest, AnAnswerThatIsCutOffIsFound) {
  Misbehavior misbehavior;
  misbehavior.cutOff = DevSts::CutOff{20, DevSts::CutStyle::Orderly};
  ExpectFailure(RunWith(misbehavior), "http", "http-cut-off", 3, "sts");
}

TEST_F(DoctorHttpTest, AServiceThatDoesNotAnswerIsFound) {
  Misbehavior misbehavior;
  misbehavior.stall = DevSts::Stall::BeforeAnswer;
  sts.SetMisbehavior(misbehavior);
  ExpectFailure(RunDoctor(sts.HttpsUrl(), {"--ca", ca.Path(), "--timeout", "1.5"}), "http",
                "http-timed-out", 3, "sts");
}

TEST_F(DoctorHttpTest, AnswersOfOtherServicesAreNotOfAnSts) {
  const std::string soap12 =
      "<e:Envelope xmlns:e='http://www.w3.org/2003/05/soap-envelope'><e:Body/></e:Envelope>";
  const std::string empty =
      "<e:Envelope xmlns:e='http://schemas.xmlsoap.org/soap/envelope/'><e:Body/></e:Envelope>";
  for (const std::string& body :
       {std::string("{\"ok\": true}"), std::string("<feed/>"), soap12, empty, std::string()}) {
    ExpectFailure(RunWith(200, body, "text/plain"), "sts", "not-an-sts", 3, "login");
  }
}

TEST_F(DoctorHttpTest, AFaultThatAnySoapServiceCouldSendIsAWarning) {
  Misbehavior misbehavior;
  misbehavior.fault = DevSts::FaultAnswer{"http://schemas.xmlsoap.org/soap/envelope/", "Client",
                                          "no such operation", false, 500};
  const DoctorRun run = RunWith(misbehavior);
  EXPECT_EQ(run.Status(), 0);
  ExpectWarning(run, "sts", "sts-uncertain");
  EXPECT_THAT(run.Message("sts"), HasSubstr("no such operation"));
}

TEST_F(DoctorHttpTest, AClockThatIsOffIsMeasured) {
  for (const long offset : {-45L, 45L, 300L}) {
    const DoctorRun run = RunWithClock(offset);
    EXPECT_EQ(run.Status(), 0);
    ExpectWarning(run, "clock", "clock-off");
    EXPECT_THAT(run.Message("clock"), HasSubstr(offset < 0 ? "earlier than" : "later than"));
    const double measured = std::stod(run.Detail("clock", "/offsetSeconds"));
    const double uncertainty = std::stod(run.Detail("clock", "/uncertaintySeconds"));
    EXPECT_NEAR(measured, static_cast<double>(offset), uncertainty + 1);
  }
}

TEST_F(DoctorHttpTest, AClockThatIsFarOffIsAFailure) {
  const DoctorRun run = RunWithClock(7200);
  ExpectFailure(run, "clock", "clock-far-off", 4, "");
  EXPECT_EQ(run.Finding("sts"), "ok");
}

TEST_F(DoctorHttpTest, TheTextEndsWithTheFirstCauseAndItsRemedy) {
  sts.SetMisbehavior({});
  const ToolResult well = RunTool({"doctor", "--url", sts.HttpsUrl(), "--ca", ca.Path()});
  EXPECT_THAT(well.out, testing::EndsWith("\nall is well\n"));
  const ToolResult ill = RunTool({"doctor", "--url", "https://[ff02::1]/sts"});
  EXPECT_EQ(ill.status, 3);
  EXPECT_THAT(ill.out, HasSubstr("failed  tcp"));
  EXPECT_THAT(ill.out, HasSubstr("skipped tls"));
  EXPECT_THAT(ill.out, HasSubstr("\nfirst cause: the host has only IPv6 addresses"));
  EXPECT_THAT(ill.out, testing::EndsWith("or the host an IPv4 address\n"));
  EXPECT_EQ(ill.err, "");
}

TEST_F(DoctorHttpTest, ColoursAreForTerminalsWithoutNoColor) {
  const std::vector<std::string> arguments{"doctor", "--url", sts.HttpsUrl(), "--ca", ca.Path()};
  EXPECT_THAT(RunTool(arguments).out, Not(HasSubstr("\x1b")));
  EXPECT_THAT(RunOnTerminal(arguments).terminal, HasSubstr("\x1b[32mok      \x1b[0mtls"));
  EXPECT_THAT(RunOnTerminal(arguments, {{"NO_COLOR", ""}}).terminal, HasSubstr("\x1b[32mok "));
  EXPECT_THAT(RunOnTerminal(arguments, {{"NO_COLOR", "1"}}).terminal, Not(HasSubstr("\x1b")));
}

}  // namespace
}  // namespace SsoClient::Tool::Testing
