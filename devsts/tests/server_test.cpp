#include "devsts/server.h"

#include <cstddef>
#include <functional>
#include <memory>
#include <stdexcept>
#include <string>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "raw_client.h"
#include "request_text.h"

namespace DevSts::Testing {
namespace {

using testing::AllOf;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::Not;
using testing::StartsWith;

std::string Ask(const Server& server, const std::string& octets) {
  RawClient client(server.HttpPort());
  client.Send(octets);
  return client.ReadAnswer();
}

std::string AskFor(const Server& server, const std::string& envelope) {
  return Ask(server, PostOf(envelope, kIssueAction));
}

TEST(ServerTest, IssuesAnAssertionThatVerifiesInTheEnvelope) {
  const Server server;
  const std::string answer = AskFor(server, AliceEnvelope());
  ASSERT_THAT(answer, StartsWith("HTTP/1.1 200 OK\r\n"));
  EXPECT_THAT(answer, HasSubstr("Content-Type: text/xml"));
  const std::string envelope = answer.substr(answer.find("\r\n\r\n") + 4);
  const VerifyResult result = VerifyXml(envelope, server.SigningCertificatePem());
  EXPECT_TRUE(result.valid) << result.reason;
  EXPECT_FALSE(VerifyXml(envelope, server.StrangerCredential().certificatePem));
  EXPECT_TRUE(VerifyXml(AssertionIn(answer), server.SigningCertificatePem()));
}

TEST(ServerTest, LaysOutTheAnswerAsTheProtocolRequires) {
  const Server server;
  const std::string answer = AskFor(server, AliceEnvelope());
  EXPECT_EQ(ElementText(answer, "wst:TokenType"), "urn:oasis:names:tc:SAML:2.0:assertion");
  const std::vector<std::string> order = {"<soapenv:Envelope",
                                          "<soapenv:Body",
                                          "<wst:RequestSecurityTokenResponseCollection",
                                          "<wst:RequestSecurityTokenResponse>",
                                          "<wst:TokenType",
                                          "<wst:Lifetime",
                                          "<wst:RequestedSecurityToken",
                                          "<saml2:Assertion",
                                          "<saml2:Issuer",
                                          "<ds:Signature",
                                          "<saml2:Subject>",
                                          "<saml2:Conditions",
                                          "<saml2:AuthnStatement",
                                          "<saml2:AttributeStatement"};
  std::size_t at = 0;
  for (const std::string& start : order) {
    const std::size_t found = answer.find(start, at);
    ASSERT_NE(found, std::string::npos) << start;
    at = found;
  }
}

TEST(ServerTest, DescribesTheUserInTheAssertion) {
  const Server server;
  const std::string alice = AssertionIn(AskFor(server, AliceEnvelope()));
  EXPECT_EQ(ElementText(alice, "saml2:NameID"), "alice@EXAMPLE.COM");
  EXPECT_THAT(alice, AllOf(HasSubstr(">EXAMPLE\\staff<"), HasSubstr(">EXAMPLE\\admins<"),
                           HasSubstr(">Alice<"), HasSubstr(">Archer<"), HasSubstr(">false<")));
  EXPECT_THAT(alice,
              HasSubstr("http://sts-vendor.example/schemas/attr-names/2009/01/GroupIdentity"));
  EXPECT_THAT(alice, HasSubstr("http://sso.example/schemas/attr-names/2011/07/isSolution"));
  const std::string machine =
      AssertionIn(AskFor(server, IssueEnvelope("machine@EXAMPLE.COM", "machine-secret")));
  EXPECT_THAT(machine, AllOf(HasSubstr(">true<"), Not(HasSubstr("givenname"))));
}

TEST(ServerTest, GrantsWhatIsRequested) {
  const Server server;
  const std::string more =
      "<wst:DelegateTo><wsse:UsernameToken xmlns:wsse=\"http://docs.oasis-open.org/wss/2004/01/"
      "oasis-200401-wss-wssecurity-secext-1.0.xsd\"><wsse:Username>bob@EXAMPLE.COM</wsse:Username>"
      "</wsse:UsernameToken></wst:DelegateTo>"
      "<wst:Participants xmlns:wsa=\"http://www.w3.org/2005/08/addressing\"><wst:Participant>"
      "<wsa:EndpointReference><wsa:Address>https://one.example/</wsa:Address>"
      "</wsa:EndpointReference></wst:Participant></wst:Participants>"
      "<rsa-advice:AdviceSet xmlns:rsa-advice=\"http://sts-vendor.example/names/2009/12/std-ext/"
      "WS-Trust1.4/advice\" xmlns:xs=\"http://www.w3.org/2001/XMLSchema\" "
      "xmlns:xsi=\"http://www.w3.org/2001/XMLSchema-instance\"><rsa-advice:Advice "
      "AdviceSource=\"urn:source\"><rsa-advice:Attribute Name=\"n\"><rsa-advice:AttributeValue "
      "xsi:type=\"xs:string\">v &amp; w</rsa-advice:AttributeValue></rsa-advice:Attribute>"
      "<rsa-advice:Attribute Name=\"empty\"/></rsa-advice:Advice></rsa-advice:AdviceSet>";
  const std::string assertion = AssertionIn(AskFor(server, AliceEnvelope(more)));
  EXPECT_THAT(assertion, HasSubstr("<saml2:ProxyRestriction Count=\"10\"/>"));
  EXPECT_THAT(assertion, HasSubstr("Count=\"10\" Postdatable=\"false\" RenewExpired=\"false\" "
                                   "xsi:type=\"rsa:RenewRestrictionType\""));
  EXPECT_EQ(ElementText(assertion, "saml2:Audience"), "https://one.example/");
  EXPECT_THAT(ElementText(assertion, "saml2:SubjectConfirmation"),
              HasSubstr(">bob@EXAMPLE.COM</saml2:NameID>"));
  EXPECT_THAT(ElementText(assertion, "del:Delegate"), HasSubstr(">bob@EXAMPLE.COM</saml2:NameID>"));
  EXPECT_THAT(assertion, HasSubstr("<rsa:RSAAdvice AdviceSource=\"urn:source\">"));
  EXPECT_THAT(assertion, HasSubstr(">v &amp; w</saml2:AttributeValue>"));
  EXPECT_TRUE(VerifyXml(assertion, server.SigningCertificatePem()));
}

TEST(ServerTest, GrantsNoMoreThanIsRequested) {
  const Server server;
  std::string envelope = Replaced(AliceEnvelope(), "Allow=\"true\"", "Allow=\"false\"");
  envelope = Replaced(envelope, ">true</wst:Delegatable>", ">false</wst:Delegatable>");
  const std::string assertion = AssertionIn(AskFor(server, envelope));
  ASSERT_THAT(assertion, Not(IsEmpty()));
  for (const char* absent : {"ProxyRestriction", "saml2:Condition ", "AudienceRestriction",
                             "saml2:Advice", "Delegate "}) {
    EXPECT_THAT(assertion, Not(HasSubstr(absent)));
  }
}

TEST(ServerTest, ActsAsTheSubjectOfADelegableToken) {
  const Server server;
  const std::string alices = AssertionIn(AskFor(server, AliceEnvelope()));
  const std::string bobs =
      AssertionIn(AskFor(server, IssueEnvelope("bob@EXAMPLE.COM", "bob-secret", ActAs(alices))));
  EXPECT_EQ(ElementText(bobs, "saml2:NameID"), "alice@EXAMPLE.COM");
  EXPECT_THAT(ElementText(bobs, "del:Delegate"), HasSubstr(">bob@EXAMPLE.COM</saml2:NameID>"));
}

TEST(ServerTest, RefusesATamperedActAsToken) {
  const Server server;
  const std::string alices = AssertionIn(AskFor(server, AliceEnvelope()));
  const std::string forged = Replaced(alices, "alice@EXAMPLE.COM", "carol@EXAMPLE.COM");
  const std::string answer =
      AskFor(server, IssueEnvelope("bob@EXAMPLE.COM", "bob-secret", ActAs(forged)));
  EXPECT_EQ(ElementText(answer, "faultcode"), "wsse:InvalidSecurityToken");
  EXPECT_THAT(ElementText(answer, "faultstring"),
              StartsWith("The ActAs token's signature does not verify"));
}

TEST(ServerTest, RefusesAnActAsTokenThatIsNotDelegable) {
  const Server server;
  const std::string alices = AssertionIn(AskFor(
      server, Replaced(AliceEnvelope(), ">true</wst:Delegatable>", ">false</wst:Delegatable>")));
  const std::string answer =
      AskFor(server, IssueEnvelope("bob@EXAMPLE.COM", "bob-secret", ActAs(alices)));
  EXPECT_EQ(ElementText(answer, "faultstring"),
            "The ActAs token may not be delegated to bob@EXAMPLE.COM");
}

struct ShapeCase {
  const char* name;
  AssertionOptions options;
};

class AssertionShapeTest : public testing::TestWithParam<ShapeCase> {};

TEST_P(AssertionShapeTest, VerifiesInTheEnvelope) {
  ServerOptions options;
  options.assertion = GetParam().options;
  const Server server(options);
  const std::string answer = AskFor(server, AliceEnvelope());
  const std::string envelope = answer.substr(answer.find("\r\n\r\n") + 4);
  const VerifyResult result = VerifyXml(envelope, server.SigningCertificatePem());
  EXPECT_TRUE(result.valid) << result.reason << '\n' << answer;
}

AssertionOptions With(const std::function<void(AssertionOptions&)>& change) {
  AssertionOptions options;
  change(options);
  return options;
}

INSTANTIATE_TEST_SUITE_P(
    EveryShape, AssertionShapeTest,
    testing::Values(
        ShapeCase{"InheritedNamespaces", With([](auto& o) { o.inheritNamespaces = true; })},
        ShapeCase{"InheritedNamespacesInclusive", With([](auto& o) {
                    o.inheritNamespaces = true;
                    o.signing.canonicalization = CanonicalMode::Inclusive;
                  })},
        ShapeCase{"Indented", With([](auto& o) { o.indent = true; })},
        ShapeCase{"RsaPss",
                  With([](auto& o) { o.signing.signature = SignatureAlgorithm::RsaPssSha256; })},
        ShapeCase{"Ecdsa", With([](auto& o) {
                    o.signingKey = KeyType::EcP256;
                    o.signing.signature = SignatureAlgorithm::EcdsaSha256;
                  })},
        ShapeCase{"NoKeyInfo", With([](auto& o) { o.signing.keyInfo = KeyInfoContent::None; })}),
    [](const auto& test) { return test.param.name; });

TEST(ServerTest, SignsAfterTheFirstHookAndBeforeTheSecond) {
  Server server;
  AssertionOptions options;
  options.beforeSigning = [](std::string& text) { text = Replaced(text, "Alice", "Alicia"); };
  server.SetAssertionOptions(options);
  const std::string honest = AssertionIn(AskFor(server, AliceEnvelope()));
  EXPECT_THAT(honest, HasSubstr("Alicia"));
  EXPECT_TRUE(VerifyXml(honest, server.SigningCertificatePem()));
  options.afterSigning = [](std::string& text) { text = Replaced(text, "Alicia", "Alice"); };
  server.SetAssertionOptions(options);
  const std::string forged = AssertionIn(AskFor(server, AliceEnvelope()));
  EXPECT_THAT(forged, HasSubstr(">Alice<"));
  EXPECT_FALSE(VerifyXml(forged, server.SigningCertificatePem()));
}

TEST(ServerTest, RefusesBadCredentials) {
  const Server server;
  for (const char* user : {"alice@EXAMPLE.COM", "nobody@EXAMPLE.COM"}) {
    const std::string answer = AskFor(server, IssueEnvelope(user, "wrong"));
    EXPECT_THAT(answer, StartsWith("HTTP/1.1 500 Internal Server Error\r\n"));
    EXPECT_EQ(ElementText(answer, "faultcode"), "wst:FailedAuthentication");
    EXPECT_EQ(ElementText(answer, "faultstring"), "Invalid credentials");
  }
}

TEST(ServerTest, ReportsAnExpiredPassword) {
  const Server server;
  const std::string answer = AskFor(server, IssueEnvelope("expired@EXAMPLE.COM", "expired-secret"));
  EXPECT_EQ(ElementText(answer, "faultcode"), "wst:FailedAuthentication");
  EXPECT_THAT(ElementText(answer, "faultstring"),
              StartsWith("Password of the user logging on is expired"));
}

struct RefusedCase {
  const char* name;
  std::string from;
  std::string to;
  const char* code;
  const char* reason;
};

class RefusedRequestTest : public testing::TestWithParam<RefusedCase> {};

TEST_P(RefusedRequestTest, SaysExactlyWhatIsWrong) {
  const Server server;
  const RefusedCase& test = GetParam();
  const std::string answer =
      Ask(server, PostOf(Replaced(AliceEnvelope(), test.from, test.to), kIssueAction));
  EXPECT_THAT(answer, StartsWith("HTTP/1.1 500 Internal Server Error\r\n"));
  EXPECT_EQ(ElementText(answer, "faultcode"), test.code);
  EXPECT_THAT(ElementText(answer, "faultstring"), StartsWith(test.reason));
}

INSTANTIATE_TEST_SUITE_P(
    EveryPart, RefusedRequestTest,
    testing::Values(
        RefusedCase{"NotWellFormed", "</soapenv:Envelope>", "", "wst:InvalidRequest",
                    "The request is not well-formed: line 1"},
        RefusedCase{"UnboundPrefix", "<wst:TokenType>", "<x:TokenType xmlns:y=\"urn:y\">",
                    "wst:InvalidRequest", "The request is not well-formed"},
        RefusedCase{"OtherEnvelope", "http://schemas.xmlsoap.org/soap/envelope/", "urn:other",
                    "wst:InvalidRequest", "The request is not a SOAP 1.1 envelope"},
        RefusedCase{"TwoSecurityHeaders", "</soapenv:Header>",
                    "<wsse:Security xmlns:wsse=\"http://docs.oasis-open.org/wss/2004/01/"
                    "oasis-200401-wss-wssecurity-secext-1.0.xsd\"/></soapenv:Header>",
                    "wsse:InvalidSecurity", "More than one Security header"},
        RefusedCase{"DigestPassword", "#PasswordText", "#PasswordDigest", "wsse:InvalidSecurity",
                    "Password/@Type is not PasswordText"},
        RefusedCase{"NoSecurity", "wsse:Security xmlns:wsse=\"http",
                    "wsse:Security xmlns:wsse=\"urn", "wst:InvalidRequest",
                    "Unexpected header entry Security"},
        RefusedCase{"OtherTokenType", "<wst:TokenType>urn:", "<wst:TokenType>urx:",
                    "wst:InvalidRequest", "Unsupported TokenType: urx:"},
        RefusedCase{"OtherRequestType", "/Issue</wst:RequestType>", "/Renew</wst:RequestType>",
                    "wst:InvalidRequest", "The RequestType does not fit the SOAPAction: "},
        RefusedCase{"UnsignedPublicKey", "/Bearer", "/PublicKey", "wst:InvalidRequest",
                    "PublicKey tokens are not issued to unsigned requests"},
        RefusedCase{"BadBoolean", "Allow=\"true\"", "Allow=\"yes\"", "wst:InvalidRequest",
                    "Renewing/@Allow is neither true nor false"},
        RefusedCase{"MissingAttribute", " OK=\"false\"", "", "wst:InvalidRequest",
                    "Missing attribute OK on Renewing"},
        RefusedCase{"UnexpectedAttribute", " OK=\"false\"", " OK=\"false\" X=\"1\"",
                    "wst:InvalidRequest", "Unexpected attribute X on Renewing"},
        RefusedCase{"OutOfOrder", "<wst:Delegatable>true</wst:Delegatable>",
                    "<wst:Participants/><wst:Delegatable>true</wst:Delegatable>",
                    "wst:InvalidRequest",
                    "Expected Delegatable (http://docs.oasis-open.org/ws-sx/ws-trust/200512) in "
                    "RequestSecurityToken, found Participants"},
        RefusedCase{"UnknownElement", "</wst:RequestSecurityToken>",
                    "<wst:Claims/></wst:RequestSecurityToken>", "wst:InvalidRequest",
                    "Unexpected element Claims in RequestSecurityToken"},
        RefusedCase{"StrayText", "</wst:RequestSecurityToken>", "x</wst:RequestSecurityToken>",
                    "wst:InvalidRequest", "Unexpected text in RequestSecurityToken"},
        RefusedCase{"OctetsAfterANul", "</soapenv:Envelope>",
                    "</soapenv:Envelope>" + std::string("\0<", 2), "wst:InvalidRequest",
                    "The request is not well-formed: there is a character 0"},
        RefusedCase{"InstructionBefore", "<soapenv:Envelope", "<?x y?><soapenv:Envelope",
                    "wst:InvalidRequest", "The request contains a processing instruction"},
        RefusedCase{"InstructionInBody", "<wst:TokenType>", "<?x y?><wst:TokenType>",
                    "wst:InvalidRequest", "The request contains a processing instruction"}),
    [](const auto& test) { return test.param.name; });

TEST(ServerTest, RefusesAStaleTimestamp) {
  const Server server;
  const std::string envelope = AliceEnvelope();
  const std::size_t end = envelope.find("</wsu:Timestamp>");
  const std::string timestamp = envelope.substr(0, end);
  const auto with = [&](long created, long expires) {
    const std::string period = "<wsu:Created>" + TimeFromNow(created) +
                               "</wsu:Created><wsu:Expires>" + TimeFromNow(expires) +
                               "</wsu:Expires>";
    const std::string head = timestamp.substr(0, timestamp.find("<wsu:Created>"));
    return AskFor(server, head + period + envelope.substr(end));
  };
  EXPECT_THAT(with(-30, 30), StartsWith("HTTP/1.1 200"));
  EXPECT_EQ(ElementText(with(-600, -300), "faultstring"), "The Timestamp has expired");
  EXPECT_EQ(ElementText(with(300, 600), "faultstring"), "The Timestamp is in the future");
  EXPECT_EQ(ElementText(with(0, 0), "faultstring"), "The Timestamp expires before it was created");
}

TEST(ServerTest, RefusesALifetimeThatHasEnded) {
  const Server server;
  const std::string envelope = AliceEnvelope();
  const std::size_t from = envelope.find("<wst:Lifetime");
  const std::string lifetime = envelope.substr(from, envelope.find("</wst:Lifetime>") - from);
  const auto until = [&](long seconds) {
    const std::string head = lifetime.substr(0, lifetime.find("<wsu:Created>"));
    return AskFor(server, Replaced(envelope, lifetime,
                                   head + "<wsu:Created>" + TimeFromNow(-7200) +
                                       "</wsu:Created><wsu:Expires>" + TimeFromNow(seconds) +
                                       "</wsu:Expires>"));
  };
  EXPECT_THAT(until(-30), StartsWith("HTTP/1.1 200 ")) << "The clocks may differ by a minute";
  EXPECT_EQ(ElementText(until(-300), "faultcode"), "wst:InvalidTimeRange");
  EXPECT_EQ(ElementText(until(-300), "faultstring"), "The Lifetime has ended");
}

TEST(ServerTest, KeepsALogOfRequests) {
  Server server;
  EXPECT_THROW(server.LastRequest(), std::out_of_range);
  RawClient client(server.HttpPort());
  const std::string envelope = AliceEnvelope();
  for (int i = 0; i < 2; ++i) {
    client.Send(PostOf(envelope, kIssueAction));
    EXPECT_THAT(client.ReadAnswer(), StartsWith("HTTP/1.1 200"));
  }
  const std::vector<ReceivedRequest> requests = server.Requests();
  ASSERT_EQ(requests.size(), 2U);
  EXPECT_EQ(requests[0].connectionId, requests[1].connectionId);
  EXPECT_EQ(requests[1].ordinalOnConnection, 2U);
  EXPECT_EQ(requests[1].method, "POST");
  EXPECT_EQ(requests[1].target, "/sts");
  EXPECT_EQ(requests[1].body, envelope);
  EXPECT_EQ(requests[1].head + requests[1].body, PostOf(envelope, kIssueAction));
  EXPECT_EQ(requests[1].Header("soapaction"), std::string("\"") + kIssueAction + "\"");
  EXPECT_EQ(requests[1].answeredStatus, 200);
  EXPECT_FALSE(requests[1].overTls);
  const Counters counters = server.GetCounters();
  EXPECT_EQ(counters.connectionsAccepted, 1U);
  EXPECT_EQ(counters.requests, 2U);
  EXPECT_EQ(counters.tokensIssued, 2U);
  server.ClearRequests();
  EXPECT_THAT(server.Requests(), IsEmpty());
}

TEST(ServerTest, ListensOnTheOtherLoopbackAddress) {
  ServerOptions options;
  options.address = "::1";
  const Server server(options);
  EXPECT_THAT(server.HttpUrl("/x"), StartsWith("http://[::1]:"));
  RawClient client(server.HttpPort(), "::1");
  client.Send(PostOf(AliceEnvelope(), kIssueAction));
  EXPECT_THAT(client.ReadAnswer(), StartsWith("HTTP/1.1 200"));
}

TEST(ServerTest, StopsWithIdleConnectionsOpen) {
  auto server = std::make_unique<Server>();
  RawClient idle(server->HttpPort());
  RawClient halfway(server->HttpPort());
  halfway.Send("POST / HTTP/1.1\r\n");
  RawClient silentTls(server->HttpsPort());
  ASSERT_TRUE(
      server->WaitUntil([](const Counters& counters) { return counters.connectionsOpen == 3; }));
  server.reset();
  EXPECT_EQ(idle.ReadToEnd(), "");
}

}  // namespace
}  // namespace DevSts::Testing
