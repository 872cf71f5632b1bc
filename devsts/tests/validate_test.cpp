// The results of the Validate operation.
#include <cstddef>
#include <string>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "devsts/server.h"
#include "raw_client.h"
#include "signed_request.h"

namespace DevSts::Testing {
namespace {

using testing::IsEmpty;
using testing::StartsWith;

constexpr char kValid[] = "http://docs.oasis-open.org/ws-sx/ws-trust/200512/status/valid";
constexpr char kInvalid[] = "http://docs.oasis-open.org/ws-sx/ws-trust/200512/status/invalid";

std::string AskAbout(const Server& server, const std::string& token) {
  return Ask(server, Envelope("", ValidateBody(token)), kValidateAction);
}

void ExpectInvalid(const std::string& answer, const std::string& reason) {
  EXPECT_THAT(answer, StartsWith("HTTP/1.1 200 OK\r\n"));
  EXPECT_EQ(ElementText(answer, "wst:Code"), kInvalid);
  EXPECT_THAT(ElementText(answer, "wst:Reason"), StartsWith(reason));
}

TEST(ValidateTest, FindsIssuedTokensValid) {
  const Server server;
  for (const std::string& token :
       {AssertionIn(Ask(server, AliceEnvelope())), HolderToken(server, Holder())}) {
    const std::string answer = AskAbout(server, token);
    EXPECT_THAT(answer, StartsWith("HTTP/1.1 200 OK\r\n"));
    EXPECT_EQ(ElementText(answer, "wst:TokenType"),
              "http://docs.oasis-open.org/ws-sx/ws-trust/200512/RSTR/Status");
    EXPECT_EQ(ElementText(answer, "wst:Code"), kValid);
    EXPECT_THAT(ElementText(answer, "wst:Reason"), IsEmpty());
  }
  EXPECT_EQ(server.GetCounters().tokensIssued, 2U);
}

TEST(ValidateTest, SaysWhyATokenIsInvalid) {
  ServerOptions options;
  options.issuedTokenLimit = 1;
  Server server(options);
  const std::string token = AssertionIn(Ask(server, AliceEnvelope()));
  ExpectInvalid(AskAbout(server, Replaced(token, "alice@", "carol@")),
                "The token's signature does not verify: ");
  ExpectInvalid(AskAbout(server, WithoutSignature(token)), "The token has no signature");
  ASSERT_TRUE(server.Revoke(IdOfAssertion(token)));
  ExpectInvalid(AskAbout(server, token), "The token was revoked");
  Ask(server, AliceEnvelope());
  ExpectInvalid(AskAbout(server, token), "The token is unknown");
}

TEST(ValidateTest, FindsAnUnreadableTokenInvalid) {
  const Server server;
  const std::string bare =
      "<s:Assertion xmlns:s=\"urn:oasis:names:tc:SAML:2.0:assertion\" ID=\"_1\"/>";
  ExpectInvalid(AskAbout(server, bare), "The token has no Subject");
}

TEST(ValidateTest, FindsATokenOutsideItsValidityInvalid) {
  for (const long start : {-200L, 100L}) {
    ServerOptions options;
    options.assertion.beforeSigning = [start](std::string& text) {
      const std::size_t from = text.find("<saml2:Conditions ");
      text.replace(from, text.find('>', from) - from,
                   "<saml2:Conditions NotBefore=\"" + TimeFromNow(start) + "\" NotOnOrAfter=\"" +
                       TimeFromNow(start + 100) + "\"");
    };
    const Server server(options);
    const std::string token = AssertionIn(Ask(server, AliceEnvelope()));
    ExpectInvalid(AskAbout(server, token),
                  start < 0 ? "The token has expired" : "The token is not yet valid");
  }
}

TEST(ValidateTest, RefusesCredentialsAndSignatures) {
  const Server server;
  const Credential holder = Holder();
  const std::string token = HolderToken(server, holder);
  const std::string user = UsernameToken("alice@EXAMPLE.COM", "secret");
  EXPECT_EQ(
      ElementText(Ask(server, Envelope(user, ValidateBody(token)), kValidateAction), "faultstring"),
      "A UsernameToken is not expected in a Validate request");
  const std::string proven = Sign(ByCertificate(holder, ValidateBody(token)), holder);
  EXPECT_EQ(ElementText(Ask(server, proven, kValidateAction), "faultstring"),
            "A Signature is not expected in a Validate request");
}

TEST(ValidateTest, RefusesAnythingButAnAssertion) {
  const Server server;
  const std::string answer = AskAbout(server, "<x xmlns=\"urn:x\"/>");
  EXPECT_EQ(ElementText(answer, "faultcode"), "wst:InvalidRequest");
  EXPECT_EQ(
      ElementText(answer, "faultstring"),
      "Expected Assertion (urn:oasis:names:tc:SAML:2.0:assertion) in ValidateTarget, found x");
}

}  // namespace
}  // namespace DevSts::Testing
