// The names of what goes wrong in negotiated logins, by the commands that use them.
#include <stdexcept>
#include <string>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "commands.h"
#include "negotiation_fixture.h"
#include "request_text.h"

namespace DevSts::Testing {
namespace {

using testing::HasSubstr;
using testing::Not;

class NegotiationNamesTest : public NegotiationFixture {
 protected:
  // The answers to the legs of a login, one after another, until it ends or fails.
  std::string AnswersAfter(const std::string& command) {
    const std::string done = commands.Execute(command).line;
    EXPECT_THAT(done, testing::StartsWith("ok "));
    NegotiationClient client(server);
    GssClient gss(alice, kService);
    std::string answer = client.SendFirst(gss.Step());
    std::string answers = answer;
    try {
      for (int leg = 2; leg < 5 && AssertionIn(answer).empty() && !LegIn(answer).empty(); ++leg) {
        answer = client.SendNext(gss.IsDone() ? "more" : gss.Step(LegIn(answer)));
        answers += answer;
      }
    } catch (const std::runtime_error&) {
      // The client refuses what is not a leg.
    }
    commands.Execute("clear");
    commands.Execute("negotiation");
    return answers;
  }

  Server server{Options()};
  Program::Commands commands{server, DemoUsers(), AssertionOptions(), Program::Revocations({}, "")};
};

TEST_F(NegotiationNamesTest, LoginsTakeOneLegWithoutThem) {
  EXPECT_THAT(AnswersAfter("negotiation"), HasSubstr("Assertion"));
  EXPECT_EQ(server.GetCounters().negotiationLegs, 1U);
}

TEST_F(NegotiationNamesTest, ChangeTheNumberOfLegs) {
  EXPECT_THAT(AnswersAfter("negotiation request-mic"), HasSubstr("Assertion"));
  EXPECT_EQ(server.GetCounters().negotiationLegs, 2U);
  EXPECT_THAT(AnswersAfter("negotiation more-legs=2"), HasSubstr("Assertion"));
  EXPECT_EQ(server.GetCounters().negotiationLegs, 5U);
  EXPECT_THAT(AnswersAfter("negotiation fail-at-leg=1"),
              HasSubstr("The negotiation is configured to fail"));
}

TEST_F(NegotiationNamesTest, ChangeTheFaultOfALeg) {
  EXPECT_THAT(
      AnswersAfter("negotiation fail-at-leg=1 leg-fault=wsse:FailedAuthentication "
                   "\"leg-fault-text=come back\" leg-fault-status=503"),
      testing::AllOf(testing::StartsWith("HTTP/1.1 503 "), HasSubstr("wssecurity-secext-1.0.xsd"),
                     HasSubstr(":FailedAuthentication</faultcode>"),
                     HasSubstr("<faultstring>come back</faultstring>")));
  for (const std::string name : {"leg-fault=sing:Code", "leg-fault=", "leg-fault-status=99"}) {
    EXPECT_THAT(commands.Execute("negotiation " + name).line, testing::StartsWith("error leg-"));
  }
}

TEST_F(NegotiationNamesTest, ChangeTheAnswersToLegs) {
  commands.Execute("negotiation request-mic");
  const auto answers = [&](const std::string& name) {
    commands.Execute("misbehave next 1 " + name);
    return AnswersAfter("negotiation request-mic");
  };
  EXPECT_THAT(answers("leg-context=urn:another"), HasSubstr("Context=\"urn:another\""));
  EXPECT_THAT(answers("leg-without-context"),
              HasSubstr("<wst:RequestSecurityTokenResponse><wst:BinaryExchange"));
  EXPECT_THAT(answers("leg-octets=no\\x20leg"), HasSubstr(ToBase64("no leg")));
  EXPECT_THAT(answers("leg-without-octets"), Not(HasSubstr("BinaryExchange")));
  EXPECT_THAT(answers("leg-without-cookie"),
              HasSubstr("The request does not have the cookie of its negotiation"));
  EXPECT_THAT(answers("leg-forgotten"), HasSubstr("No negotiation is under way"));
}

}  // namespace
}  // namespace DevSts::Testing
