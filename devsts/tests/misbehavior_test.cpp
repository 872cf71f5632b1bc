#include "devsts/misbehavior.h"

#include <chrono>
#include <cstddef>
#include <memory>
#include <stdexcept>
#include <string>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "devsts/server.h"
#include "raw_client.h"
#include "request_text.h"

namespace DevSts::Testing {
namespace {

using testing::AllOf;
using testing::EndsWith;
using testing::HasSubstr;
using testing::Not;
using testing::StartsWith;
using namespace std::chrono_literals;

constexpr char kRaw[] = "HTTP/1.1 200 OK\r\nContent-Length: 10\r\n\r\n0123456789";

Misbehavior Raw() {
  Misbehavior misbehavior;
  misbehavior.rawAnswer = kRaw;
  return misbehavior;
}

// Sends a request and returns its client.
std::unique_ptr<RawClient> SendRequest(const Server& server) {
  auto client = std::make_unique<RawClient>(server.HttpPort());
  client->Send(PostOf(AliceEnvelope(), kIssueAction));
  return client;
}

std::unique_ptr<RawClient> SendRequestOverTls(const Server& server) {
  auto client = std::make_unique<RawClient>(server.HttpsPort());
  EXPECT_EQ(client->StartTls(server.CaCertificatePem()), X509_V_OK);
  client->Send(PostOf(AliceEnvelope(), kIssueAction));
  return client;
}

TEST(MisbehaviorTest, AnswersWithAnyFault) {
  Server server;
  Misbehavior misbehavior;
  misbehavior.fault = {"urn:any", "Code", "<why>", false, 500};
  server.MisbehaveNext(misbehavior);
  const std::string answer = SendRequest(server)->ReadAnswer();
  EXPECT_THAT(answer, StartsWith("HTTP/1.1 500 "));
  EXPECT_THAT(answer, HasSubstr("<faultcode xmlns:code=\"urn:any\">code:Code</faultcode>"));
  EXPECT_EQ(ElementText(answer, "faultstring"), "&lt;why&gt;");
  EXPECT_THAT(SendRequest(server)->ReadAnswer(), StartsWith("HTTP/1.1 200 "));
}

TEST(MisbehaviorTest, OmitsPrefixAndFaultString) {
  Server server;
  Misbehavior misbehavior;
  misbehavior.fault = {"", "FailedAuthentication", "", true, 200};
  server.SetMisbehavior(misbehavior);
  const std::string answer = SendRequest(server)->ReadAnswer();
  EXPECT_THAT(answer, StartsWith("HTTP/1.1 200 "));
  EXPECT_THAT(answer, HasSubstr("<faultcode>FailedAuthentication</faultcode></soapenv:Fault>"));
}

TEST(MisbehaviorTest, AnswersWithAnyHttpAnswer) {
  Server server;
  Misbehavior misbehavior;
  misbehavior.httpAnswer = {302, "Found", {{"Location", "https://elsewhere.example/"}}, "gone"};
  misbehavior.setCookies = {"a=1; Path=/", "b=2"};
  misbehavior.extraHeaders = {{"X-Extra", "yes"}};
  server.SetMisbehavior(misbehavior);
  EXPECT_EQ(SendRequest(server)->ReadAnswer(),
            "HTTP/1.1 302 Found\r\nLocation: https://elsewhere.example/\r\n"
            "Set-Cookie: a=1; Path=/\r\nSet-Cookie: b=2\r\nX-Extra: yes\r\n"
            "Content-Length: 4\r\n\r\ngone");
  server.ClearMisbehavior();
  EXPECT_THAT(SendRequest(server)->ReadAnswer(), StartsWith("HTTP/1.1 200 "));
}

TEST(MisbehaviorTest, SendsRawOctetsAfterARawPrefix) {
  Server server;
  Misbehavior misbehavior = Raw();
  misbehavior.rawPrefix = "HTTP/1.1 100 Continue\r\n\r\n";
  misbehavior.rawAnswer = std::string("NUL\0 and \xFF", 10);
  misbehavior.closeConnection = true;
  server.MisbehaveNext(misbehavior);
  EXPECT_EQ(SendRequest(server)->ReadToEnd(),
            "HTTP/1.1 100 Continue\r\n\r\n" + std::string("NUL\0 and \xFF", 10));
}

TEST(MisbehaviorTest, EditsTheEnvelope) {
  Server server;
  Misbehavior misbehavior;
  misbehavior.editEnvelope = [](std::string& envelope) { envelope = "<other/>"; };
  server.MisbehaveNext(misbehavior);
  EXPECT_THAT(SendRequest(server)->ReadAnswer(), EndsWith("Content-Length: 8\r\n\r\n<other/>"));
}

TEST(MisbehaviorTest, AHookThatThrowsEndsItsConnection) {
  Server server;
  Misbehavior misbehavior;
  misbehavior.editEnvelope = [](std::string&) { throw std::runtime_error("hook"); };
  server.MisbehaveNext(misbehavior);
  EXPECT_EQ(SendRequest(server)->ReadToEnd(), "");
  EXPECT_THAT(SendRequest(server)->ReadAnswer(), StartsWith("HTTP/1.1 200 "));
}

TEST(MisbehaviorTest, AppliesInTheOrderOfTheCallsAndAsOftenAsRequested) {
  Server server;
  Misbehavior first;
  first.httpAnswer = {201, "First", {}, ""};
  Misbehavior second;
  second.httpAnswer = {202, "Second", {}, ""};
  server.MisbehaveNext(first, 2);
  server.MisbehaveNext(second);
  EXPECT_THAT(SendRequest(server)->ReadAnswer(), HasSubstr(" 201 First"));
  EXPECT_THAT(SendRequest(server)->ReadAnswer(), HasSubstr(" 201 First"));
  EXPECT_THAT(SendRequest(server)->ReadAnswer(), HasSubstr(" 202 Second"));
  EXPECT_THAT(SendRequest(server)->ReadAnswer(), HasSubstr(" 200 OK"));
}

TEST(MisbehaviorTest, SendsTheBodyInChunks) {
  Server server;
  Misbehavior misbehavior;
  misbehavior.httpAnswer = {200, "OK", {}, "abcdefghijklmnopq"};
  misbehavior.chunkSizes = {1, 10, 3};
  server.MisbehaveNext(misbehavior);
  EXPECT_EQ(SendRequest(server)->ReadAnswer(),
            "HTTP/1.1 200 OK\r\nTransfer-Encoding: chunked\r\n\r\n"
            "1\r\na\r\na\r\nbcdefghijk\r\n3\r\nlmn\r\n3\r\nopq\r\n0\r\n\r\n");
}

TEST(MisbehaviorTest, PadsHeadAndBody) {
  Server server;
  Misbehavior misbehavior;
  misbehavior.padHeaderBytes = 70'000;
  misbehavior.padBodyBytes = 100'000;
  server.MisbehaveNext(misbehavior);
  const std::string answer = SendRequest(server)->ReadAnswer();
  const std::size_t head = answer.find("\r\n\r\n");
  EXPECT_GT(head, 70'000U);
  EXPECT_GT(answer.size() - head, 100'000U);
  EXPECT_EQ(answer.back(), ' ');
}

TEST(MisbehaviorTest, ClosesWithAndWithoutAnnouncement) {
  Server server;
  Misbehavior announced;
  announced.closeConnection = true;
  server.MisbehaveNext(announced);
  EXPECT_THAT(SendRequest(server)->ReadToEnd(), HasSubstr("Connection: close\r\n"));
  Misbehavior silent;
  silent.closeUnannounced = true;
  server.MisbehaveNext(silent);
  EXPECT_THAT(SendRequest(server)->ReadToEnd(),
              AllOf(StartsWith("HTTP/1.1 200 "), Not(HasSubstr("Connection: close"))));
}

struct CutCase {
  const char* name;
  CutStyle style;
  Ending plain;
  Ending tls;
};

class CutOffTest : public testing::TestWithParam<CutCase> {};

TEST_P(CutOffTest, EndsAfterTheGivenOctets) {
  Server server;
  for (const std::size_t octets : {0UL, 1UL, 20UL, sizeof kRaw - 2}) {
    Misbehavior misbehavior = Raw();
    misbehavior.cutOff = CutOff{octets, GetParam().style};
    server.MisbehaveNext(misbehavior, 2);
    const std::string expected(kRaw, octets);

    const auto plain = SendRequest(server);
    const std::string plainOctets = plain->ReadToEnd();
    EXPECT_EQ(plain->HowItEnded(), GetParam().plain) << octets;

    const auto tls = SendRequestOverTls(server);
    const std::string tlsOctets = tls->ReadToEnd();
    EXPECT_EQ(tls->HowItEnded(), GetParam().tls) << octets;

    // A reset may overtake what was sent before it.
    if (GetParam().style != CutStyle::Reset) {
      EXPECT_EQ(plainOctets, expected);
      EXPECT_EQ(tlsOctets, expected);
    }
  }
}

INSTANTIATE_TEST_SUITE_P(
    EveryStyle, CutOffTest,
    testing::Values(CutCase{"Orderly", CutStyle::Orderly, Ending::Orderly, Ending::Orderly},
                    CutCase{"WithoutNotice", CutStyle::WithoutNotice, Ending::Orderly,
                            Ending::Truncated},
                    CutCase{"Reset", CutStyle::Reset, Ending::Reset, Ending::Reset}),
    [](const auto& test) { return test.param.name; });

bool WaitForStall(const Server& server) {
  return server.WaitUntil([](const Counters& counters) { return counters.stalled == 1; });
}

bool WaitForEnd(const Server& server) {
  return server.WaitUntil([](const Counters& counters) {
    return counters.stalled == 0 && counters.connectionsOpen == 0;
  });
}

TEST(MisbehaviorTest, StallsBeforeTheHandshake) {
  Server server;
  Misbehavior misbehavior;
  misbehavior.stall = Stall::BeforeTlsHandshake;
  server.MisbehaveNext(misbehavior);
  {
    const RawClient client(server.HttpsPort());
    ASSERT_TRUE(WaitForStall(server));
    EXPECT_TRUE(client.IsSilent(20ms));
  }
  EXPECT_TRUE(WaitForEnd(server));
  EXPECT_EQ(server.GetCounters().handshakesDone, 0U);
}

TEST(MisbehaviorTest, StallsBeforeTheRequest) {
  Server server;
  Misbehavior misbehavior;
  misbehavior.stall = Stall::BeforeRequest;
  server.MisbehaveNext(misbehavior);
  {
    const auto client = SendRequestOverTls(server);
    ASSERT_TRUE(WaitForStall(server));
  }
  EXPECT_TRUE(WaitForEnd(server));
  EXPECT_EQ(server.GetCounters().handshakesDone, 1U);
  EXPECT_EQ(server.GetCounters().requests, 0U);
}

struct StallCase {
  const char* name;
  Stall stall;
  std::size_t sent;
};

class StallTest : public testing::TestWithParam<StallCase> {};

TEST_P(StallTest, SendsOnlyWhatPrecedesTheStall) {
  Server server;
  Misbehavior misbehavior = Raw();
  misbehavior.stall = GetParam().stall;
  server.MisbehaveNext(misbehavior);
  const auto client = SendRequest(server);
  ASSERT_TRUE(WaitForStall(server));
  EXPECT_EQ(server.GetCounters().requests, 1U);
  std::string received;
  while (received.size() < GetParam().sent) {
    ASSERT_TRUE(client->ReadSome(received));
  }
  EXPECT_EQ(received, std::string(kRaw, GetParam().sent));
  EXPECT_TRUE(client->IsSilent(20ms));
}

INSTANTIATE_TEST_SUITE_P(EveryStage, StallTest,
                         testing::Values(StallCase{"BeforeAnswer", Stall::BeforeAnswer, 0},
                                         StallCase{"AfterHeaders", Stall::AfterHeaders,
                                                   sizeof kRaw - 11},
                                         StallCase{"InMidBody", Stall::InMidBody, sizeof kRaw - 6}),
                         [](const auto& test) { return test.param.name; });

TEST(MisbehaviorTest, AStalledServerStops) {
  auto server = std::make_unique<Server>();
  Misbehavior misbehavior;
  misbehavior.stall = Stall::BeforeAnswer;
  server->SetMisbehavior(misbehavior);
  const auto client = SendRequest(*server);
  ASSERT_TRUE(WaitForStall(*server));
  server.reset();
  EXPECT_EQ(client->ReadToEnd(), "");
}

TEST(MisbehaviorTest, DelaysTheAnswer) {
  Server server;
  Misbehavior misbehavior;
  misbehavior.delayBeforeAnswer = 50ms;
  server.MisbehaveNext(misbehavior);
  const auto start = std::chrono::steady_clock::now();
  EXPECT_THAT(SendRequest(server)->ReadAnswer(), StartsWith("HTTP/1.1 200 "));
  EXPECT_GE(std::chrono::steady_clock::now() - start, 50ms);
}

TEST(MisbehaviorTest, EndsADelayWhenThePeerDisconnects) {
  Server server;
  Misbehavior misbehavior;
  misbehavior.delayBeforeAnswer = 1h;
  server.MisbehaveNext(misbehavior);
  {
    const auto client = SendRequest(server);
    ASSERT_TRUE(server.WaitUntil([](const Counters& counters) { return counters.delayed == 1; }));
  }
  EXPECT_TRUE(server.WaitUntil([](const Counters& counters) {
    return counters.delayed == 0 && counters.connectionsOpen == 0;
  }));
}

TEST(MisbehaviorTest, DripsTheAnswer) {
  Server server;
  Misbehavior misbehavior = Raw();
  misbehavior.drip = Drip{10, 1ms};
  server.MisbehaveNext(misbehavior);
  const auto start = std::chrono::steady_clock::now();
  EXPECT_EQ(SendRequest(server)->ReadAnswer(), kRaw);
  EXPECT_GE(std::chrono::steady_clock::now() - start, 4ms);
}

TEST(ServerTest, HandlesAThousandExchangesAtOnce) {
  constexpr std::size_t kCount = 1000;
  Server server;
  Misbehavior misbehavior = Raw();
  misbehavior.delayBeforeAnswer = 1h;
  server.SetMisbehavior(misbehavior);
  std::vector<std::unique_ptr<RawClient>> clients;
  for (std::size_t i = 0; i < kCount; ++i) {
    clients.push_back(SendRequest(server));
  }
  EXPECT_TRUE(
      server.WaitUntil([](const Counters& counters) { return counters.delayed == kCount; }, 60s));
  EXPECT_EQ(server.GetCounters().connectionsOpen, kCount);
  clients.clear();
  EXPECT_TRUE(server.WaitUntil(
      [](const Counters& counters) { return counters.connectionsOpen == 0; }, 60s));
}

}  // namespace
}  // namespace DevSts::Testing
