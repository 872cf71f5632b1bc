#include <chrono>
#include <cstddef>
#include <filesystem>
#include <future>
#include <memory>
#include <string>
#include <thread>
#include <vector>

#include <gmock/gmock.h>
#include <gssapi/gssapi.h>
#include <gtest/gtest.h>
#include <sys/socket.h>

#include <ssoclient/exceptions.h>
#include <ssoclient/gssapi_negotiation_handler.h>
#include <tarnik/core/exception.h>

#include "calls/freed_memory.h"
#include "gss_acceptor.h"
#include "gssapi_negotiation_handler_impl.h"
#include "realm_fixture.h"
#include "replaced_calls.h"
#include "support/thrown_message.h"
#include "talkative_kdc.h"
#include "transport/loopback_server.h"

namespace SsoClient::Testing {
namespace {

using namespace std::chrono_literals;

using Leg = std::vector<unsigned char>;

constexpr char kAlice[] = "alice@EXAMPLE.COM";
constexpr char kNoNegotiation[] =
    "The negotiation handler was given a leg of the service, but no negotiation is in progress.";

std::string Failed(const std::string& major, const std::string& minor) {
  return "The login at `HTTP@sts.example' failed: " + major + " (" + minor + ").";
}

std::string Failed(const std::string& minor) {
  return Failed("Unspecified GSS failure.  Minor code may provide more information", minor);
}

class GssapiNegotiationHandlerTest : public RealmFixture {
 protected:
  static void ExpectLogin(GssapiNegotiationHandler& handler) {
    Testing::ExpectLogin(handler, serviceKeytab, kAlice);
  }

  // The service's answer to the first leg of a negotiation.
  static Leg AnswerTo(GssapiNegotiationHandler& handler) {
    return GssAcceptor(serviceKeytab).Accept(*handler.Negotiate({}));
  }

  // Runs on a new thread, because the libraries keep the texts of earlier failures per thread.
  static std::string Failure(GssapiNegotiationHandler& handler, const Leg& leg = {}) {
    std::string message;
    std::thread([&] {
      message = ThrownMessage<SsoException>([&] { handler.Negotiate(leg); });
    }).join();
    return message;
  }

