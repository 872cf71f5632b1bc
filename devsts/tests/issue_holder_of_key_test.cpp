// Tokens for requests that prove possession of a key.
#include <cstddef>
#include <stdexcept>
#include <string>
#include <utility>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "devsts/server.h"
#include "raw_client.h"
#include "signed_request.h"

namespace DevSts::Testing {
namespace {

using testing::AllOf;
using testing::HasSubstr;
using testing::Not;
using testing::StartsWith;

constexpr char kHolderOfKey[] = "Method=\"urn:oasis:names:tc:SAML:2.0:cm:holder-of-key\"";

// The certificate's octets, encoded as in an assertion.
std::string Base64Of(std::string pem) {
  pem = pem.substr(pem.find('\n') + 1);
  pem = pem.substr(0, pem.find("-----END"));
  std::erase(pem, '\n');
  return pem;
}

void ExpectBoundTo(const Credential& holder, const std::string& assertion) {
  EXPECT_THAT(assertion, HasSubstr(kHolderOfKey));
  EXPECT_THAT(assertion, HasSubstr("xsi:type=\"saml2:KeyInfoConfirmationDataType\""));
  EXPECT_EQ(ElementText(ElementText(assertion, "saml2:Subject"), "ds:X509Certificate"),
            Base64Of(holder.certificatePem));
}

std::string AskByToken(const Server& server, const std::string& token, const std::string& body,
                       const Credential& holder) {
  return Ask(server, Sign(ByToken(token, body), holder));
}

TEST(IssueHolderOfKeyTest, ByPasswordBindsTheTokenToTheProvenKey) {
  const Server server;
  const Credential holder = Holder();
  const std::string assertion = HolderToken(server, holder);
  EXPECT_EQ(ElementText(assertion, "saml2:NameID"), "alice@EXAMPLE.COM");
  EXPECT_THAT(assertion, HasSubstr("PasswordProtectedTransport"));
  ExpectBoundTo(holder, assertion);
  EXPECT_TRUE(VerifyXml(assertion, server.SigningCertificatePem()));
}

TEST(IssueHolderOfKeyTest, ByPasswordStillNeedsThePassword) {
  const Server server;
  const Credential holder = Holder();
  const std::string answer =
      Ask(server, Sign(ByCertificate(holder, IssueBody("PublicKey", kUseKey),
                                     UsernameToken("alice@EXAMPLE.COM", "wrong")),
                       holder));
  EXPECT_EQ(ElementText(answer, "faultcode"), "wst:FailedAuthentication");
  EXPECT_EQ(ElementText(answer, "faultstring"), "Invalid credentials");
}

TEST(IssueHolderOfKeyTest, ByCertificateIdentifiesTheUser) {
  Server server;
  const Credential machine = server.MakeClientCredential("machine");
  server.RegisterCertificate("machine@EXAMPLE.COM", machine.certificatePem);
  const std::string assertion = AssertionIn(
      Ask(server, Sign(ByCertificate(machine, IssueBody("PublicKey", kUseKey)), machine)));
  EXPECT_EQ(ElementText(assertion, "saml2:NameID"), "machine@EXAMPLE.COM");
  EXPECT_THAT(assertion, AllOf(HasSubstr("ac:classes:X509"), HasSubstr(">true<")));
  ExpectBoundTo(machine, assertion);
}

TEST(IssueHolderOfKeyTest, ByCertificateRefusesACertificateOfNoUser) {
  Server server;
  server.RegisterCertificate("machine@EXAMPLE.COM", Holder("machine").certificatePem);
  const Credential other = Holder("machine");
  const std::string answer =
      Ask(server, Sign(ByCertificate(other, IssueBody("PublicKey", kUseKey)), other));
  EXPECT_EQ(ElementText(answer, "faultcode"), "wst:FailedAuthentication");
  EXPECT_EQ(ElementText(answer, "faultstring"), "The certificate belongs to no user");
}

TEST(IssueHolderOfKeyTest, RegistersCertificatesOnlyForExistingUsers) {
  Server server;
  EXPECT_THROW(server.RegisterCertificate("nobody@EXAMPLE.COM", Holder().certificatePem),
               std::out_of_range);
  EXPECT_THROW(server.RegisterCertificate("machine@EXAMPLE.COM", "no PEM"), std::runtime_error);
}

TEST(IssueHolderOfKeyTest, WithoutAnyCredentialIsRefused) {
  const Server server;
  const std::string answer = Ask(server, Envelope("", IssueBody("Bearer")));
  EXPECT_EQ(ElementText(answer, "faultcode"), "wsse:InvalidSecurity");
  EXPECT_EQ(ElementText(answer, "faultstring"),
            "No UsernameToken and no Signature after the Timestamp");
}

TEST(IssueHolderOfKeyTest, ByTokenIssuesToTheSameSubjectAndKey) {
  const Server server;
  const Credential holder = Holder();
  const std::string first = HolderToken(server, holder);
  const std::string second = AssertionIn(AskByToken(server, first, IssueBody("PublicKey"), holder));
  EXPECT_EQ(ElementText(second, "saml2:NameID"), "alice@EXAMPLE.COM");
  EXPECT_THAT(second, Not(HasSubstr("del:Delegate ")));
  EXPECT_NE(IdOfAssertion(second), IdOfAssertion(first));
  ExpectBoundTo(holder, second);
}

TEST(IssueHolderOfKeyTest, ByTokenIssuesABearerTokenIfRequested) {
  const Server server;
  const Credential holder = Holder();
  const std::string bearer =
      AssertionIn(AskByToken(server, HolderToken(server, holder), IssueBody("Bearer"), holder));
  EXPECT_THAT(bearer, HasSubstr("Method=\"urn:oasis:names:tc:SAML:2.0:cm:bearer\""));
  EXPECT_EQ(ElementText(bearer, "saml2:NameID"), "alice@EXAMPLE.COM");
}

TEST(IssueHolderOfKeyTest, ByTokenAllowsOneDelegationLessEachTime) {
  const Server server;
  const Credential holder = Holder();
  const std::string first = HolderToken(server, holder);
  EXPECT_THAT(first, HasSubstr("<saml2:ProxyRestriction Count=\"10\"/>"));
  const std::string second = AssertionIn(AskByToken(server, first, IssueBody("PublicKey"), holder));
  EXPECT_THAT(second, HasSubstr("<saml2:ProxyRestriction Count=\"9\"/>"));
}

TEST(IssueHolderOfKeyTest, DelegatesToAnotherPrincipal) {
  const Server server;
  const Credential holder = Holder();
  const std::string assertion = HolderToken(server, holder, DelegateTo("bob@EXAMPLE.COM"));
  EXPECT_THAT(ElementText(assertion, "saml2:SubjectConfirmation"),
              HasSubstr(">bob@EXAMPLE.COM</saml2:NameID><saml2:SubjectConfirmationData"));
  EXPECT_THAT(ElementText(assertion, "del:Delegate"), HasSubstr(">bob@EXAMPLE.COM<"));
  ExpectBoundTo(holder, assertion);
}

// alice delegates to machine, and machine to bob. The chain is in this order, and the confirmation
// names the last delegate.
TEST(IssueHolderOfKeyTest, ByTokenWithActAsAddsTheRequesterToTheChain) {
  Server server;
  const Credential machine = server.MakeClientCredential("machine");
  server.RegisterCertificate("machine@EXAMPLE.COM", machine.certificatePem);
  const std::string machines = AssertionIn(
      Ask(server, Sign(ByCertificate(machine, IssueBody("PublicKey", kUseKey)), machine)));
  const std::string alices = AssertionIn(Ask(server, AliceEnvelope()));
  const std::string body = IssueBody("PublicKey", DelegateTo("bob@EXAMPLE.COM") + ActAs(alices));
  const std::string assertion = AssertionIn(AskByToken(server, machines, body, machine));

  EXPECT_EQ(ElementText(assertion, "saml2:NameID"), "alice@EXAMPLE.COM");
  EXPECT_THAT(assertion, HasSubstr("EXAMPLE\\staff"));
  const std::string chain = assertion.substr(assertion.find("<saml2:Condition xsi:type=\"del:"));
  const std::size_t first = chain.find(">machine@EXAMPLE.COM<");
  const std::size_t second = chain.find(">bob@EXAMPLE.COM<");
  ASSERT_NE(first, std::string::npos);
  ASSERT_NE(second, std::string::npos);
  EXPECT_LT(first, second);
  EXPECT_THAT(ElementText(assertion, "saml2:SubjectConfirmation"),
              HasSubstr(">bob@EXAMPLE.COM</saml2:NameID><saml2:SubjectConfirmationData"));
  EXPECT_THAT(assertion, HasSubstr("<saml2:ProxyRestriction Count=\"9\"/>"));
  ExpectBoundTo(machine, assertion);
}

TEST(IssueHolderOfKeyTest, ADelegateUsesItsTokenWithoutGrowingTheChain) {
  Server server;
  const Credential machine = server.MakeClientCredential("machine");
  server.RegisterCertificate("machine@EXAMPLE.COM", machine.certificatePem);
  const std::string machines = AssertionIn(
      Ask(server, Sign(ByCertificate(machine, IssueBody("PublicKey", kUseKey)), machine)));
  const std::string alices =
      AssertionIn(Ask(server, AliceEnvelope(DelegateTo("machine@EXAMPLE.COM"))));
  const std::string assertion =
      AssertionIn(AskByToken(server, machines, IssueBody("PublicKey", ActAs(alices)), machine));
  const std::size_t only = assertion.find("<del:Delegate ");
  ASSERT_NE(only, std::string::npos);
  EXPECT_EQ(assertion.find("<del:Delegate ", only + 1), std::string::npos);
}

TEST(IssueHolderOfKeyTest, ByTokenRefusesToDelegateATokenThatIsNotDelegable) {
  const Server server;
  const Credential holder = Holder();
  const auto notDelegable = [](std::string body) {
    return Replaced(std::move(body), ">true</wst:Delegatable>", ">false</wst:Delegatable>");
  };
  const std::string token = AssertionIn(
      Ask(server, Sign(ByCertificate(holder, notDelegable(IssueBody("PublicKey", kUseKey)),
                                     UsernameToken("alice@EXAMPLE.COM", "secret")),
                       holder)));
  EXPECT_THAT(AskByToken(server, token, notDelegable(IssueBody("PublicKey")), holder),
              StartsWith("HTTP/1.1 200"));
  EXPECT_EQ(ElementText(AskByToken(server, token, IssueBody("PublicKey"), holder), "faultstring"),
            "A token that is based on one that is not delegable cannot be delegable");
  const std::string delegates = notDelegable(IssueBody("PublicKey", DelegateTo("bob@EXAMPLE.COM")));
  EXPECT_EQ(ElementText(AskByToken(server, token, delegates, holder), "faultstring"),
            "A token that is based on one that is not delegable cannot be delegated to "
            "bob@EXAMPLE.COM");
}

TEST(IssueHolderOfKeyTest, ByTokenRefusesAnInvalidToken) {
  ServerOptions options;
  options.issuedTokenLimit = 1;
  Server server(options);
  const Credential holder = Holder();
  const auto faultOf = [&](const std::string& token) {
    const std::string answer = AskByToken(server, token, IssueBody("PublicKey"), holder);
    EXPECT_EQ(ElementText(answer, "faultcode"), "wsse:InvalidSecurityToken");
    return ElementText(answer, "faultstring");
  };
  const std::string token = HolderToken(server, holder);
  EXPECT_THAT(faultOf(Replaced(token, "alice@EXAMPLE.COM", "carol@EXAMPLE.COM")),
              StartsWith("The presented token's signature does not verify: "));
  const Credential stranger = server.StrangerCredential();
  EXPECT_THAT(
      faultOf(SignXml(WithoutSignature(token), stranger.privateKeyPem, stranger.certificatePem)),
      StartsWith("The presented token's signature does not verify: "));
  EXPECT_EQ(faultOf(WithoutSignature(token)), "The presented token has no signature");
  EXPECT_TRUE(server.Revoke(IdOfAssertion(token)));
  EXPECT_EQ(faultOf(token), "The presented token was revoked");
  HolderToken(server, holder);
  EXPECT_EQ(faultOf(token), "The presented token is unknown");
  EXPECT_FALSE(server.Revoke(IdOfAssertion(token)));
}

TEST(IssueHolderOfKeyTest, RefusesTheTokensOfAUserWhoWasRemoved) {
  Server server;
  const Credential holder = Holder();
  const std::string token = HolderToken(server, holder);
  const std::string alices = AssertionIn(Ask(server, AliceEnvelope()));
  Users users = DemoUsers();
  users.erase("alice@EXAMPLE.COM");
  server.SetUsers(users);
  const std::string asBob = IssueEnvelope("bob@EXAMPLE.COM", "bob-secret", ActAs(alices));
  for (const std::string& answer :
       {AskByToken(server, token, IssueBody("PublicKey"), holder), Ask(server, asBob)}) {
    EXPECT_EQ(ElementText(answer, "faultcode"), "wst:FailedAuthentication");
    EXPECT_EQ(ElementText(answer, "faultstring"), "There is no user alice@EXAMPLE.COM");
  }
}

TEST(IssueHolderOfKeyTest, RefusesARevokedActAsToken) {
  Server server;
  const std::string alices = AssertionIn(Ask(server, AliceEnvelope()));
  server.Revoke(IdOfAssertion(alices));
  const std::string answer =
      Ask(server, IssueEnvelope("bob@EXAMPLE.COM", "bob-secret", ActAs(alices)));
  EXPECT_EQ(ElementText(answer, "faultstring"), "The ActAs token was revoked");
}

}  // namespace
}  // namespace DevSts::Testing
