#include "devsts/negotiation.h"

#include <array>
#include <cstddef>
#include <stdexcept>
#include <string>
#include <thread>
#include <vector>

#include <gmock/gmock.h>
#include <gssapi/gssapi_ext.h>
#include <gtest/gtest.h>

#include "expect_fault.h"
#include "negotiation_fixture.h"
#include "raw_client.h"
#include "signed_request.h"

namespace DevSts::Testing {
namespace {

using testing::AllOf;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::Not;
using testing::StartsWith;

constexpr char kGranted[] = "<wst:RequestSecurityTokenResponseCollection>";
constexpr char kNextLegAnswer[] = "/200512\"><wst:RequestSecurityTokenResponse Context=";
// A NegTokenResp that contains only the state accept-incomplete.
constexpr char kAcceptIncomplete[] = "\xa1\x07\x30\x05\xa0\x03\x0a\x01\x01";

// The object identifier of Kerberos (RFC 4121, section 4.1).
constexpr char kKerberos[] = "\x06\x09\x2a\x86\x48\x86\xf7\x12\x01\x02\x02";

class NegotiationTest : public NegotiationFixture {};

// The answer to a login with one leg.
std::string LogIn(const Server& server, const std::string& cache, const char* service) {
  NegotiationClient client(server);
  GssClient gss(cache, service);
  return client.SendFirst(gss.Step());
}

std::string LoggedInAs(const std::string& answer) {
  return ElementText(AssertionIn(answer), "saml2:NameID");
}

TEST_F(NegotiationTest, LogsInWithOneLeg) {
  const Server server(Options());
  NegotiationClient client(server);
  GssClient gss(alice, kService);
  const std::string answer = client.SendFirst(gss.Step());
  ASSERT_THAT(answer, StartsWith("HTTP/1.1 200 OK\r\n"));
  EXPECT_THAT(answer, HasSubstr(kGranted));
  EXPECT_EQ(ContextIn(answer), client.context);
  const std::string assertion = AssertionIn(answer);
  EXPECT_EQ(ElementText(assertion, "saml2:NameID"), "alice@EXAMPLE.COM");
  EXPECT_EQ(ElementText(assertion, "saml2:AuthnContextClassRef"),
            "urn:oasis:names:tc:SAML:2.0:ac:classes:Kerberos");
  EXPECT_THAT(assertion, HasSubstr(">EXAMPLE\\staff<"));
  EXPECT_TRUE(VerifyXml(assertion, server.SigningCertificatePem()));
  EXPECT_THAT(gss.Step(LegIn(answer)), IsEmpty());
  EXPECT_TRUE(gss.IsDone());
}

TEST_F(NegotiationTest, LogsInAClientThatRequestsNoProofOfTheService) {
  const Server server(Options());
  NegotiationClient client(server);
  GssClient gss(alice, kService, GSS_C_INTEG_FLAG);
  EXPECT_EQ(LoggedInAs(client.SendFirst(gss.Step())), "alice@EXAMPLE.COM");
}

// With DCE_STYLE (RFC 4757, section 7.1), Kerberos itself has a third message.
TEST_F(NegotiationTest, TakesAsManyLegsAsTheMechanismNeeds) {
  const Server server(Options());
  NegotiationClient client(server);
  GssClient gss(alice, kService, GssClient::kUsualFlags | GSS_C_DCE_STYLE);
  const std::string first = client.SendFirst(gss.Step());
  EXPECT_THAT(first, AllOf(StartsWith("HTTP/1.1 200 OK\r\n"), HasSubstr(kNextLegAnswer),
                           Not(HasSubstr("Assertion"))));
  EXPECT_EQ(ContextIn(first), client.context);
  EXPECT_EQ(server.OpenNegotiations(), 1U);
  const std::string second = client.SendNext(gss.Step(LegIn(first)));
  EXPECT_EQ(LoggedInAs(second), "alice@EXAMPLE.COM");
  EXPECT_EQ(ContextIn(second), client.context);
  EXPECT_EQ(server.OpenNegotiations(), 0U);
}

TEST_F(NegotiationTest, RequestsTheSignatureOfTheMechanisms) {
  Server server(Options());
  server.SetNegotiationScript({.requestMic = true});
  NegotiationClient client(server);
  GssClient gss(alice, kService);
  const std::string first = client.SendFirst(gss.Step());
  EXPECT_THAT(first, HasSubstr(kNextLegAnswer));
  const std::string leg = gss.Step(LegIn(first));
  EXPECT_THAT(leg, Not(IsEmpty()));
  EXPECT_TRUE(gss.IsDone());
  const std::string second = client.SendNext(leg);
  EXPECT_EQ(LoggedInAs(second), "alice@EXAMPLE.COM");
  EXPECT_THAT(second, Not(HasSubstr("BinaryExchange")));
}

TEST_F(NegotiationTest, RefusesAWrongSignatureOfTheMechanisms) {
  Server server(Options());
  server.SetNegotiationScript({.requestMic = true});
  NegotiationClient client(server);
  GssClient gss(alice, kService);
  std::string leg = gss.Step(LegIn(client.SendFirst(gss.Step())));
  ASSERT_FALSE(leg.empty());
  leg.back() = static_cast<char>(leg.back() ^ 1);
  ExpectFault(client.SendNext(leg), "wst:FailedAuthentication",
              "The negotiation failed: A token had an invalid Message Integrity Check (MIC)");
  EXPECT_EQ(server.OpenNegotiations(), 0U);
}

TEST_F(NegotiationTest, RefusesALegWithoutTheSignatureOfTheMechanisms) {
  struct Case {
    std::string leg;
    const char* code;
    const char* reason;
  };
  const std::vector<Case> cases = {
      {kAcceptIncomplete, "wst:FailedAuthentication",
       "The signature of the list of mechanisms is missing"},
      {"", "wst:InvalidRequest", "The leg is not readable: the message ends early"},
      {"no token at all", "wst:InvalidRequest", "The leg is not readable"},
      {"\xa1\x07\x30\x05\xa0\x7f\x0a\x01\x01", "wst:InvalidRequest",
       "The leg is not readable: the message ends early"},
      {"\xa1\x85\x01\x01\x01\x01\x01", "wst:InvalidRequest",
       "The leg is not readable: a length is not readable"},
      {"\xa1\x03\x04\x01\x01", "wst:InvalidRequest",
       "The leg is not readable: another element was expected"},
  };
  Server server(Options());
  server.SetNegotiationScript({.requestMic = true});
  for (const Case& wrong : cases) {
    NegotiationClient client(server);
    GssClient gss(alice, kService);
    client.SendFirst(gss.Step());
    ExpectFault(client.SendNext(wrong.leg), wrong.code, wrong.reason);
  }
}

TEST_F(NegotiationTest, RequestsMoreLegsWhenTheLoginIsComplete) {
  Server server(Options());
  server.SetNegotiationScript({.moreLegs = 3});
  NegotiationClient client(server);
  GssClient gss(alice, kService);
  std::string answer = client.SendFirst(gss.Step());
  gss.Step(LegIn(answer));
  EXPECT_TRUE(gss.IsDone());
  for (int i = 0; i < 2; ++i) {
    answer = client.SendNext(i == 0 ? "" : "anything");
    EXPECT_THAT(answer, HasSubstr(kNextLegAnswer));
    EXPECT_EQ(LegIn(answer), kAcceptIncomplete);
    EXPECT_EQ(ContextIn(answer), client.context);
  }
  answer = client.SendNext("");
  EXPECT_EQ(LoggedInAs(answer), "alice@EXAMPLE.COM");
  EXPECT_THAT(answer, Not(HasSubstr("BinaryExchange")));
}

TEST_F(NegotiationTest, RecordsAndCountsLegs) {
  Server server(Options());
  server.SetNegotiationScript({.requestMic = true, .moreLegs = 1});
  NegotiationClient client(server);
  GssClient gss(alice, kService);
  const std::string opening = gss.Step();
  client.SendFirst(opening);
  client.SendNext("");
  const std::vector<ReceivedRequest> requests = server.Requests();
  ASSERT_EQ(requests.size(), 2U);
  ASSERT_TRUE(requests[0].leg.has_value());
  EXPECT_EQ(requests[0].leg->context, client.context);
  EXPECT_EQ(requests[0].leg->ordinal, 1U);
  EXPECT_EQ(requests[0].leg->octets, opening);
  EXPECT_EQ(requests[1].leg->ordinal, 2U);
  EXPECT_EQ(requests[1].Header("Cookie"), client.cookie);
  client.SendNext("");
  EXPECT_EQ(server.LastRequest().leg->ordinal, 0U) << "the negotiation had failed";

  NegotiationClient second(server);
  GssClient secondGss(bob, kService);
  second.SendNext(secondGss.Step(LegIn(second.SendFirst(secondGss.Step()))));
  second.SendNext("");
  EXPECT_EQ(server.LastRequest().leg->ordinal, 3U);
  const Counters counters = server.GetCounters();
  EXPECT_EQ(counters.negotiations, 2U);
  EXPECT_EQ(counters.negotiationLegs, 5U);
  EXPECT_EQ(counters.negotiatedTokens, 1U);
}

TEST_F(NegotiationTest, BindsTheTokenToTheKeyThatSignedTheFirstLeg) {
  Server server(Options());
  server.SetNegotiationScript({.requestMic = true});
  NegotiationClient client(server);
  GssClient gss(alice, kService);
  const Credential holder = Holder();
  // wst:UseKey comes before wst:BinaryExchange.
  const std::string body = FirstLegBody(client.context, gss.Step(), "PublicKey", kUseKey);
  const std::string first = client.SendFirstEnvelope(Sign(ByCertificate(holder, body), holder));
  const std::string answer = client.SendNext(gss.Step(LegIn(first)));
  EXPECT_EQ(LoggedInAs(answer), "alice@EXAMPLE.COM");
  EXPECT_THAT(AssertionIn(answer), HasSubstr("urn:oasis:names:tc:SAML:2.0:cm:holder-of-key"));
}

TEST_F(NegotiationTest, IssuesWhatTheFirstLegRequested) {
  Server server(Options());
  const std::string token = AssertionIn(Ask(server, AliceEnvelope()));
  server.SetNegotiationScript({.requestMic = true});
  NegotiationClient client(server);
  GssClient gss(bob, kService);
  const std::string first = client.SendFirst(gss.Step(), ActAs(token));
  const std::string assertion = AssertionIn(client.SendNext(gss.Step(LegIn(first))));
  EXPECT_EQ(ElementText(assertion, "saml2:NameID"), "alice@EXAMPLE.COM");
  EXPECT_THAT(assertion, HasSubstr(">bob@EXAMPLE.COM</saml2:NameID></del:Delegate>"));
}

TEST_F(NegotiationTest, ChecksAnActAsTokenWhenTheLoginIsComplete) {
  Server server(Options());
  const std::string token = AssertionIn(Ask(server, AliceEnvelope()));
  server.SetNegotiationScript({.requestMic = true});
  NegotiationClient client(server);
  GssClient gss(bob, kService);
  const std::string first = client.SendFirst(gss.Step(), ActAs(token));
  server.Revoke(IdOfAssertion(token));
  ExpectFault(client.SendNext(gss.Step(LegIn(first))), "wsse:InvalidSecurityToken",
              "The ActAs token");
}

TEST_F(NegotiationTest, MapsPrincipalsToUsers) {
  ServerOptions options = Options();
  options.negotiation.principals = {{"carol@EXAMPLE.COM", "alice@EXAMPLE.COM"},
                                    {"bob@EXAMPLE.COM", "nobody@EXAMPLE.COM"}};
  const Server server(options);
  const std::string answer = LogIn(server, carol, kService);
  EXPECT_EQ(LoggedInAs(answer), "alice@EXAMPLE.COM");
  ExpectFault(LogIn(server, bob, kService), "wst:FailedAuthentication",
              "The principal belongs to no user: bob@EXAMPLE.COM");
}

TEST_F(NegotiationTest, RefusesAnUnknownPrincipal) {
  const Server server(Options());
  ExpectFault(LogIn(server, carol, kService), "wst:FailedAuthentication",
              "The principal belongs to no user: carol@EXAMPLE.COM");
  EXPECT_EQ(server.OpenNegotiations(), 0U);
}

TEST_F(NegotiationTest, RefusesNegotiationsWithoutAKeytab) {
  const Server server;
  NegotiationClient client(server);
  GssClient gss(alice, kService);
  ExpectFault(client.SendFirst(gss.Step()), "wst:RequestFailed",
              "This service does not negotiate: it has no keytab");
  ExpectFault(client.SendNext("leg"), "wst:RequestFailed",
              "This service does not negotiate: it has no keytab");
}

TEST_F(NegotiationTest, DoesNotStartWithoutItsKeytab) {
  ServerOptions options;
  options.negotiation.keytab = realm->Folder() + "/missing.keytab";
  try {
    const Server server(options);
    FAIL() << "The server started";
  } catch (const std::runtime_error& error) {
    EXPECT_THAT(error.what(), HasSubstr("missing.keytab"));
  }
}

TEST_F(NegotiationTest, RefusesATicketForAKeyThatItDoesNotHave) {
  ServerOptions options;
  options.negotiation.keytab = realm->AddKeytab("HTTP/elsewhere");
  const Server server(options);
  ExpectFault(LogIn(server, alice, kService), "wst:FailedAuthentication",
              "The negotiation failed: Request ticket server HTTP/localhost@EXAMPLE.COM not found "
              "in keytab (ticket kvno 2)");
}

TEST_F(NegotiationTest, RefusesATicketForALaterKey) {
  ServerOptions options;
  options.negotiation.keytab = realm->AddKeytab("HTTP/changed");
  realm->AddKeytab("HTTP/changed");  // another key with a higher number
  const Server server(options);
  ExpectFault(LogIn(server, alice, "HTTP/changed@EXAMPLE.COM"), "wst:FailedAuthentication",
              "The negotiation failed: Request ticket server HTTP/changed@EXAMPLE.COM kvno 3 not "
              "found in keytab; keytab is likely out of date");
}

TEST_F(NegotiationTest, RefusesAReplayedLeg) {
  const Server server(Options());
  NegotiationClient client(server);
  GssClient gss(alice, kService);
  const std::string leg = gss.Step();
  EXPECT_EQ(LoggedInAs(client.SendFirst(leg)), "alice@EXAMPLE.COM");
  NegotiationClient thief(server);
  ExpectFault(thief.SendFirst(leg), "wst:FailedAuthentication",
              "The negotiation failed: Request is a replay");
}

TEST_F(NegotiationTest, RefusesInvalidLegs) {
  const Server server(Options());
  const std::vector<std::string> legs = {"garbage", std::string(3000, '\0'),
                                         std::string("\x60\x82\xff\xff", 4), kAcceptIncomplete};
  for (const std::string& leg : legs) {
    NegotiationClient client(server);
    ExpectFault(client.SendFirst(leg), "wst:InvalidRequest",
                "The negotiation failed: Invalid token was supplied");
  }
  NegotiationClient client(server);
  ExpectFault(client.SendFirst(""), "wst:InvalidRequest", "The BinaryExchange contains no leg");
  EXPECT_EQ(server.OpenNegotiations(), 0U);
}

// Kerberos is named first in the list of mechanisms, then at the start of its own message.
TEST_F(NegotiationTest, RefusesKerberosOutsideSpnego) {
  const Server server(Options());
  NegotiationClient client(server);
  GssClient gss(alice, kService);
  const std::string leg = gss.Step();
  const std::size_t listed = leg.find(kKerberos);
  const std::size_t named = leg.find(kKerberos, listed + 1);
  ASSERT_NE(named, std::string::npos);
  const std::string token = leg.substr(named - 4);  // with the tag and three octets of length
  ASSERT_EQ(token[0], '\x60');
  ExpectFault(client.SendFirst(token), "wst:FailedAuthentication",
              "The negotiation failed: No credentials were supplied, or the credentials were "
              "unavailable or inaccessible");
}

TEST_F(NegotiationTest, KeepsInterleavedNegotiationsApart) {
  Server server(Options());
  server.SetNegotiationScript({.requestMic = true});
  NegotiationClient first(server);
  NegotiationClient second(server);
  GssClient firstGss(alice, kService);
  GssClient secondGss(bob, kService);
  const std::string toFirst = LegIn(first.SendFirst(firstGss.Step()));
  const std::string toSecond = LegIn(second.SendFirst(secondGss.Step()));
  EXPECT_EQ(server.OpenNegotiations(), 2U);
  EXPECT_NE(first.cookie, second.cookie);
  EXPECT_EQ(LoggedInAs(first.SendNext(firstGss.Step(toFirst))), "alice@EXAMPLE.COM");
  EXPECT_EQ(LoggedInAs(second.SendNext(secondGss.Step(toSecond))), "bob@EXAMPLE.COM");
}

TEST_F(NegotiationTest, NegotiatesOnThreadsInParallel) {
  Server server(Options());
  server.SetNegotiationScript({.requestMic = true, .moreLegs = 1});
  constexpr int kThreads = 8;
  constexpr int kLogins = 4;
  std::array<int, kThreads> right{};
  const auto work = [&](std::size_t i) {
    const bool isAlice = i % 2 == 0;
    for (int login = 0; login < kLogins; ++login) {
      NegotiationClient client(server);
      GssClient gss(isAlice ? alice : bob, kService);
      const std::string leg = gss.Step(LegIn(client.SendFirst(gss.Step())));
      client.SendNext(leg);
      const std::string user = LoggedInAs(client.SendNext(""));
      right.at(i) += user == (isAlice ? "alice@EXAMPLE.COM" : "bob@EXAMPLE.COM") ? 1 : 0;
    }
  };
  std::vector<std::thread> threads;
  for (std::size_t i = 0; i < kThreads; ++i) {
    threads.emplace_back(work, i);
  }
  for (std::thread& thread : threads) {
    thread.join();
  }
  EXPECT_THAT(right, testing::Each(kLogins));
  EXPECT_EQ(server.OpenNegotiations(), 0U);
  EXPECT_EQ(server.GetCounters().negotiatedTokens, 32U);
}

}  // namespace
}  // namespace DevSts::Testing
