// Services whose clock differs from this system's.
#include <chrono>
#include <cstdio>
#include <string>

#include <gmock/gmock.h>

#include "attempts/endpoint_fixture.h"

namespace SsoClient::Access {
namespace {

using namespace std::chrono_literals;
using testing::MatchesRegex;

// As an HTTP-date (RFC 9110, section 5.6.7); the day of the week does not count.
std::string HttpDate(std::chrono::system_clock::time_point time) {
  constexpr const char* kMonths[] = {"Jan", "Feb", "Mar", "Apr", "May", "Jun",
                                     "Jul", "Aug", "Sep", "Oct", "Nov", "Dec"};
  const auto day = std::chrono::floor<std::chrono::days>(time);
  const std::chrono::year_month_day date(day);
  const std::chrono::hh_mm_ss clock(std::chrono::floor<std::chrono::seconds>(time - day));
  char text[40];
  std::snprintf(text, sizeof text, "Sun, %02u %s %04d %02d:%02d:%02d GMT",
                static_cast<unsigned>(date.day()), kMonths[static_cast<unsigned>(date.month()) - 1],
                static_cast<int>(date.year()), static_cast<int>(clock.hours().count()),
                static_cast<int>(clock.minutes().count()),
                static_cast<int>(clock.seconds().count()));
  return text;
}

/// A service whose clock is wrong by `offset`, and whose answers say so.
class ServiceClockTest : public EndpointTest {
 protected:
  static void SayClockIsOff(DevSts::Server& server, std::chrono::seconds offset) {
    DevSts::Misbehavior clock;
    clock.extraHeaders = {{"Date", HttpDate(std::chrono::system_clock::now() + offset)}};
    server.SetMisbehavior(clock);
  }
  static std::chrono::milliseconds OffsetOf(const AttemptOutcome& outcome) {
    return outcome.clockOffset.value_or(std::chrono::milliseconds::max());
  }
};

TEST_F(ServiceClockTest, TheOffsetComesFromTheDateOfTheAnswer) {
  SayClockIsOff(Sts(), 0s);
  EXPECT_EQ(OffsetOf(AttemptHere()), 0s);
  SayClockIsOff(Sts(), 90s);
  const AttemptOutcome ahead = AttemptHere();
  EXPECT_NE(ahead.token, nullptr);
  EXPECT_GT(OffsetOf(ahead), 60s);
  EXPECT_LE(OffsetOf(ahead), 90s);
  SayClockIsOff(Sts(), -90s);
  const AttemptOutcome behind = AttemptHere();
  EXPECT_LT(OffsetOf(behind), -60s);
}

TEST_F(ServiceClockTest, ARefusedTimestampNamesBothClocks) {
  // A service that tolerates no difference, and whose clock is 90 seconds slow.
  DevSts::ServerOptions options;
  options.clockSkew = -90s;
  DevSts::Server slow(options);
  SayClockIsOff(slow, -90s);
  const AttemptOutcome outcome = AttemptAt(ConfigFor(slow), slow.HttpsUrl());
  const std::string time = "[0-9]+-[0-9]+-[0-9]+T[0-9]+:[0-9]+:[0-9.]+Z";
  EXPECT_THAT(ExpectFailure<SsoException>(outcome, FailureKind::kFault),
              MatchesRegex("Unexpected SOAP fault: [a-z]+:InvalidSecurity; request failed\\. The "
                           "service's clock reads " +
                           time + ", this system's " + time + "\\."));
  EXPECT_LT(OffsetOf(outcome), -60s);
}

// The client does not read the answers of these statuses.
TEST_F(ServiceClockTest, ARefusedTimestampNamesBothClocksWithAnyHttpStatus) {
  for (const int status : {400, 403, 503}) {
    for (const char* code : {"InvalidSecurity", "MessageExpired"}) {
      DevSts::Misbehavior refusal;
      refusal.fault = DevSts::FaultAnswer{SsoClient::Testing::kSecext, code, "why", false, status};
      refusal.extraHeaders = {{"Date", HttpDate(std::chrono::system_clock::now() - 90s)}};
      Sts().SetMisbehavior(refusal);
      EXPECT_THAT(ExpectFailure<CommunicationException>(AttemptHere(), FailureKind::kFault),
                  MatchesRegex(".*" + std::to_string(status) +
                               ".* The service's clock reads [-0-9T:.]+Z, "
                               "this system's [-0-9T:.]+Z\\."));
    }
  }
}

TEST_F(ServiceClockTest, WithoutADateARefusedTimestampIsReportedAsItIs) {
  DevSts::ServerOptions options;
  options.clockSkew = -90s;
  DevSts::Server slow(options);
  DevSts::Misbehavior dateless;
  dateless.omitDate = true;
  slow.SetMisbehavior(dateless);
  EXPECT_THAT(
      ExpectFailure<SsoException>(AttemptAt(ConfigFor(slow), slow.HttpsUrl()), FailureKind::kFault),
      MatchesRegex("Unexpected SOAP fault: [a-z]+:InvalidSecurity; request failed\\."));
}

TEST_F(ServiceClockTest, OtherFaultsDoNotNameTheClocks) {
  DevSts::Misbehavior fault;
  fault.fault = DevSts::FaultAnswer{SsoClient::Testing::kTrust, "RequestFailed", "why", false, 500};
  fault.extraHeaders = {{"Date", HttpDate(std::chrono::system_clock::now() + 90s)}};
  Sts().SetMisbehavior(fault);
  EXPECT_THAT(ExpectFailure<SsoException>(AttemptHere(), FailureKind::kFault),
              testing::EndsWith("RequestFailed; request failed."));
}

}  // namespace
}  // namespace SsoClient::Access
