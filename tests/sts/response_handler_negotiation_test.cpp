#include <string>

#include <gmock/gmock.h>

#include <tarnik/core/reader.h>

#include "sts/answers.h"
#include "sts/parse_answers.h"
#include "sts/response_handler.h"

namespace SsoClient::Testing {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;

TEST(NegotiationResponseTest, HoldsItsFieldsInOrder) {
  const NegotiationResponse response = {"context", {7}, "token"};
  EXPECT_EQ(response.contextId, "context");
  EXPECT_THAT(response.leg, ElementsAre(7));
  EXPECT_EQ(response.token, "token");
}

TEST(ParseNegotiationResponseTest, AnIntermediateLegHasNoToken) {
  const auto response = ParseNegotiation(
      IntermediateAnswer(kExchange + std::string(kSamlType) + Requested(kAssertionXml)));
  EXPECT_EQ(response.contextId, "urn:uuid:1");
  EXPECT_THAT(response.leg, ElementsAre(0x00, 0xff, 0x10));
  EXPECT_EQ(response.token, "");
}

TEST(ParseNegotiationResponseTest, TheFinalAnswerHasTheTokenAndPerhapsALeg) {
  const std::string token = kSamlType + Requested(kAssertionXml);
  const auto withLeg = ParseNegotiation(FinalAnswer(kExchange + token));
  EXPECT_EQ(withLeg.contextId, "urn:uuid:1");
  EXPECT_THAT(withLeg.leg, ElementsAre(0x00, 0xff, 0x10));
  EXPECT_EQ(withLeg.token, kCanonicalAssertion);
  for (const std::string exchange :
       {"", "<wst:BinaryExchange/>", "<wst:BinaryExchange><b>AP8Q</b></wst:BinaryExchange>"}) {
    const auto without = ParseNegotiation(FinalAnswer(exchange + token));
    EXPECT_THAT(without.leg, IsEmpty());
    EXPECT_EQ(without.token, kCanonicalAssertion);
  }
}

TEST(ParseNegotiationResponseTest, AResponseOutsideACollectionIsIntermediate) {
  const auto response = ParseNegotiation(
      Envelope(Collection(Rstr(kSamlType + Requested(kAssertionXml), " Context=\"final\"")) +
               Rstr(kExchange, " Context=\"intermediate\"")));
  EXPECT_EQ(response.contextId, "intermediate");
  EXPECT_EQ(response.token, "");
}

TEST(ParseNegotiationResponseTest, TheFirstOfTwoFinalAnswersCounts) {
  const auto response = ParseNegotiation(Envelope(
      Collection(Rstr(kSamlType + Requested(kAssertionXml), " Context=\"first\"") +
                 Rstr(kExchange + std::string(kSamlType) + Requested("<Assertion n=\"2\"/>"),
                      " Context=\"second\""))));
  EXPECT_EQ(response.contextId, "first");
  EXPECT_THAT(response.leg, IsEmpty());
  EXPECT_EQ(response.token, kCanonicalAssertion);
}

// The context, the leg, the assertion, the token type.
TEST(ParseNegotiationResponseTest, MissingPartsAreReportedInReadingOrder) {
  const std::string badLeg = "<wst:BinaryExchange>!</wst:BinaryExchange>";
  EXPECT_EQ(Failure([&] { ParseNegotiation(Envelope(Rstr(badLeg))); }), kFormat);
  EXPECT_EQ(Failure([&] { ParseNegotiation(Envelope(Collection(Rstr(badLeg)))); }), kFormat);
  const std::string badType = "<wst:TokenType>urn:other</wst:TokenType>";
  EXPECT_EQ(Failure([&] { ParseNegotiation(FinalAnswer(badLeg + badType)); }),
            "Base64 format exception");
  EXPECT_EQ(Failure([&] { ParseNegotiation(FinalAnswer(badType)); }), kFormat);
}

TEST(ParseNegotiationResponseTest, WhiteSpaceIsALegWithoutBytes) {
  const auto negotiation =
      ParseNegotiation(IntermediateAnswer("<wst:BinaryExchange> \n</wst:BinaryExchange>"));
  EXPECT_TRUE(negotiation.leg.empty());
  EXPECT_TRUE(negotiation.token.empty());
}

TEST(ParseNegotiationResponseTest, AnIntermediateLegIsNeeded) {
  for (const std::string exchange :
       {"", "<wst:BinaryExchange/>", "<wst:BinaryExchange></wst:BinaryExchange>",
        "<wst:BinaryExchange><!-- c -->AP8Q</wst:BinaryExchange>"}) {
    EXPECT_EQ(Failure([&] { ParseNegotiation(IntermediateAnswer(exchange)); }), kFormat)
        << exchange;
  }
}

TEST(ParseNegotiationResponseTest, TheContextIsNeeded) {
  EXPECT_EQ(Failure([] { ParseNegotiation(Envelope(Rstr(kExchange))); }), kFormat);
  EXPECT_EQ(Failure([] { ParseNegotiation(Envelope(Rstr(kExchange, " context=\"c\""))); }),
            kFormat);
  EXPECT_EQ(Failure([] { ParseNegotiation(Envelope(Rstr(kExchange, " wst:Context=\"c\""))); }),
            kFormat);
  EXPECT_EQ(Failure([] {
              ParseNegotiation(Envelope(Collection(Rstr(kSamlType + Requested(kAssertionXml)))));
            }),
            kFormat);
  EXPECT_EQ(ParseNegotiation(Envelope(Rstr(kExchange, " Context=\"\""))).contextId, "");
}

TEST(ParseNegotiationResponseTest, AResponseIsNeeded) {
  for (const auto& body : {std::string(), Collection(""), Requested(kAssertionXml)}) {
    EXPECT_EQ(Failure([&] { ParseNegotiation(Envelope(body)); }), kFormat) << body;
  }
}

TEST(ParseNegotiationResponseTest, TheLegIsBase64) {
  for (const std::string leg : {"!", "AP8", "AP8Q=", "A===", "AP-Q"}) {
    const std::string exchange = "<wst:BinaryExchange>" + leg + "</wst:BinaryExchange>";
    EXPECT_EQ(Failure([&] { ParseNegotiation(IntermediateAnswer(exchange)); }),
              "Base64 format exception")
        << leg;
    EXPECT_EQ(Failure([&] {
                ParseNegotiation(FinalAnswer(exchange + kSamlType + Requested(kAssertionXml)));
              }),
              "Base64 format exception")
        << leg;
  }
}

TEST(ParseNegotiationResponseTest, TheFinalAnswerNeedsAnAssertion) {
  for (const auto& content :
       {std::string(kSamlType), kSamlType + Requested(""), kSamlType + std::string(kAssertionXml),
        std::string("<wst:TokenType>other</wst:TokenType>")}) {
    EXPECT_EQ(Failure([&] { ParseNegotiation(FinalAnswer(kExchange + content)); }), kFormat)
        << content;
  }
}

TEST(ParseNegotiationResponseTest, TheTokenTypeIsComparedWhole) {
  const struct {
    std::string element;
    std::string type;
  } kCases[] = {
      {"<wst:TokenType>urn:other</wst:TokenType>", "urn:other"},
      {"<wst:TokenType> urn:oasis:names:tc:SAML:2.0:assertion</wst:TokenType>",
       " urn:oasis:names:tc:SAML:2.0:assertion"},
      {"<wst:TokenType/>", ""},
      {"<wst:TokenType><b/></wst:TokenType>", ""},
      {"", ""},
  };
  for (const auto& test : kCases) {
    EXPECT_EQ(
        Failure([&] { ParseNegotiation(FinalAnswer(test.element + Requested(kAssertionXml))); }),
        "Invalid token type: " + test.type + " (expected: urn:oasis:names:tc:SAML:2.0:assertion");
  }
}

TEST(ParseNegotiationResponseTest, ReplacesWhatTheRecordHeld) {
  NegotiationResponse response = {"old", {1, 2, 3}, "old token"};
  const auto reader = Tarnik::CreateStringReader(IntermediateAnswer(kExchange));
  ResponseHandlerImpl().ParseNegotiationResponse(reader.get(), response);
  EXPECT_EQ(response.contextId, "urn:uuid:1");
  EXPECT_THAT(response.leg, ElementsAre(0x00, 0xff, 0x10));
  EXPECT_EQ(response.token, "");
}

}  // namespace
}  // namespace SsoClient::Testing
