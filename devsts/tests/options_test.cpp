#include "options.h"

#include <optional>
#include <string>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "negotiation_fixture.h"
#include "program_process.h"
#include "raw_client.h"
#include "request_text.h"

namespace DevSts::Testing {
namespace {

using testing::HasSubstr;
using testing::Not;

Program::Options Parse(std::vector<std::string> arguments) {
  arguments.insert(arguments.begin(), "ssoclient-devsts");
  std::vector<char*> pointers;
  for (std::string& each : arguments) {
    pointers.push_back(each.data());
  }
  return Program::ParseOptions(static_cast<int>(pointers.size()), pointers.data()).value();
}

// The answer of the program to this envelope.
std::string AnswerOf(const ProgramProcess& program, const std::string& envelope) {
  RawClient client(PortIn(program.Value("http_url")));
  client.Send(PostOf(envelope, kIssueAction));
  return client.ReadAnswer();
}

TEST(OptionsTest, EachPortHasAnOption) {
  const Program::Options none = Parse({});
  EXPECT_EQ(none.server.httpPort, 0);
  EXPECT_EQ(none.server.httpsPort, 0);
  const Program::Options options = Parse({"--http-port", "8080", "--https-port", "8443"});
  EXPECT_EQ(options.server.httpPort, 8080);
  EXPECT_EQ(options.server.httpsPort, 8443);
}

TEST(OptionsTest, TheHostsInNamesOfAttributesCanBeChosen) {
  const std::string groups = "\"http://vendor.test/schemas/attr-names/2009/01/GroupIdentity\"";
  const std::string solution = "\"http://solution.test/schemas/attr-names/2011/07/isSolution\"";
  ProgramProcess usual({});
  usual.AwaitReady();
  const std::string before = AnswerOf(usual, AliceEnvelope());
  EXPECT_THAT(before, Not(HasSubstr(groups)));
  EXPECT_THAT(before, Not(HasSubstr(solution)));
  ProgramProcess program({"--vendor-host", "vendor.test", "--solution-host", "solution.test"});
  program.AwaitReady();
  const std::string after = AnswerOf(program, AliceEnvelope());
  EXPECT_THAT(after, HasSubstr(groups));
  EXPECT_THAT(after, HasSubstr(solution));
}

TEST(OptionsTest, ResumptionCanBeSwitchedOff) {
  EXPECT_TRUE(Parse({}).server.tls.sessionResumption);
  for (const std::vector<std::string>& arguments :
       {std::vector<std::string>{"--no-resumption"}, {"--tls", "no-resumption"}}) {
    EXPECT_FALSE(Parse(arguments).server.tls.sessionResumption) << arguments[0];
  }
}

class NegotiationOptionsTest : public NegotiationFixture {
 protected:
  // The answer to the first leg of a login at a service with the keytab and these arguments.
  static std::string FirstAnswer(std::vector<std::string> arguments) {
    arguments.insert(arguments.end(), {"--keytab", keytab});
    ProgramProcess program(arguments);
    program.AwaitReady();
    GssClient gss(alice, kService);
    return AnswerOf(program, Envelope("", FirstLegBody("urn:uuid:1", gss.Step())));
  }
};

TEST_F(NegotiationOptionsTest, ASignatureOfTheMechanismsTakesASecondLeg) {
  EXPECT_THAT(FirstAnswer({}), HasSubstr("Assertion"));
  for (const std::vector<std::string>& arguments :
       {std::vector<std::string>{"--request-mic"}, {"--negotiation", "request-mic"}}) {
    const std::string answer = FirstAnswer(arguments);
    EXPECT_THAT(answer, Not(HasSubstr("Assertion")));
    EXPECT_THAT(answer, HasSubstr("BinaryExchange"));
  }
}

}  // namespace
}  // namespace DevSts::Testing
