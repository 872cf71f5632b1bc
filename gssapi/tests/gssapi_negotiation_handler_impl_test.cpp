#include "gssapi_negotiation_handler_impl.h"

#include <ssoclient/exceptions.h>
#include <tarnik/core/exception.h>

#include <chrono>
#include <filesystem>
#include <future>
#include <thread>

#include "calls/freed_memory.h"
#include "expect_login.h"
#include "init_sec_context_script.h"
#include "realm_fixture.h"
#include "support/thrown_message.h"
#include "talkative_kdc.h"
#include "transport/loopback_server.h"

namespace SsoClient {
namespace {

using Testing::GssAcceptor;
using testing::HasSubstr;
using Testing::InitResult;
using Testing::InitSecContextScript;
using Testing::ThrownMessage;
using namespace std::chrono_literals;

using Leg = std::vector<unsigned char>;

constexpr char kAlice[] = "alice@EXAMPLE.COM";
constexpr char kNoNegotiation[] =
    "The negotiation handler is given a leg of the service's, but no negotiation is under way.";

std::string Failed(const std::string& major, const std::string& minor) {
  return "The login at `HTTP@sts.example' failed: " + major + " (" + minor + ").";
}

std::string Failed(const std::string& minor) {
  return Failed("Unspecified GSS failure.  Minor code may provide more information", minor);
}

// NegTokenResp (RFC 4178, section 4.2.2) for Kerberos without a leg of Kerberos's own.
Leg EmptyAnswer(unsigned char state) {
  return {0xa1, 0x14, 0x30, 0x12, 0xa0, 0x03, 0x0a, 0x01, state, 0xa1, 0x0b,
          0x06, 0x09, 0x2a, 0x86, 0x48, 0x86, 0xf7, 0x12, 0x01,  0x02, 0x02};
}

class GssapiNegotiationHandlerImplTest : public Testing::RealmFixture {
 protected:
  static void ExpectLogin(GssapiNegotiationHandler& handler) {
    Testing::ExpectLogin(handler, serviceKeytab, kAlice);
  }

  // What the service answers to the first leg of a negotiation.
  static Leg AnswerTo(GssapiNegotiationHandler& handler) {
    return GssAcceptor(serviceKeytab).Accept(*handler.Negotiate({}));
  }

  // On a thread of its own: the libraries keep the texts of earlier failures for a thread.
  static std::string Failure(GssapiNegotiationHandler& handler, const Leg& leg = {}) {
    std::string message;
    std::thread([&] {
      message = ThrownMessage<SsoException>([&] { handler.Negotiate(leg); });
    }).join();
    return message;
  }

