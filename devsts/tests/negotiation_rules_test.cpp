// The rules for the requests of a negotiation, and the misbehaviour of the service.
#include <chrono>
#include <cstddef>
#include <memory>
#include <string>
#include <utility>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "devsts/negotiation.h"
#include "expect_fault.h"
#include "negotiation_fixture.h"
#include "raw_client.h"
#include "signed_request.h"

namespace DevSts::Testing {
namespace {

using testing::AllOf;
using testing::HasSubstr;
using testing::Not;
using testing::StartsWith;

constexpr char kUnknown[] = "No negotiation is under way in the Context ";

class NegotiationRulesTest : public NegotiationFixture {
 protected:
  // A server whose logins take two legs.
  static std::unique_ptr<Server> TwoLegServer(ServerOptions options = Options()) {
    auto server = std::make_unique<Server>(std::move(options));
    server->SetNegotiationScript({.requestMic = true});
    return server;
  }
};

// A login up to the last leg, which has not been sent.
struct StartedLogin {
  explicit StartedLogin(const Server& server, const std::string& cache, const std::string& service)
      : client(server), gss(cache, service) {
    first = client.SendFirst(gss.Step());
    last = gss.Step(LegIn(first));
  }

  NegotiationClient client;
  GssClient gss;
  std::string first;
  std::string last;
};

// The envelope with an expired Timestamp.
std::string Stale(std::string envelope) {
  const std::string end = "</wsu:Timestamp>";
  const std::size_t from = envelope.find("<wsu:Timestamp");
  const std::size_t size = envelope.find(end) + end.size() - from;
  return envelope.replace(from, size, Timestamp(-1200, -600));
}

Misbehavior Wrong(const LegMisbehavior& leg) {
  Misbehavior misbehavior;
  misbehavior.leg = leg;
  return misbehavior;
}

bool HoldsToken(const std::string& answer) {
  return !AssertionIn(answer).empty();
}

TEST_F(NegotiationRulesTest, RequiresTheCookieOfTheNegotiation) {
  const auto server = TwoLegServer();
  StartedLogin login(*server, alice, kService);
  const StartedLogin other(*server, bob, kService);
  const std::string cookie = login.client.cookie;
  for (const std::string& wrong :
       {std::string(), std::string("devsts-negotiation="), cookie + "0", other.client.cookie,
        "other-" + cookie, cookie.substr(0, cookie.size() - 1)}) {
    login.client.cookie = wrong;
    ExpectFault(login.client.SendNext(login.last), "wst:InvalidRequest",
                "The request does not have the cookie of its negotiation");
  }
  login.client.cookie = cookie + "\r\nCookie: " + cookie;
  ExpectFault(login.client.SendNext(login.last), "wst:InvalidRequest",
              "Cookie is given more than once");
  // Requests without the cookie have not ended the negotiation.
  login.client.cookie = "first=1; " + cookie + "; last=2";
  EXPECT_TRUE(HoldsToken(login.client.SendNext(login.last)));
}

TEST_F(NegotiationRulesTest, SetsACookieHiddenFromScriptsAndPlainHttp) {
  const Server server(Options());
  NegotiationClient client(server);
  GssClient gss(alice, kService);
  EXPECT_THAT(client.SendFirst(gss.Step()),
              testing::ContainsRegex("Set-Cookie: devsts-negotiation=_[0-9a-f]{32}; Path=/; "
                                     "HttpOnly\r\n"));
  RawClient secure(server.HttpsPort());
  ASSERT_EQ(secure.StartTls(server.CaCertificatePem()), X509_V_OK);
  GssClient other(alice, kService);
  secure.Send(PostOf(Envelope("", FirstLegBody("urn:uuid:secure", other.Step())), kIssueAction));
  EXPECT_THAT(secure.ReadAnswer(),
              testing::ContainsRegex("Set-Cookie: devsts-negotiation=_[0-9a-f]{32}; Path=/; "
                                     "HttpOnly; Secure\r\n"));
}

TEST_F(NegotiationRulesTest, SetsNoCookieOnLaterLegs) {
  const auto server = TwoLegServer();
  StartedLogin login(*server, alice, kService);
  EXPECT_THAT(login.client.SendNext(login.last), Not(HasSubstr("Set-Cookie")));
}

TEST_F(NegotiationRulesTest, RefusesAnUnknownContext) {
  const Server server(Options());
  NegotiationClient client(server);
  ExpectFault(client.SendNext("leg"), "wst:InvalidRequest", kUnknown + client.context);
}

TEST_F(NegotiationRulesTest, ForgetsANegotiationThatHasEnded) {
  const auto server = TwoLegServer();
  StartedLogin login(*server, alice, kService);
  EXPECT_TRUE(HoldsToken(login.client.SendNext(login.last)));
  ExpectFault(login.client.SendNext(login.last), "wst:InvalidRequest", kUnknown);
}

TEST_F(NegotiationRulesTest, ForgetsANegotiationThatHasFailed) {
  const auto server = TwoLegServer();
  StartedLogin login(*server, alice, kService);
  ExpectFault(login.client.SendNext("garbage"), "wst:InvalidRequest", "The leg is not readable");
  ExpectFault(login.client.SendNext(login.last), "wst:InvalidRequest", kUnknown);
}

TEST_F(NegotiationRulesTest, DoesNotBeginTwiceInOneContext) {
  const auto server = TwoLegServer();
  StartedLogin login(*server, alice, kService);
  NegotiationClient intruder(*server);
  intruder.context = login.client.context;
  GssClient gss(bob, kService);
  ExpectFault(intruder.SendFirst(gss.Step()), "wst:InvalidRequest",
              "The Context is in use: " + login.client.context);
  EXPECT_TRUE(HoldsToken(login.client.SendNext(login.last)));
}

TEST_F(NegotiationRulesTest, HandlesOneLegOfANegotiationAtATime) {
  const auto server = TwoLegServer();
  StartedLogin login(*server, alice, kService);
  std::string meanwhile;
  AssertionOptions shape;
  shape.beforeSigning = [&](std::string&) { meanwhile = login.client.SendNext(login.last); };
  server->SetAssertionOptions(shape);
  EXPECT_TRUE(HoldsToken(login.client.SendNext(login.last)));
  ExpectFault(meanwhile, "wst:InvalidRequest", "The negotiation is busy with another leg");
}

TEST_F(NegotiationRulesTest, ForgetsTheOldestWhenThereAreTooMany) {
  ServerOptions options = Options();
  options.negotiation.limit = 2;
  const auto server = TwoLegServer(options);
  StartedLogin first(*server, alice, kService);
  StartedLogin second(*server, alice, kService);
  StartedLogin third(*server, alice, kService);
  EXPECT_EQ(server->OpenNegotiations(), 2U);
  ExpectFault(first.client.SendNext(first.last), "wst:InvalidRequest", kUnknown);
  EXPECT_TRUE(HoldsToken(second.client.SendNext(second.last)));
  EXPECT_TRUE(HoldsToken(third.client.SendNext(third.last)));
}

TEST_F(NegotiationRulesTest, ForgetsANegotiationThatTakesTooLong) {
  ServerOptions options = Options();
  options.negotiation.maxAge = std::chrono::milliseconds(0);
  const auto server = TwoLegServer(options);
  StartedLogin login(*server, alice, kService);
  ExpectFault(login.client.SendNext(login.last), "wst:InvalidRequest", kUnknown);
}

TEST_F(NegotiationRulesTest, AppliesTheRulesOfRequestsToFirstLegs) {
  const Server server(Options());
  const std::string good = Envelope("", FirstLegBody("urn:uuid:rules", "leg"));
  struct Case {
    std::string envelope;
    const char* code;
    const char* reason;
  };
  const std::vector<Case> cases = {
      {Stale(good), "wsu:MessageExpired", "The Timestamp has expired"},
      {Replaced(good, " Context=\"urn:uuid:rules\"", ""), "wst:InvalidRequest",
       "Missing attribute Context on RequestSecurityToken"},
      {Replaced(good, "urn:uuid:rules", ""), "wst:InvalidRequest",
       "The Context is not an absolute URI: "},
      {Replaced(good, "urn:uuid:rules", "rules"), "wst:InvalidRequest",
       "The Context is not an absolute URI: rules"},
      {Replaced(good, " Context=", " Other=\"1\" Context="), "wst:InvalidRequest",
       "Unexpected attribute Other on RequestSecurityToken"},
      {Replaced(good, Exchange("leg"), ""), "wst:InvalidRequest",
       "Unexpected attribute Context on RequestSecurityToken"},
      {Replaced(good, Exchange("leg"), Exchange("leg") + Exchange("leg")), "wst:InvalidRequest",
       "Unexpected element BinaryExchange in RequestSecurityToken"},
      {Replaced(good, "#Base64Binary", "#HexBinary"), "wst:InvalidRequest",
       "BinaryExchange/@EncodingType is not Base64Binary"},
      {Replaced(good, "trust/spnego", "trust/tlsnego"), "wst:InvalidRequest",
       "BinaryExchange/@ValueType is not SPNEGO's"},
      {Replaced(good, ToBase64("leg"), "****"), "wst:InvalidRequest",
       "The BinaryExchange is not Base64"},
      {Replaced(good, ToBase64("leg"), "bG=n"), "wst:InvalidRequest",
       "The BinaryExchange is not Base64"},
      {Replaced(good, "</wsse:Security>",
                UsernameToken("alice@EXAMPLE.COM", "secret") + "</wsse:Security>"),
       "wsse:InvalidSecurity", "A UsernameToken is not expected in a negotiation"},
      {Envelope("", FirstLegBody("urn:uuid:rules", "leg", "PublicKey", kUseKey)),
       "wst:InvalidRequest", "PublicKey tokens are not issued to unsigned requests"},
  };
  for (const Case& wrong : cases) {
    NegotiationClient client(server);
    ExpectFault(client.SendFirstEnvelope(wrong.envelope), wrong.code, wrong.reason);
  }
  EXPECT_EQ(server.GetCounters().negotiations, 0U);
}

TEST_F(NegotiationRulesTest, RefusesATokenInsteadOfALogin) {
  const Server server(Options());
  const Credential holder = Holder();
  const std::string token = HolderToken(server, holder);
  NegotiationClient client(server);
  const std::string body = FirstLegBody(client.context, "leg", "PublicKey");
  ExpectFault(client.SendFirstEnvelope(Sign(ByToken(token, body), holder)), "wsse:InvalidSecurity",
              "A signature by a token is not expected in a negotiation");
}

TEST_F(NegotiationRulesTest, AppliesTheRulesToLaterLegsAndWaitsForAValidOne) {
  const auto server = TwoLegServer();
  StartedLogin login(*server, alice, kService);
  const std::string body = LaterLegBody(login.client.context, login.last);
  const std::string good = Envelope("", body);
  const Credential holder = Holder();
  struct Case {
    std::string envelope;
    const char* code;
    const char* reason;
  };
  const std::vector<Case> cases = {
      {Stale(good), "wsu:MessageExpired", "The Timestamp has expired"},
      {Envelope(UsernameToken("alice@EXAMPLE.COM", "secret"), body), "wsse:InvalidSecurity",
       "Neither a login nor a signature is expected in a later leg of a negotiation"},
      {Sign(ByCertificate(holder, body), holder), "wsse:InvalidSecurity",
       "Neither a login nor a signature is expected in a later leg of a negotiation"},
      {Envelope("", IssueBody("Bearer")), "wst:InvalidRequest",
       "Expected RequestSecurityTokenResponse"},
      {Replaced(good, "</wst:BinaryExchange>", "</wst:BinaryExchange><wst:More/>"),
       "wst:InvalidRequest", "Unexpected element More in RequestSecurityTokenResponse"},
      {Replaced(good, " Context=", " Other=\"1\" Context="), "wst:InvalidRequest",
       "Unexpected attribute Other on RequestSecurityTokenResponse"},
  };
  for (const Case& wrong : cases) {
    const std::string request = Replaced(PostOf(wrong.envelope, kContinueAction),
                                         "Host:", "Cookie: " + login.client.cookie + "\r\nHost:");
    RawClient client(server->HttpPort());
    client.Send(request);
    ExpectFault(client.ReadAnswer(), wrong.code, wrong.reason);
  }
  EXPECT_TRUE(HoldsToken(login.client.SendNext(login.last)));
}

TEST_F(NegotiationRulesTest, FailsAtTheLegThatTheScriptNames) {
  Server server(Options());
  for (const unsigned leg : {1U, 2U, 3U}) {
    NegotiationScript script;
    script.moreLegs = 5;
    script.failAtLeg = leg;
    script.failure.faultString = "As configured";
    server.SetNegotiationScript(script);
    NegotiationClient client(server);
    GssClient gss(alice, kService);
    std::string answer = client.SendFirst(gss.Step());
    for (unsigned sent = 1; sent < leg; ++sent) {
      EXPECT_THAT(answer, StartsWith("HTTP/1.1 200 OK\r\n"));
      answer = client.SendNext("");
    }
    ExpectFault(answer, "wst:FailedAuthentication", "As configured");
    EXPECT_EQ(server.OpenNegotiations(), 0U);
  }
}

TEST_F(NegotiationRulesTest, ForgetsTheNegotiationIfConfigured) {
  const auto server = TwoLegServer();
  server->MisbehaveNext(Wrong({.forget = true}));
  StartedLogin login(*server, alice, kService);
  EXPECT_EQ(ContextIn(login.first), login.client.context);
  ExpectFault(login.client.SendNext(login.last), "wst:InvalidRequest", kUnknown);
}

TEST_F(NegotiationRulesTest, AnswersWithAnEmptyContextIfConfigured) {
  const auto server = TwoLegServer();
  server->MisbehaveNext(Wrong({.context = ""}));
  const StartedLogin login(*server, alice, kService);
  EXPECT_EQ(ContextIn(login.first), "");
  EXPECT_EQ(server->OpenNegotiations(), 0U);
}

TEST_F(NegotiationRulesTest, ContinuesInAnotherContextIfConfigured) {
  const auto server = TwoLegServer();
  server->MisbehaveNext(Wrong({.context = "urn:uuid:another"}));
  StartedLogin login(*server, alice, kService);
  EXPECT_EQ(ContextIn(login.first), "urn:uuid:another");
  ExpectFault(login.client.SendNext(login.last), "wst:InvalidRequest",
              kUnknown + login.client.context);
  login.client.context = "urn:uuid:another";
  const std::string answer = login.client.SendNext(login.last);
  EXPECT_TRUE(HoldsToken(answer));
  EXPECT_EQ(ContextIn(answer), "urn:uuid:another");
}

TEST_F(NegotiationRulesTest, OmitsTheContextIfConfigured) {
  Server server(Options());
  server.MisbehaveNext(Wrong({.omitContext = true}));
  NegotiationClient client(server);
  GssClient gss(alice, kService);
  EXPECT_EQ(ContextIn(client.SendFirst(gss.Step())), "none");
}

TEST_F(NegotiationRulesTest, AnswersWithAnotherLegIfConfigured) {
  const auto server = TwoLegServer();
  server->MisbehaveNext(Wrong({.leg = "no leg"}));
  server->MisbehaveNext(Wrong({.leg = ""}));
  server->MisbehaveNext(Wrong({.omitLeg = true}));
  const auto firstAnswer = [&] {
    NegotiationClient client(*server);
    GssClient gss(alice, kService);
    return client.SendFirst(gss.Step());
  };
  EXPECT_EQ(LegIn(firstAnswer()), "no leg");
  EXPECT_THAT(firstAnswer(), HasSubstr("trust/spnego\"/></wst:RequestSecurityTokenResponse>"));
  EXPECT_THAT(firstAnswer(), AllOf(HasSubstr("<wst:RequestSecurityTokenResponse Context="),
                                   Not(HasSubstr("BinaryExchange"))));
}

TEST_F(NegotiationRulesTest, SetsNoCookieIfConfiguredButStillRequiresIt) {
  const auto server = TwoLegServer();
  server->MisbehaveNext(Wrong({.omitCookie = true}));
  StartedLogin login(*server, alice, kService);
  EXPECT_EQ(login.client.cookie, "");
  ExpectFault(login.client.SendNext(login.last), "wst:InvalidRequest",
              "The request does not have the cookie of its negotiation");
}

}  // namespace
}  // namespace DevSts::Testing
