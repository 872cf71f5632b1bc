#include <gtest/gtest.h>

#include <ssoclient/exceptions.h>

#include "support/source_fixture.h"

namespace SsoClient::Access::Testing {

namespace {

class ServiceClockTest : public SourceFixture {
 protected:
  ServiceClockTest() {
    config.endpoints.resize(1);
    config.retry.attempts = 1;
  }

  // The endpoint answers once with this, and then issues tokens of an hour without a `Date`.
  void AnswerOnce(AttemptOutcome outcome, milliseconds offset) {
    outcome.clockOffset = offset;
    scripts[0]->Set([this, outcome](const AttemptRequest&, Tarnik::Http::CallLimit&) {
      scripts[0]->Set(Issues(hours(1)));
      return outcome;
    });
  }

  // The offset that counts shortens the life of the next token, which has an hour by this clock.
  milliseconds OffsetThatCounts() {
    const TokenSpec asked = SpecFor("next");
    Get(asked);
    CallContext context;
    milliseconds offset(0);
    for (const milliseconds candidate : {minutes(9), minutes(0)}) {
      context.minimumLife = std::chrono::duration_cast<seconds>(hours(1) - candidate);
      if (Get(asked, context).token != nullptr) {
        offset = candidate;
      }
    }
    return offset;
  }
};

TEST_F(ServiceClockTest, AnswersOfTheServiceSetTheOffset) {
  config.login =
      PasswordLogin{"alice", [this] { return password + std::to_string(++passwordCalls); }};
  for (const AttemptOutcome& outcome :
       {Issued(NewToken(hours(1))), Fault(), Refused(), Expired()}) {
    Make();
    AnswerOnce(outcome, minutes(9));
    Get(spec);
    EXPECT_EQ(OffsetThatCounts(), minutes(9)) << NameOf(outcome.kind);
  }
  EXPECT_EQ(listener->Clocks().size(), 4U);
}

TEST_F(ServiceClockTest, AnswersOfAProxyDoNot) {
  AttemptOutcome login = Failed<CommunicationException>(FailureKind::kRefusedLogin, "Status 401.");
  login.httpStatus = 401;
  config.login =
      PasswordLogin{"alice", [this] { return password + std::to_string(++passwordCalls); }};
  for (const AttemptOutcome& outcome :
       {Unavailable(milliseconds(0)), login,
        Failed<SsoException>(FailureKind::kBadAnswer, "Not a SOAP envelope.")}) {
    Make();
    AnswerOnce(outcome, minutes(9));
    Get(spec);
    EXPECT_EQ(OffsetThatCounts(), minutes(0)) << NameOf(outcome.kind);
  }
  EXPECT_TRUE(listener->Clocks().empty());
}

}  // namespace

}  // namespace SsoClient::Access::Testing