  // The handler has forgotten the negotiation, and serves another.
  static void ExpectServesAgain(GssapiNegotiationHandler& handler) {
    EXPECT_FALSE(handler.IsEstablished());
    EXPECT_EQ(ThrownMessage<Tarnik::InvalidStateException>([&] { handler.Negotiate({1}); }),
              kNoNegotiation);
    ExpectLogin(handler);
  }
};

TEST_F(GssapiNegotiationHandlerImplTest, ServesOneNegotiationAfterTheOther) {
  GssapiNegotiationHandlerImpl handler(ConfigOf("alice"));
  ExpectLogin(handler);
  ExpectLogin(handler);
  ExpectLogin(handler);
}

TEST_F(GssapiNegotiationHandlerImplTest, HasThePeerProveItselfAndDelegatesNothing) {
  GssapiNegotiationHandlerImpl handler(ConfigOf("alice"));
  GssAcceptor acceptor(serviceKeytab);
  acceptor.Accept(*handler.Negotiate({}));
  EXPECT_NE(acceptor.flags & GSS_C_MUTUAL_FLAG, 0U);
  EXPECT_NE(acceptor.flags & GSS_C_INTEG_FLAG, 0U);
  EXPECT_EQ(acceptor.flags & GSS_C_DELEG_FLAG, 0U);
}

TEST_F(GssapiNegotiationHandlerImplTest, HasNothingToSayAfterTheEnd) {
  GssapiNegotiationHandlerImpl handler(ConfigOf("alice"));
  const Leg answer = AnswerTo(handler);
  for (const Leg& leg : {answer, answer, Leg{1, 2, 3}}) {
    const auto last = handler.Negotiate(leg);
    ASSERT_NE(last, nullptr);
    EXPECT_TRUE(last->empty());
    EXPECT_TRUE(handler.IsEstablished());
  }
}

TEST_F(GssapiNegotiationHandlerImplTest, EndsWithAServiceThatAsksOnAndOn) {
  GssapiNegotiationHandlerImpl handler(ConfigOf("alice"));
  const Leg answer = AnswerTo(handler);
  for (int legs = 1; legs < 100; ++legs) {
    handler.Negotiate(answer);
  }
  EXPECT_EQ(Failure(handler, answer),
            "The login at `HTTP@sts.example' failed: the service asks for more than 100 legs.");
  ExpectServesAgain(handler);
}

TEST_F(GssapiNegotiationHandlerImplTest, BeginsAnewWithAnEmptyLegInTheMiddle) {
  GssapiNegotiationHandlerImpl handler(ConfigOf("alice"));
  const Leg answerToTheFirst = AnswerTo(handler);
  ExpectLogin(handler);
  handler.Negotiate({});
  EXPECT_FALSE(handler.IsEstablished());
  EXPECT_EQ(Failure(handler, answerToTheFirst), Failed("Mutual authentication failed"));
  ExpectServesAgain(handler);
}

TEST_F(GssapiNegotiationHandlerImplTest, RefusesALegBeforeTheFirst) {
  GssapiNegotiationHandlerImpl handler(ConfigOf("alice"));
  EXPECT_EQ(ThrownMessage<Tarnik::InvalidStateException>([&] {
              handler.Negotiate({1, 2, 3});
            }),
            kNoNegotiation);
  ExpectLogin(handler);
}

TEST_F(GssapiNegotiationHandlerImplTest, FindsRenewedTickets) {
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

TEST_F(GssapiNegotiationHandlerImplTest, NeedsNoRealmForTicketsThatItHas) {
  GssapiNegotiationHandlerImpl handler(MachineConfig());
  Testing::ExpectLogin(handler, serviceKeytab, "machine@EXAMPLE.COM");
  realm->StopKdc();
  Testing::ExpectLogin(handler, serviceKeytab, "machine@EXAMPLE.COM");
  realm->SetClock(0s);
}

TEST_F(GssapiNegotiationHandlerImplTest, MayBeUsedByAnotherThreadThanItsMaker) {
  GssapiNegotiationHandlerImpl handler(ConfigOf("alice"));
  Leg answer;
  std::thread([&] { answer = AnswerTo(handler); }).join();
  std::thread([&] { handler.Negotiate(answer); }).join();
  EXPECT_TRUE(handler.IsEstablished());
}

TEST_F(GssapiNegotiationHandlerImplTest, ThreadsLogInSideBySide) {
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

TEST_F(GssapiNegotiationHandlerImplTest, RefusesASecondThreadInTheSameCall) {
  GssapiNegotiationHandlerImpl handler(ConfigOf("alice"));
  std::promise<void> isInside;
  std::promise<void> mayGoOn;
  {
    const InitSecContextScript script([&] {
      isInside.set_value();
      mayGoOn.get_future().wait();
      return InitResult{GSS_S_CONTINUE_NEEDED, "leg", 0};
    });
    std::thread first([&] { EXPECT_EQ(*handler.Negotiate({}), (Leg{'l', 'e', 'g'})); });
    isInside.get_future().wait();
    EXPECT_EQ(ThrownMessage<Tarnik::InvalidStateException>([&] { handler.Negotiate({}); }),
              "The negotiation handler is in use by another thread.");
    mayGoOn.set_value();
    first.join();
  }
  ExpectLogin(handler);
}

TEST_F(GssapiNegotiationHandlerImplTest, TellsThatThereAreNoCredentials) {
  auto config = ConfigOf("alice");
  config.credentialCache = "FILE:/nonexistent/other";
  GssapiNegotiationHandlerImpl handler(config);
  EXPECT_EQ(Failure(handler),
            "There are no credentials to log in with: No credentials were supplied, or the "
            "credentials were unavailable or inaccessible (No credentials cache found).");
  EXPECT_FALSE(handler.IsEstablished());
}

TEST_F(GssapiNegotiationHandlerImplTest, TellsOfAnUnknownService) {
  auto config = ConfigOf("alice");
  config.targetService = "HTTP@unknown";
  GssapiNegotiationHandlerImpl handler(config);
  EXPECT_EQ(Failure(handler),
            "The login at `HTTP@unknown' failed: Unspecified GSS failure.  Minor code may provide "
            "more information (Server HTTP/unknown@EXAMPLE.COM not found in Kerberos database).");
}

TEST_F(GssapiNegotiationHandlerImplTest, TellsOfClocksTooFarApart) {
  auto config = ConfigOf("alice");
  config.credentialCache = realm->Login("alice", "secret", 9h);
  realm->SetClock(1h);
  GssapiNegotiationHandlerImpl handler(config);
  EXPECT_EQ(Failure(handler), Failed("Clock skew too great"));
  realm->SetClock(0s);
  ExpectLogin(handler);
}

TEST_F(GssapiNegotiationHandlerImplTest, TellsThatTheRealmDoesNotAnswer) {
  GssapiNegotiationHandlerImpl handler(ConfigOf("alice"));
  realm->StopKdc();
  EXPECT_EQ(Failure(handler), Failed("Cannot contact any KDC for realm 'EXAMPLE.COM'"));
  realm->SetClock(0s);
  ExpectLogin(handler);
}

// Kerberos gives a KDC some half a minute.
TEST_F(GssapiNegotiationHandlerImplTest, DoesNotHangWithASilentRealm) {
  GssapiNegotiationHandlerImpl handler(ConfigOf("alice"));
  const auto start = std::chrono::steady_clock::now();
  {
    const Testing::LoopbackSocket kdc;  // connections come about, but nobody accepts them
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

TEST_F(GssapiNegotiationHandlerImplTest, TellsThatTheServiceLacksItsKey) {
  GssapiNegotiationHandlerImpl handler(ConfigOf("alice"));
  GssAcceptor acceptor(machineKeytab);
  const Leg refusal = acceptor.Accept(*handler.Negotiate({}));
  EXPECT_THAT(acceptor.error, HasSubstr("not found in keytab"));
  EXPECT_EQ(Failure(handler, refusal), Failed("The ticket isn't for us"));
  ExpectServesAgain(handler);
}

// One element of DER (X.690) with a content of less than 256 bytes.
Leg Element(unsigned char tag, const Leg& content) {
  EXPECT_LT(content.size(), 0x100U);
  Leg whole{tag};
  if (content.size() >= 0x80) {
    whole.push_back(0x81);
  }
  whole.push_back(static_cast<unsigned char>(content.size()));
  whole.insert(whole.end(), content.begin(), content.end());
  return whole;
}

// A service's refusal, a KRB-ERROR in the frames of RFC 4121, section 4.1, and of RFC 4178.
Leg RefusalWith(const std::string& text) {
  Leg token{0x06, 0x09, 0x2a, 0x86, 0x48, 0x86, 0xf7, 0x12, 0x01, 0x02, 0x02, 0x03, 0x00};
  const std::string error = Testing::KerberosError(text);
  token.insert(token.end(), error.begin(), error.end());
  Leg fields{0xa0, 0x03, 0x0a, 0x01, 0x01};
  const Leg response = Element(0xa2, Element(0x04, Element(0x60, token)));
  fields.insert(fields.end(), response.begin(), response.end());
  return Element(0xa1, Element(0x30, fields));
}

TEST_F(GssapiNegotiationHandlerImplTest, DoesNotRepeatWhatAServiceSaysOfItsRefusal) {
  GssapiNegotiationHandlerImpl handler(ConfigOf("alice"));
  handler.Negotiate({});
  EXPECT_EQ(Failure(handler, RefusalWith("no\r\nline")), Failed("Generic error (see e-text)"));
  ExpectServesAgain(handler);
}

TEST_F(GssapiNegotiationHandlerImplTest, TellsInOneLineWhatAKdcSaysOfItsRefusal) {
  GssapiNegotiationHandlerImpl handler(ConfigOf("alice"));
  {
    const Testing::TalkativeKdc kdc("no\r\nline \x1b[0m");
    ReplaceKdc(kdc.Port());
    EXPECT_EQ(Failure(handler), Failed("KDC returned error string: no??line ?[0m"));
  }
  realm->SetClock(0s);
  ExpectLogin(handler);
}

TEST_F(GssapiNegotiationHandlerImplTest, RefusesTheProofOfAnotherNegotiation) {
  const auto config = ConfigOf("alice");
  GssapiNegotiationHandlerImpl handler(config);
  GssapiNegotiationHandlerImpl other(config);
  const Leg proof = AnswerTo(other);
  handler.Negotiate({});
  EXPECT_EQ(Failure(handler, proof), Failed("Mutual authentication failed"));
  ExpectServesAgain(handler);
}

TEST_F(GssapiNegotiationHandlerImplTest, LeavesNoLegInMemory) {
  GssapiNegotiationHandlerImpl handler(ConfigOf("alice"));
  auto leg = handler.Negotiate({});
  const Testing::FreedMemory memory(std::string(leg->end() - 40, leg->end()));
  leg = nullptr;
  EXPECT_EQ(memory.Finds(), 0);
}

struct BadLeg {
  const char* name;
  Leg leg;
  std::string message;
};

class BadServerLegTest : public GssapiNegotiationHandlerImplTest,
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

// Proofs differ in length by a byte or so.
TEST_F(GssapiNegotiationHandlerImplTest, RefusesAProofCutAtAnyByte) {
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

// What the real library is not made to do.

TEST_F(GssapiNegotiationHandlerImplTest, DoesNotWaitForTheServiceWithNothingToSend) {
  GssapiNegotiationHandlerImpl handler(ConfigOf("alice"));
  {
    const InitSecContextScript script([] { return InitResult{GSS_S_CONTINUE_NEEDED, "", 0}; });
    EXPECT_EQ(Failure(handler),
              "The login at `HTTP@sts.example' failed: it is not complete, but there is nothing to "
              "send.");
  }
  ExpectServesAgain(handler);
}

TEST_F(GssapiNegotiationHandlerImplTest, DemandsThatTheServiceHasProvedItself) {
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

TEST_F(GssapiNegotiationHandlerImplTest, SendsALastLegOfItsOwn) {
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

}  // namespace
}  // namespace SsoClient
