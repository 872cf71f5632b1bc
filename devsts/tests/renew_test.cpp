// Renewal of tokens.
#include <cstddef>
#include <cstring>
#include <string>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "devsts/server.h"
#include "expect_fault.h"
#include "raw_client.h"
#include "signed_request.h"

namespace DevSts::Testing {
namespace {

using testing::HasSubstr;
using testing::Not;
using testing::StartsWith;

std::string AskToRenew(const Server& server, const std::string& token, const Credential& holder,
                       const Edits& edits = {}) {
  return Ask(server, Sign(ByCertificate(holder, RenewBody(token)), holder, edits), kRenewAction);
}

// Sets the token's validity period, in seconds from now.
AssertionOptions ValidFrom(long start, long end) {
  AssertionOptions options;
  options.beforeSigning = [=](std::string& text) {
    const std::size_t from = text.find("<saml2:Conditions ");
    const std::size_t size = text.find('>', from) - from;
    text.replace(from, size,
                 "<saml2:Conditions NotBefore=\"" + TimeFromNow(start) + "\" NotOnOrAfter=\"" +
                     TimeFromNow(end) + "\"");
  };
  return options;
}

TEST(RenewTest, IssuesANewTokenWithTheSameSubjectKeyAndContent) {
  const Server server;
  const Credential holder = Holder();
  const std::string token = HolderToken(server, holder);
  const std::string answer = AskToRenew(server, token, holder);
  ASSERT_THAT(answer, StartsWith("HTTP/1.1 200 OK\r\n"));
  EXPECT_THAT(answer, Not(HasSubstr("RequestSecurityTokenResponseCollection")));
  const std::string renewed = AssertionIn(answer);
  EXPECT_NE(IdOfAssertion(renewed), IdOfAssertion(token));
  for (const char* element : {"saml2:NameID", "ds:KeyInfo", "saml2:AttributeStatement"}) {
    const auto part = [&](const std::string& text) {
      const std::string rest = text.substr(text.find("<saml2:Subject>"));
      return ElementText(rest, element);
    };
    EXPECT_EQ(part(renewed), part(token)) << element;
    EXPECT_NE(part(renewed), "") << element;
  }
  EXPECT_TRUE(VerifyXml(renewed, server.SigningCertificatePem()));
}

TEST(RenewTest, GrantsTheRequestedLifetime) {
  const Server server;
  const Credential holder = Holder();
  const std::string token = HolderToken(server, holder);
  const std::string answer = AskToRenew(server, token, holder);
  // Two hours are requested; the original token was valid for one.
  EXPECT_GT(ElementText(answer, "wsu:Expires"), TimeFromNow(7000));
  EXPECT_LT(ElementText(answer, "wsu:Expires"), TimeFromNow(7300));
}

TEST(RenewTest, CountsDownToZero) {
  ServerOptions options;
  options.assertion.renewCount = 2;
  const Server server(options);
  const Credential holder = Holder();
  std::string token = HolderToken(server, holder);
  for (const char* left : {"1", "0"}) {
    token = AssertionIn(AskToRenew(server, token, holder));
    EXPECT_THAT(token, HasSubstr(std::string("<saml2:Condition Count=\"") + left + "\""));
  }
  ExpectFault(AskToRenew(server, token, holder), "wst:UnableToRenew",
              "The RenewTarget may not be renewed any more");
}

TEST(RenewTest, RefusesATokenThatIsNotRenewable) {
  const Server server;
  const Credential holder = Holder();
  const std::string answer =
      Ask(server, Sign(ByCertificate(holder, IssueBody("PublicKey", kUseKey),
                                     UsernameToken("alice@EXAMPLE.COM", "secret")),
                       holder, {{"Allow=\"true\"", "Allow=\"false\""}}));
  ExpectFault(AskToRenew(server, AssertionIn(answer), holder), "wst:UnableToRenew",
              "The RenewTarget is not renewable");
}

TEST(RenewTest, RefusesABearerToken) {
  const Server server;
  const std::string bearer = AssertionIn(Ask(server, AliceEnvelope()));
  ExpectFault(AskToRenew(server, bearer, Holder()), "wst:InvalidRequest",
              "The RenewTarget is not a holder-of-key token");
}

TEST(RenewTest, RefusesAKeyOtherThanTheTokens) {
  const Server server;
  const std::string token = HolderToken(server, Holder());
  ExpectFault(AskToRenew(server, token, Holder("another holder")), "wst:FailedAuthentication",
              "The request is not signed by the key of the RenewTarget");
}

TEST(RenewTest, AcceptsANewCertificateOfTheSameKey) {
  const Server server;
  const std::string token = HolderToken(server, Holder());
  EXPECT_THAT(AskToRenew(server, token, Holder()), StartsWith("HTTP/1.1 200"));
}

TEST(RenewTest, RefusesUnsignedRequestsAndThoseWithOtherCredentials) {
  const Server server;
  const Credential holder = Holder();
  const std::string token = HolderToken(server, holder);
  const std::string unsignedRequest = Envelope("", RenewBody(token));
  ExpectFault(Ask(server, unsignedRequest, kRenewAction), "wsse:InvalidSecurity",
              "A Renew request must be signed with a certificate");
  const std::string other = HolderToken(server, holder);
  ExpectFault(Ask(server, Sign(ByToken(other, RenewBody(token)), holder), kRenewAction),
              "wsse:InvalidSecurity", "A Renew request must be signed with a certificate");
  const std::string user = UsernameToken("alice@EXAMPLE.COM", "secret");
  ExpectFault(
      Ask(server, Sign(ByCertificate(holder, RenewBody(token), user), holder), kRenewAction),
      "wsse:InvalidSecurity", "A UsernameToken is not expected in a Renew request");
}

TEST(RenewTest, RefusesTheTokenOfAUserWhoWasRemoved) {
  Server server;
  const Credential holder = Holder();
  const std::string token = HolderToken(server, holder);
  server.SetUsers({});
  ExpectFault(AskToRenew(server, token, holder), "wst:FailedAuthentication",
              "There is no user alice@EXAMPLE.COM");
}

TEST(RenewTest, RefusesATokenThatIsForgedRevokedOrUnknown) {
  ServerOptions options;
  options.issuedTokenLimit = 1;
  Server server(options);
  const Credential holder = Holder();
  const std::string token = HolderToken(server, holder);
  ExpectFault(AskToRenew(server, Replaced(token, "alice@", "carol@"), holder),
              "wsse:InvalidSecurityToken", "The RenewTarget's signature does not verify: ");
  ASSERT_TRUE(server.Revoke(IdOfAssertion(token)));
  ExpectFault(AskToRenew(server, token, holder), "wsse:InvalidSecurityToken",
              "The RenewTarget was revoked");
  HolderToken(server, holder);
  ExpectFault(AskToRenew(server, token, holder), "wsse:InvalidSecurityToken",
              "The RenewTarget is unknown");
}

TEST(RenewTest, RenewsAnExpiredTokenOnlyIfItsRestrictionAllowsIt) {
  for (const bool renewExpired : {false, true}) {
    ServerOptions options;
    options.assertion = ValidFrom(-100, -10);
    options.assertion.renewExpired = renewExpired;
    Server server(options);
    const Credential holder = Holder();
    const std::string token = HolderToken(server, holder);
    server.SetAssertionOptions({});
    const std::string answer = AskToRenew(server, token, holder);
    if (renewExpired) {
      EXPECT_THAT(answer, StartsWith("HTTP/1.1 200"));
      EXPECT_THAT(AssertionIn(answer), HasSubstr("RenewExpired=\"true\""));
      continue;
    }
    ExpectFault(answer, "wst:UnableToRenew",
                "The RenewTarget has expired, and it is not renewable after its end");
  }
}

TEST(RenewTest, RefusesATokenThatIsNotYetValid) {
  ServerOptions options;
  options.assertion = ValidFrom(100, 200);
  const Server server(options);
  const Credential holder = Holder();
  ExpectFault(AskToRenew(server, HolderToken(server, holder), holder), "wst:UnableToRenew",
              "The RenewTarget is not yet valid");
}

TEST(RenewTest, PostdatesATokenOnlyIfItsRestrictionAllowsIt) {
  for (const bool postdatable : {false, true}) {
    ServerOptions options;
    options.assertion.postdatable = postdatable;
    const Server server(options);
    const Credential holder = Holder();
    const std::string token = HolderToken(server, holder);
    const std::string start = TimeFromNow(3600);
    std::string body = RenewBody(token);
    const std::size_t from = body.find("<wsu:Created>") + std::strlen("<wsu:Created>");
    body.replace(from, start.size(), start);
    const std::string answer = Ask(server, Sign(ByCertificate(holder, body), holder), kRenewAction);
    if (postdatable) {
      EXPECT_THAT(AssertionIn(answer), HasSubstr("NotBefore=\"" + start + "\""));
      continue;
    }
    ExpectFault(answer, "wst:InvalidTimeRange",
                "The Lifetime begins in the future, and the RenewTarget is not postdatable");
  }
}

TEST(RenewTest, RefusesAnEmptyLifetimeAndATypeThatDoesNotMatchTheAction) {
  const Server server;
  const Credential holder = Holder();
  const std::string token = HolderToken(server, holder);
  ExpectFault(Ask(server, Sign(ByCertificate(holder, RenewBody(token, 0)), holder), kRenewAction),
              "wst:InvalidTimeRange", "The Lifetime is not positive");
  ExpectFault(Ask(server, Sign(ByCertificate(holder, RenewBody(token)), holder)),
              "wst:InvalidRequest", "The RequestType does not fit the SOAPAction: ");
  ExpectFault(
      AskToRenew(server, token, holder, {{"</wst:RenewTarget>", "</wst:RenewTarget><wst:Other/>"}}),
      "wst:InvalidRequest", "Unexpected element Other in RequestSecurityToken");
}

}  // namespace
}  // namespace DevSts::Testing
