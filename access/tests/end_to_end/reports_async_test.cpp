// What listeners, metrics and messages say, and what they do not.
#include <chrono>
#include <ctime>
#include <memory>
#include <string>
#include <vector>

#include <gmock/gmock.h>

#include "end_to_end/end_to_end_fixture.h"
#include "integration/holder_of_key_fixture.h"

namespace SsoClient::Access::Testing {
namespace {

using namespace std::chrono_literals;
using testing::Each;
using testing::Ge;
using testing::HasSubstr;
using testing::MatchesRegex;
using testing::Not;

// As an HTTP-date (RFC 9110, section 5.6.7).
std::string HttpDate(std::chrono::seconds fromNow) {
  const std::time_t time =
      std::chrono::system_clock::to_time_t(std::chrono::system_clock::now() + fromNow);
  std::tm utc{};
  gmtime_r(&time, &utc);
  char text[40];
  std::strftime(text, sizeof text, "%a, %d %b %Y %H:%M:%S GMT", &utc);
  return text;
}

DevSts::Misbehavior Dated(std::chrono::seconds fromNow) {
  DevSts::Misbehavior misbehavior;
  misbehavior.extraHeaders = {{"Date", HttpDate(fromNow)}};
  return misbehavior;
}

DevSts::ServerOptions WithSkew(std::chrono::seconds skew) {
  DevSts::ServerOptions options;
  options.clockSkew = skew;
  return options;
}

class ReportsAsyncTest : public EndToEndTest {
 protected:
  DevSts::Server sts_;
  const TokenSpec spec_ = SpecFor("https://orders.example.com");
};

TEST_F(ReportsAsyncTest, AServiceWhoseClockIsWrongIsReportedOnce) {
  sts_.SetMisbehavior(Dated(90s));
  const auto source = Make(ConfigFor({&sts_}));
  ASSERT_NE(Get(*source, spec_).token, nullptr);
  ASSERT_NE(Get(*source, SpecFor(1)).token, nullptr);
  ASSERT_TRUE(listener_->Await([](const Records& seen) { return seen.ended.size() == 2; }));
  auto clocks = listener_->Seen().clocks;
  ASSERT_EQ(clocks.size(), 1U);
  EXPECT_EQ(clocks[0].endpoint, sts_.HttpsUrl());
  // The answer takes a while on a busy machine.
  EXPECT_GT(clocks[0].offset, 45s);
  EXPECT_LE(clocks[0].offset, 90s);
  sts_.SetMisbehavior(Dated(0s));
  ASSERT_NE(Get(*source, SpecFor(2)).token, nullptr);
  ASSERT_TRUE(listener_->Await([](const Records& seen) { return seen.clocks.size() == 2; }));
}

TEST_F(ReportsAsyncTest, ARefusedTimestampNamesBothClocks) {
  // A service that tolerates no difference, and whose clock is 90 seconds slow.
  DevSts::Server slow(WithSkew(-90s));
  slow.SetMisbehavior(Dated(-90s));
  const auto source = Make(ConfigFor({&slow, &sts_}));
  const Result result = Get(*source, spec_);
  EXPECT_TRUE(result.Is<SsoException>());
  const std::string time = "[0-9]+-[0-9]+-[0-9]+T[0-9]+:[0-9]+:[0-9.]+Z";
  EXPECT_THAT(result.message, MatchesRegex("Unexpected SOAP fault: .* The service's clock reads " +
                                           time + ", this system's " + time + "\\."));
  ASSERT_TRUE(listener_->Await([](const Records& seen) { return seen.clocks.size() == 1; }));
  EXPECT_LT(listener_->Seen().clocks[0].offset, -60s);
  EXPECT_TRUE(sts_.Requests().empty());
}

TEST_F(ReportsAsyncTest, ATokenForAnotherSubjectIsHandedOutAndReported) {
  DevSts::AssertionOptions options;
  options.beforeSigning = [](std::string& assertion) {
    for (auto at = assertion.find(">alice@"); at != std::string::npos;
         at = assertion.find(">alice@")) {
      assertion.replace(at, 7, ">mallory@");
    }
  };
  sts_.SetAssertionOptions(options);
  const auto source = Make(ConfigFor({&sts_}));
  const Result result = Get(*source, spec_);
  ASSERT_NE(result.token, nullptr) << result.message;
  EXPECT_EQ(result.token->Subject().name, "mallory");
  ASSERT_TRUE(listener_->Await([](const Records& seen) { return !seen.deviations.empty(); }));
  const DeviationRecord deviation = listener_->Seen().deviations[0];
  EXPECT_EQ(deviation.field, "subject");
  EXPECT_EQ(deviation.requested, "alice@EXAMPLE.COM");
  EXPECT_EQ(deviation.issued, "mallory@EXAMPLE.COM");
  EXPECT_EQ(deviation.endpoint, sts_.HttpsUrl());
  EXPECT_EQ(source->Metrics().deviations, 1U);
}

TEST_F(ReportsAsyncTest, ATokenForAnotherAudienceIsHandedOutAndReported) {
  DevSts::AssertionOptions options;
  options.beforeSigning = [](std::string& assertion) {
    const std::string asked = "https://orders.example.com";
    assertion.replace(assertion.find(asked), asked.size(), "https://stock.example.com");
  };
  sts_.SetAssertionOptions(options);
  const auto source = Make(ConfigFor({&sts_}));
  const Result result = Get(*source, spec_);
  ASSERT_NE(result.token, nullptr) << result.message;
  ASSERT_TRUE(listener_->Await([](const Records& seen) { return !seen.deviations.empty(); }));
  const DeviationRecord deviation = listener_->Seen().deviations[0];
  EXPECT_EQ(deviation.field, "audiences");
  EXPECT_EQ(deviation.requested, "https://orders.example.com");
  EXPECT_EQ(deviation.issued, "https://stock.example.com");
}

TEST_F(ReportsAsyncTest, ATokenWithAnotherLifetimeIsHandedOutAndReported) {
  DevSts::AssertionOptions options;
  options.maxLifetime = 300s;
  sts_.SetAssertionOptions(options);
  const auto source = Make(ConfigFor({&sts_}));
  ASSERT_NE(Get(*source, spec_).token, nullptr);
  ASSERT_TRUE(listener_->Await([](const Records& seen) { return !seen.deviations.empty(); }));
  EXPECT_EQ(listener_->Seen().deviations[0].field, "lifetime");
  EXPECT_EQ(source->Metrics().deviations, 1U);
}

TEST_F(ReportsAsyncTest, ATokenAsRequestedHasNoDeviation) {
  const auto source = Make(ConfigFor({&sts_}));
  ASSERT_NE(Get(*source, spec_).token, nullptr);
  ASSERT_TRUE(listener_->Await([](const Records& seen) { return seen.ended.size() == 1; }));
  EXPECT_TRUE(listener_->Seen().deviations.empty());
  EXPECT_EQ(source->Metrics().deviations, 0U);
}

/// All texts of the records.
std::vector<std::string> TextsOf(const Records& records) {
  std::vector<std::string> texts;
  for (const auto& attempts : {records.begun, records.ended}) {
    for (const AttemptRecord& attempt : attempts) {
      texts.insert(texts.end(), {attempt.source, attempt.endpoint, attempt.message});
    }
  }
  for (const RefreshFailureRecord& failure : records.refreshFailures) {
    texts.insert(texts.end(), {failure.source, failure.message});
  }
  for (const CircuitRecord& circuit : records.circuits) {
    texts.insert(texts.end(), {circuit.source, circuit.endpoint});
  }
  for (const ClockRecord& clock : records.clocks) {
    texts.insert(texts.end(), {clock.source, clock.endpoint});
  }
  for (const DeviationRecord& deviation : records.deviations) {
    texts.insert(texts.end(), {deviation.source, deviation.endpoint, deviation.field,
                               deviation.requested, deviation.issued});
  }
  return texts;
}

TEST_F(ReportsAsyncTest, NoRecordContainsThePassword) {
  const std::string password = "pass-word-of-alice";
  DevSts::Server busy;
  busy.SetMisbehavior(Answering(503));
  DevSts::FaultAnswer repeating;
  repeating.codeNamespace = SsoClient::Testing::kTrust;
  repeating.codeName = "FailedAuthentication";
  repeating.faultString = "The password " + password + " is wrong.";
  DevSts::Misbehavior refusal = Dated(90s);
  refusal.fault = repeating;
  sts_.SetMisbehavior(refusal);
  TokenSourceConfig config = ConfigFor({&busy, &sts_});
  config.login = PasswordLogin{kUser, [password] { return password; }};
  config.keepFresh = {spec_};
  const auto source = Make(config);
  EXPECT_TRUE(Get(*source, SpecFor(1)).Is<InvalidCredentialsException>());
  AwaitEnded(2);
  ASSERT_TRUE(listener_->Await([](const Records& seen) {
    return seen.clocks.size() == 1 && !seen.refreshFailures.empty();
  }));
  const std::vector<std::string> texts = TextsOf(listener_->Seen());
  EXPECT_GE(texts.size(), 12U);
  EXPECT_THAT(texts, Each(Not(HasSubstr(password))));
  // Of the attempt, and of the refresh.
  EXPECT_THAT(texts, testing::Contains(HasSubstr("The password *** is wrong.")).Times(Ge(2)));
}

}  // namespace
}  // namespace SsoClient::Access::Testing