  // Expects that the handler has forgotten the negotiation and can begin another.
  static void ExpectServesAgain(GssapiNegotiationHandler& handler) {
    EXPECT_FALSE(handler.IsEstablished());
    EXPECT_EQ(ThrownMessage<Tarnik::InvalidStateException>([&] { handler.Negotiate({1}); }),
              kNoNegotiation);
    ExpectLogin(handler);
  }
};

TEST_F(GssapiNegotiationHandlerTest, ServesNegotiationsInSequence) {
  GssapiNegotiationHandlerImpl handler(ConfigOf("alice"));
  ExpectLogin(handler);
  ExpectLogin(handler);
  ExpectLogin(handler);
}

TEST_F(GssapiNegotiationHandlerTest, RequestsMutualAuthenticationAndDelegatesNothing) {
  GssapiNegotiationHandlerImpl handler(ConfigOf("alice"));
  GssAcceptor acceptor(serviceKeytab);
  acceptor.Accept(*handler.Negotiate({}));
  EXPECT_NE(acceptor.flags & GSS_C_MUTUAL_FLAG, 0U);
  EXPECT_NE(acceptor.flags & GSS_C_INTEG_FLAG, 0U);
  EXPECT_EQ(acceptor.flags & GSS_C_DELEG_FLAG, 0U);
}

TEST_F(GssapiNegotiationHandlerTest, SendsNothingAfterTheEnd) {
  GssapiNegotiationHandlerImpl handler(ConfigOf("alice"));
  const Leg answer = AnswerTo(handler);
  for (const Leg& leg : {answer, answer, Leg{1, 2, 3}}) {
    const auto last = handler.Negotiate(leg);
    ASSERT_NE(last, nullptr);
    EXPECT_TRUE(last->empty());
    EXPECT_TRUE(handler.IsEstablished());
  }
}

TEST_F(GssapiNegotiationHandlerTest, GivesUpOnAServiceThatNeverEnds) {
  GssapiNegotiationHandlerImpl handler(ConfigOf("alice"));
  const Leg answer = AnswerTo(handler);
  for (int legs = 1; legs < 100; ++legs) {
    handler.Negotiate(answer);
  }
  EXPECT_EQ(Failure(handler, answer),
            "The login at `HTTP@sts.example' failed: the service asks for more than 100 legs.");
  ExpectServesAgain(handler);
}

TEST_F(GssapiNegotiationHandlerTest, BeginsAnewWithAnEmptyLegInTheMiddle) {
  GssapiNegotiationHandlerImpl handler(ConfigOf("alice"));
  const Leg answerToTheFirst = AnswerTo(handler);
  ExpectLogin(handler);
  handler.Negotiate({});
  EXPECT_FALSE(handler.IsEstablished());
  EXPECT_EQ(Failure(handler, answerToTheFirst), Failed("Mutual authentication failed"));
  ExpectServesAgain(handler);
}

TEST_F(GssapiNegotiationHandlerTest, RefusesALegBeforeTheFirst) {
  GssapiNegotiationHandlerImpl handler(ConfigOf("alice"));
  EXPECT_EQ(ThrownMessage<Tarnik::InvalidStateException>([&] {
              handler.Negotiate({1, 2, 3});
            }),
            kNoNegotiation);
  ExpectLogin(handler);
}

TEST_F(GssapiNegotiationHandlerTest, FindsRenewedTickets) {
  auto config = ConfigOf("alice");
  const std::string fresh = config.credentialCache;
  realm->SetClock(-1h);
  config.credentialCache = realm->Login("alice", "secret");
  realm->SetClock(0s);
  GssapiNegotiationHandlerImpl handler(config);
  EXPECT_EQ(Failure(handler), Failed("Ticket expired"));
  std::filesystem::copy_file(fresh.substr(5), config.credentialCache.substr(5),
                             std::filesystem::copy_options::overwrite_existing);
  ExpectLogin(handler);
}

TEST_F(GssapiNegotiationHandlerTest, NeedsNoRealmForTicketsThatItHas) {
  GssapiNegotiationHandlerImpl handler(MachineConfig());
  Testing::ExpectLogin(handler, serviceKeytab, "machine@EXAMPLE.COM");
  realm->StopKdc();
  Testing::ExpectLogin(handler, serviceKeytab, "machine@EXAMPLE.COM");
  realm->SetClock(0s);
}

TEST_F(GssapiNegotiationHandlerTest, MayBeUsedByAnotherThreadThanItsCreator) {
  GssapiNegotiationHandlerImpl handler(ConfigOf("alice"));
  Leg answer;
  std::thread([&] { answer = AnswerTo(handler); }).join();
  std::thread([&] { handler.Negotiate(answer); }).join();
  EXPECT_TRUE(handler.IsEstablished());
}

TEST_F(GssapiNegotiationHandlerTest, ThreadsLogInSideBySide) {
  const auto alice = ConfigOf("alice");
  const auto machine = MachineConfig();
  std::vector<std::thread> threads;
  for (int i = 0; i < 3; ++i) {
    threads.emplace_back([&] {
      GssapiNegotiationHandlerImpl handler(alice);
      ExpectLogin(handler);
      ExpectLogin(handler);
    });
    threads.emplace_back([&] {
      GssapiNegotiationHandlerImpl handler(machine);
      Testing::ExpectLogin(handler, serviceKeytab, "machine@EXAMPLE.COM");
    });
    threads.emplace_back([&] {
      GssapiNegotiationHandlerImpl handler(alice);
      handler.Negotiate({});
      EXPECT_EQ(Failure(handler, EmptyAnswer(2)), Failed("An unsupported mechanism was requested",
                                                         "SPNEGO failed to negotiate a mechanism"));
      ExpectLogin(handler);
    });
  }
  for (auto& thread : threads) {
    thread.join();
  }
}

TEST_F(GssapiNegotiationHandlerTest, RefusesASecondThreadInTheSameCall) {
  GssapiNegotiationHandlerImpl handler(ConfigOf("alice"));
  std::promise<void> isInCall;
  std::promise<void> mayContinue;
  {
    const InitSecContextScript script([&] {
      isInCall.set_value();
      mayContinue.get_future().wait();
      return InitResult{GSS_S_CONTINUE_NEEDED, "leg", 0};
    });
    std::thread first([&] { EXPECT_EQ(*handler.Negotiate({}), (Leg{'l', 'e', 'g'})); });
    isInCall.get_future().wait();
    EXPECT_EQ(ThrownMessage<Tarnik::InvalidStateException>([&] { handler.Negotiate({}); }),
              "The negotiation handler is in use by another thread.");
    mayContinue.set_value();
    first.join();
  }
  ExpectLogin(handler);
}

TEST_F(GssapiNegotiationHandlerTest, ReportsThatThereAreNoCredentials) {
  auto config = ConfigOf("alice");
  config.credentialCache = "FILE:/nonexistent/other";
  GssapiNegotiationHandlerImpl handler(config);
  EXPECT_EQ(Failure(handler),
            "There are no credentials to log in with: No credentials were supplied, or the "
            "credentials were unavailable or inaccessible (No credentials cache found).");
  EXPECT_FALSE(handler.IsEstablished());
}

TEST_F(GssapiNegotiationHandlerTest, ReportsAnUnknownService) {
  auto config = ConfigOf("alice");
  config.targetService = "HTTP@unknown";
  GssapiNegotiationHandlerImpl handler(config);
  EXPECT_EQ(Failure(handler),
            "The login at `HTTP@unknown' failed: Unspecified GSS failure.  Minor code may provide "
            "more information (Server HTTP/unknown@EXAMPLE.COM not found in Kerberos database).");
}

TEST_F(GssapiNegotiationHandlerTest, ReportsClocksThatAreTooFarApart) {
  auto config = ConfigOf("alice");
  config.credentialCache = realm->Login("alice", "secret", 9h);
  realm->SetClock(1h);
  GssapiNegotiationHandlerImpl handler(config);
  EXPECT_EQ(Failure(handler), Failed("Clock skew too great"));
  realm->SetClock(0s);
  ExpectLogin(handler);
}

TEST_F(GssapiNegotiationHandlerTest, ReportsThatTheRealmDoesNotAnswer) {
  GssapiNegotiationHandlerImpl handler(ConfigOf("alice"));
  realm->StopKdc();
  EXPECT_EQ(Failure(handler), Failed("Cannot contact any KDC for realm 'EXAMPLE.COM'"));
  realm->SetClock(0s);
  ExpectLogin(handler);
}

// Kerberos waits about half a minute for a KDC.
TEST_F(GssapiNegotiationHandlerTest, DoesNotHangWithASilentRealm) {
  GssapiNegotiationHandlerImpl handler(ConfigOf("alice"));
  const auto start = std::chrono::steady_clock::now();
  {
    const LoopbackSocket kdc;  // connections are established but never accepted
    ASSERT_EQ(::listen(kdc.Descriptor(), 16), 0);
    ReplaceKdc(kdc.Port());
    EXPECT_EQ(Failure(handler), Failed("Cannot contact any KDC for realm 'EXAMPLE.COM'"));
  }
  const auto waited = std::chrono::steady_clock::now() - start;
  EXPECT_GT(waited, 5s);
  EXPECT_LT(waited, 60s);
  realm->SetClock(0s);
  ExpectLogin(handler);
}

TEST_F(GssapiNegotiationHandlerTest, ReportsThatTheServiceLacksItsKey) {
  GssapiNegotiationHandlerImpl handler(ConfigOf("alice"));
  GssAcceptor acceptor(machineKeytab);
  const Leg refusal = acceptor.Accept(*handler.Negotiate({}));
  EXPECT_THAT(acceptor.error, testing::HasSubstr("not found in keytab"));
  EXPECT_EQ(Failure(handler, refusal), Failed("The ticket isn't for us"));
  ExpectServesAgain(handler);
}

TEST_F(GssapiNegotiationHandlerTest, DoesNotRepeatTheTextOfAServicesRefusal) {
  GssapiNegotiationHandlerImpl handler(ConfigOf("alice"));
  handler.Negotiate({});
  EXPECT_EQ(Failure(handler, RefusalWith("no\r\nline")), Failed("Generic error (see e-text)"));
  ExpectServesAgain(handler);
}

TEST_F(GssapiNegotiationHandlerTest, ReportsTheTextOfAKdcsRefusalOnOneLine) {
  GssapiNegotiationHandlerImpl handler(ConfigOf("alice"));
  {
    const TalkativeKdc kdc("no\r\nline \x1b[0m");
    ReplaceKdc(kdc.Port());
    EXPECT_EQ(Failure(handler), Failed("KDC returned error string: no??line ?[0m"));
  }
  realm->SetClock(0s);
  ExpectLogin(handler);
}

TEST_F(GssapiNegotiationHandlerTest, RefusesTheProofOfAnotherNegotiation) {
  const auto config = ConfigOf("alice");
  GssapiNegotiationHandlerImpl handler(config);
  GssapiNegotiationHandlerImpl other(config);
  const Leg proof = AnswerTo(other);
  handler.Negotiate({});
  EXPECT_EQ(Failure(handler, proof), Failed("Mutual authentication failed"));
  ExpectServesAgain(handler);
}

TEST_F(GssapiNegotiationHandlerTest, LeavesNoLegInMemory) {
  GssapiNegotiationHandlerImpl handler(ConfigOf("alice"));
  auto leg = handler.Negotiate({});
  const FreedMemory memory(std::string(leg->end() - 40, leg->end()));
  leg = nullptr;
  EXPECT_EQ(memory.Finds(), 0);
}

struct BadLeg {
  const char* name;
  Leg leg;
  std::string message;
};

class BadServerLegTest : public GssapiNegotiationHandlerTest,
                         public testing::WithParamInterface<BadLeg> {};

TEST_P(BadServerLegTest, EndsTheNegotiation) {
  GssapiNegotiationHandlerImpl handler(ConfigOf("alice"));
  handler.Negotiate({});
  EXPECT_THAT(Failure(handler, GetParam().leg), testing::StartsWith(GetParam().message));
  ExpectServesAgain(handler);
}

constexpr char kBroken[] = "The login at `HTTP@sts.example' failed: Invalid token was supplied";

INSTANTIATE_TEST_SUITE_P(
    All, BadServerLegTest,
    testing::Values(BadLeg{"Garbage", {1, 2, 3}, kBroken}, BadLeg{"OneByte", {0xa1}, kBroken},
                    BadLeg{"LengthPastTheEnd", {0xa1, 0x84, 0x7f, 0xff, 0xff, 0xff, 0x30}, kBroken},
                    BadLeg{"CompleteWithoutProof", EmptyAnswer(0),
                           Failed("Invalid token was supplied",
                                  "SPNEGO acceptor did not return a valid token")},
                    BadLeg{"IncompleteWithoutLeg", EmptyAnswer(1),
                           Failed("Invalid token was supplied",
                                  "SPNEGO acceptor did not return a valid token")},
                    BadLeg{"Reject", EmptyAnswer(2),
                           Failed("An unsupported mechanism was requested",
                                  "SPNEGO failed to negotiate a mechanism")}),
    [](const auto& instance) { return instance.param.name; });

// The length of proofs varies by about a byte.
TEST_F(GssapiNegotiationHandlerTest, RefusesAProofCutAtAnyByte) {
  GssapiNegotiationHandlerImpl handler(ConfigOf("alice"));
  Leg proof = AnswerTo(handler);
  for (std::size_t missing = 1; missing < proof.size(); ++missing) {
    proof.resize(proof.size() - missing);
    EXPECT_THROW(handler.Negotiate(proof), SsoException) << missing;
    EXPECT_FALSE(handler.IsEstablished()) << missing;
    proof = AnswerTo(handler);
  }
  ExpectLogin(handler);
}

// Results that the real library cannot be made to return.

TEST_F(GssapiNegotiationHandlerTest, DoesNotWaitForTheServiceWithNothingToSend) {
  GssapiNegotiationHandlerImpl handler(ConfigOf("alice"));
  {
    const InitSecContextScript script([] { return InitResult{GSS_S_CONTINUE_NEEDED, "", 0}; });
    EXPECT_EQ(Failure(handler),
              "The login at `HTTP@sts.example' failed: it is not complete, but there is nothing to "
              "send.");
  }
  ExpectServesAgain(handler);
}

TEST_F(GssapiNegotiationHandlerTest, RequiresThatTheServiceHasProvedItself) {
  GssapiNegotiationHandlerImpl handler(ConfigOf("alice"));
  {
    const InitSecContextScript script([] {
      return InitResult{GSS_S_COMPLETE, "leg", GSS_C_INTEG_FLAG};
    });
    EXPECT_EQ(Failure(handler),
              "The login at `HTTP@sts.example' failed: the service has not proved its identity.");
  }
  ExpectServesAgain(handler);
}

TEST_F(GssapiNegotiationHandlerTest, SendsALastLegOfItsOwn) {
  GssapiNegotiationHandlerImpl handler(ConfigOf("alice"));
  int legs = 0;
  const InitSecContextScript script([&legs] {
    return ++legs < 3 ? InitResult{GSS_S_CONTINUE_NEEDED, "next", GSS_C_MUTUAL_FLAG}
                      : InitResult{GSS_S_COMPLETE, "last", GSS_C_MUTUAL_FLAG};
  });
  EXPECT_EQ(*handler.Negotiate({}), (Leg{'n', 'e', 'x', 't'}));
  EXPECT_EQ(*handler.Negotiate({1}), (Leg{'n', 'e', 'x', 't'}));
  EXPECT_FALSE(handler.IsEstablished());
  EXPECT_EQ(*handler.Negotiate({2}), (Leg{'l', 'a', 's', 't'}));
  EXPECT_TRUE(handler.IsEstablished());
  EXPECT_TRUE(handler.Negotiate({3})->empty());
  EXPECT_EQ(legs, 3);
}

constexpr char kService[] = "HTTP@sts.example";
const std::string kWithNul("a\0b", 3);

struct BadConfig {
  const char* name;
  GssapiNegotiationConfig config;
  std::string message;
};

class BadGssapiNegotiationConfigTest : public testing::TestWithParam<BadConfig> {};

TEST_P(BadGssapiNegotiationConfigTest, IsRefusedAtOnce) {
  EXPECT_EQ(ThrownMessage<Tarnik::InvalidArgumentException>(
                [] { CreateGssapiNegotiationHandler(GetParam().config); }),
            "GssapiNegotiationConfig: " + GetParam().message);
}

std::string NotOfTheForm(const std::string& service) {
  return "the target service `" + service + "' is not of the form service@host.";
}

INSTANTIATE_TEST_SUITE_P(
    All, BadGssapiNegotiationConfigTest,
    testing::Values(
        BadConfig{"NoService", {}, "the target service must not be empty."},
        BadConfig{
            "NulInService", {kWithNul, "", "", ""}, "the target service must not contain a NUL."},
        BadConfig{"NulInPrincipal",
                  {kService, kWithNul, "", ""},
                  "the principal must not contain a NUL."},
        BadConfig{
            "NulInKeytab", {kService, "", kWithNul, ""}, "the keytab must not contain a NUL."},
        BadConfig{"NulInCache",
                  {kService, "", "", kWithNul},
                  "the credential cache must not contain a NUL."},
        BadConfig{"OnlyService", {"HTTP", "", "", ""}, NotOfTheForm("HTTP")},
        BadConfig{"NoHost", {"HTTP@", "", "", ""}, NotOfTheForm("HTTP@")},
        BadConfig{"NoServiceName", {"@host", "", "", ""}, NotOfTheForm("@host")},
        BadConfig{"Principal", {"HTTP/host", "", "", ""}, NotOfTheForm("HTTP/host")},
        BadConfig{"PrincipalWithRealm", {"HTTP/host@A", "", "", ""}, NotOfTheForm("HTTP/host@A")},
        BadConfig{"TwoHosts", {"HTTP@a@b", "", "", ""}, NotOfTheForm("HTTP@a@b")}),
    [](const auto& instance) { return instance.param.name; });

TEST(CreateGssapiNegotiationHandlerTest, AccessesNeitherTicketsNorFiles) {
  const auto handler = CreateGssapiNegotiationHandler(
      {kService, "machine", "/nonexistent/keytab", "FILE:/nonexistent"});
  ASSERT_NE(handler, nullptr);
  EXPECT_FALSE(handler->IsEstablished());
}

}  // namespace
}  // namespace SsoClient::Testing
