#include <functional>
#include <string>
#include <utility>
#include <vector>

#include <gmock/gmock.h>

#include <ssoclient/exceptions.h>
#include <tarnik/core/reader.h>

#include "sts/answers.h"
#include "sts/response_handler.h"

// The answer of one operation is given to the parser of another.
namespace SsoClient::Testing {
namespace {

using testing::ElementsAre;

constexpr char kContext[] = " Context=\"urn:uuid:1\"";

using Parse = std::function<void(const ResponseHandlerImpl&, Tarnik::Reader*)>;

const std::vector<std::pair<std::string, Parse>>& Operations() {
  static const std::vector<std::pair<std::string, Parse>> operations{
      {"issue",
       [](const auto& handler, Tarnik::Reader* reader) {
         std::string assertion;
         handler.ParseIssueResponse(reader, assertion);
       }},
      {"renew",
       [](const auto& handler, Tarnik::Reader* reader) {
         std::string assertion;
         handler.ParseRenewResponse(reader, assertion);
       }},
      {"validate",
       [](const auto& handler, Tarnik::Reader* reader) { handler.ParseValidateResponse(reader); }},
      {"negotiate",
       [](const auto& handler, Tarnik::Reader* reader) {
         NegotiationResponse response;
         handler.ParseNegotiationResponse(reader, response);
       }},
  };
  return operations;
}

std::vector<std::string> OperationsThatAccept(const std::string& body) {
  std::vector<std::string> accepting;
  for (const auto& [name, parse] : Operations()) {
    const auto reader = Tarnik::CreateStringReader(Envelope(body));
    try {
      parse(ResponseHandlerImpl(), reader.get());
      accepting.push_back(name);
    } catch (const SsoException& error) {
      EXPECT_EQ(error.Message(), "Unexpected XML format") << name;
    }
  }
  return accepting;
}

std::string Status() {
  return "<wst:Status><wst:Code>http://docs.oasis-open.org/ws-sx/ws-trust/200512/status/valid"
         "</wst:Code></wst:Status>";
}

std::string Leg() {
  return "<wst:BinaryExchange>AAEC</wst:BinaryExchange>";
}

std::string TokenType() {
  return "<wst:TokenType>urn:oasis:names:tc:SAML:2.0:assertion</wst:TokenType>";
}

TEST(AnswerConfusionTest, AnAnswerIsAcceptedOnlyByItsOwnOperation) {
  EXPECT_THAT(OperationsThatAccept(Collection(Rstr(TokenType() + Requested(kAssertionXml)))),
              ElementsAre("issue"));
  EXPECT_THAT(OperationsThatAccept(Rstr(TokenType() + Requested(kAssertionXml))),
              ElementsAre("renew"));
  EXPECT_THAT(OperationsThatAccept(Rstr(Status())), ElementsAre("validate"));
  EXPECT_THAT(OperationsThatAccept(Rstr(Leg(), kContext)), ElementsAre("negotiate"));
}

// The last answer of a negotiation is the answer of an issue request with a context.
TEST(AnswerConfusionTest, TheLastLegIssuesATokenToo) {
  EXPECT_THAT(
      OperationsThatAccept(Collection(Rstr(TokenType() + Requested(kAssertionXml), kContext))),
      ElementsAre("issue", "negotiate"));
}

TEST(AnswerConfusionTest, ARequestSentBackIsNotAnAnswer) {
  EXPECT_THAT(OperationsThatAccept("<wst:RequestSecurityToken>" + TokenType() + Status() + Leg() +
                                   Requested(kAssertionXml) + "</wst:RequestSecurityToken>"),
              ElementsAre());
}

}  // namespace
}  // namespace SsoClient::Testing
