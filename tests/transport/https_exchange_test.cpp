#include <atomic>
#include <chrono>
#include <future>
#include <memory>
#include <string>
#include <tuple>
#include <typeinfo>

#include <gmock/gmock.h>

#include <devsts/server.h>
#include <ssoclient/exceptions.h>
#include <tarnik/core/exception.h>
#include <tarnik/core/reader.h>
#include <tarnik/core/ref.h>
#include <tarnik/crypto/certificate.h>
#include <tarnik/http/http_user_agent.h>
#include <tarnik/ssl/ssl_context.h>

#include "transport/https_client.h"
#include "transport/loopback_server.h"
#include "transport/read_all.h"

namespace SsoClient::Testing {
namespace {

using Clock = std::chrono::steady_clock;
using DevSts::Misbehavior;
using DevSts::Stall;
using Tarnik::Http::PendingRequestItem;
using testing::HasSubstr;
using testing::Not;

constexpr unsigned long kTimeout = 300'000;
constexpr unsigned long kAmpleTimeout = 30'000'000;
// A multiple of the time limit: long enough for a busy machine, and far shorter than the delay of
// every answer.
constexpr std::chrono::seconds kBound{10};

constexpr char kAction[] = "http://docs.oasis-open.org/ws-sx/ws-trust/200512/RST/Issue";
constexpr char kAnswer[] = "<answer/>";

enum class Scheme { Http, Https };

/// The result of one exchange, copied while its arguments were valid.
struct Result {
  std::string body;
  std::string errorType;
  std::string message;
};

bool IsCommunicationFailure(const Result& result) {
  return result.errorType == typeid(CommunicationException).name() && result.body.empty();
}

Result SendAndWait(const TransportSession& session, const SoapRequest& request) {
  Tarnik::Ref<Tarnik::Reader> reader;
  try {
    session.SendRequest(request, reader);
  } catch (const Tarnik::Exception& error) {
    EXPECT_EQ(reader, nullptr);
    return {"", typeid(error).name(), error.Message()};
  }
  return {ReadAll(*reader), "", ""};
}

class AsyncExchange {
 public:
  AsyncExchange(const TransportSession& session, const SoapRequest& request) {
    session.SendRequestAsync(
        request,
        [state = state_](const Tarnik::Exception* error, Tarnik::Reader* reader) {
          EXPECT_NE(error == nullptr, reader == nullptr);
          if (++state->calls > 1) {
            return;
          }
          state->result.set_value(error != nullptr
                                      ? Result{"", typeid(*error).name(), error->Message()}
                                      : Result{ReadAll(*reader), "", ""});
        },
        handle_);
  }

  PendingRequestItem& Handle() { return *handle_; }
  Result Wait() { return state_->result.get_future().get(); }
  int Calls() const { return state_->calls; }

 private:
  // Shared with the completion, which may not have returned yet when the result is available.
  struct State {
    std::atomic<int> calls = 0;
    std::promise<Result> result;
  };

  std::shared_ptr<State> state_ = std::make_shared<State>();
  Tarnik::Ref<PendingRequestItem> handle_;
};

class HttpsExchangeTest : public testing::Test {
 protected:
  HttpsExchangeTest() {
    Sts().ClearMisbehavior();
    EXPECT_TRUE(AreAllConnectionsClosed());
    Sts().ClearRequests();
    request_.action = kAction;
    request_.body = "<envelope>hunter2</envelope>";
  }

  static DevSts::Server& Sts() {
    static DevSts::Server server;
    return server;
  }

  static HttpsClient MakeClient(Scheme scheme, unsigned long timeout,
                                const std::string& sslPeerName = "") {
    Tarnik::Ssl::SSLContextConfig config;
    config.caCertificates = Tarnik::Crypto::CreateCertificatesFromPem(Sts().CaCertificatePem());
    const auto context = Tarnik::Ssl::CreateSSLContext(config);
    const std::string url = scheme == Scheme::Https ? Sts().HttpsUrl() : Sts().HttpUrl();
    return {url, context.get(), sslPeerName, timeout, false};
  }

  static std::string Endpoint(Scheme scheme) {
    return "127.0.0.1:" +
           std::to_string(scheme == Scheme::Https ? Sts().HttpsPort() : Sts().HttpPort());
  }

  static bool AreAllConnectionsClosed() {
    return Sts().WaitUntil(
        [](const DevSts::Counters& counters) { return counters.connectionsOpen == 0; });
  }

  static bool IsStalled() {
    return Sts().WaitUntil([](const DevSts::Counters& counters) { return counters.stalled == 1; });
  }

  static void Answer(int status, const std::string& reason) {
    Misbehavior misbehavior;
    misbehavior.httpAnswer = DevSts::HttpAnswer{status, reason, {}, kAnswer};
    Sts().SetMisbehavior(misbehavior);
  }

  SoapRequest request_;
};

struct Stage {
  const char* name;
  Stall stall;
  bool isDripping;
};

Misbehavior MisbehaviorAt(const Stage& stage) {
  Misbehavior misbehavior;
  misbehavior.stall = stage.stall;
  misbehavior.httpAnswer = DevSts::HttpAnswer{200, "OK", {}, std::string(5000, 'x')};
  if (stage.isDripping) {
    misbehavior.drip = DevSts::Drip{1, std::chrono::milliseconds(10)};
  }
  return misbehavior;
}

constexpr Stage kStalls[] = {
    {"BeforeTheHandshake", Stall::BeforeTlsHandshake, false},
    {"BeforeTheRequest", Stall::BeforeRequest, false},
    {"BeforeTheAnswer", Stall::BeforeAnswer, false},
    {"AfterTheHeaders", Stall::AfterHeaders, false},
    {"InMidBody", Stall::InMidBody, false},
};
constexpr Stage kDrip = {"OneByteAtATime", Stall::None, true};

using StageAndScheme = std::tuple<Stage, Scheme>;

std::string NameOf(const testing::TestParamInfo<StageAndScheme>& tested) {
  return std::string(std::get<Stage>(tested.param).name) +
         (std::get<Scheme>(tested.param) == Scheme::Https ? "OverTls" : "OverTcp");
}

class StalledExchangeTest : public HttpsExchangeTest,
                            public testing::WithParamInterface<StageAndScheme> {
 protected:
  StalledExchangeTest() { Sts().SetMisbehavior(MisbehaviorAt(std::get<Stage>(GetParam()))); }

  static Scheme TestedScheme() { return std::get<Scheme>(GetParam()); }
};

class TimedOutExchangeTest : public StalledExchangeTest {
 protected:
  static void ExpectTimeOut(const Result& result, Clock::duration elapsed) {
    EXPECT_TRUE(IsCommunicationFailure(result)) << result.errorType << result.body;
    EXPECT_THAT(result.message, testing::StartsWith("No answer from " + Endpoint(TestedScheme()) +
                                                    " within 300 milliseconds: waiting for "));
    if (TestedScheme() == Scheme::Https &&
        std::get<Stage>(GetParam()).stall == Stall::BeforeTlsHandshake) {
      EXPECT_THAT(result.message, testing::EndsWith(": waiting for the TLS handshake."));
    }
    EXPECT_GE(elapsed, std::chrono::microseconds(kTimeout));
    EXPECT_LT(elapsed, kBound);
    EXPECT_TRUE(AreAllConnectionsClosed());
  }
};

TEST_P(TimedOutExchangeTest, TheBlockingSendEndsAtItsLimit) {
  const auto session = MakeClient(TestedScheme(), kTimeout).CreateSession();
  const auto start = Clock::now();
  const Result result = SendAndWait(*session, request_);
  ExpectTimeOut(result, Clock::now() - start);
}

TEST_P(TimedOutExchangeTest, TheAsynchronousSendEndsAtItsLimit) {
  const auto session = MakeClient(TestedScheme(), kTimeout).CreateSession();
  const auto start = Clock::now();
  AsyncExchange exchange(*session, request_);
  const Result result = exchange.Wait();
  ExpectTimeOut(result, Clock::now() - start);
  EXPECT_EQ(exchange.Calls(), 1);
  EXPECT_FALSE(exchange.Handle().Cancel());
}

INSTANTIATE_TEST_SUITE_P(Stalls, TimedOutExchangeTest,
                         testing::Combine(testing::ValuesIn(kStalls),
                                          testing::Values(Scheme::Http, Scheme::Https)),
                         NameOf);
INSTANTIATE_TEST_SUITE_P(Drip, TimedOutExchangeTest,
                         testing::Combine(testing::Values(kDrip),
                                          testing::Values(Scheme::Http, Scheme::Https)),
                         NameOf);

using CancelledExchangeTest = StalledExchangeTest;

TEST_P(CancelledExchangeTest, TheHandleCancelsTheExchange) {
  const auto session = MakeClient(TestedScheme(), kAmpleTimeout).CreateSession();
  AsyncExchange exchange(*session, request_);
  ASSERT_TRUE(IsStalled());
  EXPECT_EQ(exchange.Calls(), 0);
  EXPECT_TRUE(exchange.Handle().Cancel());
  const Result result = exchange.Wait();
  EXPECT_TRUE(IsCommunicationFailure(result)) << result.errorType << result.body;
  EXPECT_EQ(result.message, "The request to " + Endpoint(TestedScheme()) + " was cancelled.");
  EXPECT_FALSE(exchange.Handle().Cancel());
  EXPECT_TRUE(AreAllConnectionsClosed());
  EXPECT_EQ(exchange.Calls(), 1);
}

INSTANTIATE_TEST_SUITE_P(Stalls, CancelledExchangeTest,
                         testing::Combine(testing::ValuesIn(kStalls),
                                          testing::Values(Scheme::Http, Scheme::Https)),
                         NameOf);

TEST_F(HttpsExchangeTest, AConnectionThatIsNeverAcceptedTimesOut) {
  const FullListener listener;
  const std::string endpoint = "127.0.0.1:" + std::to_string(listener.Port());
  const HttpsClient client("http://" + endpoint + "/", nullptr, "", kTimeout, false);
  const std::string expected =
      "No answer from " + endpoint + " within 300 milliseconds: waiting for the connection.";

  const Result blocking = SendAndWait(*client.CreateSession(), request_);
  EXPECT_TRUE(IsCommunicationFailure(blocking)) << blocking.errorType;
  EXPECT_EQ(blocking.message, expected);

  const auto session = client.CreateSession();
  AsyncExchange exchange(*session, request_);
  const Result asynchronous = exchange.Wait();
  EXPECT_TRUE(IsCommunicationFailure(asynchronous)) << asynchronous.errorType;
  EXPECT_EQ(asynchronous.message, expected);
}

TEST_F(HttpsExchangeTest, ASessionWorksAfterACancelledExchange) {
  Answer(200, "OK");
  Sts().MisbehaveNext(MisbehaviorAt({"", Stall::InMidBody, false}));
  const auto session = MakeClient(Scheme::Https, kAmpleTimeout).CreateSession();
  AsyncExchange exchange(*session, request_);
  ASSERT_TRUE(IsStalled());
  EXPECT_TRUE(exchange.Handle().Cancel());
  EXPECT_TRUE(IsCommunicationFailure(exchange.Wait()));
  EXPECT_EQ(SendAndWait(*session, request_).body, kAnswer);
  const auto requests = Sts().Requests();
  ASSERT_EQ(requests.size(), 2U);
  EXPECT_NE(requests[0].connectionId, requests[1].connectionId);
}

TEST_F(HttpsExchangeTest, AReceivedAnswerCannotBeCancelled) {
  Answer(200, "OK");
  const auto session = MakeClient(Scheme::Https, kAmpleTimeout).CreateSession();
  AsyncExchange exchange(*session, request_);
  EXPECT_EQ(exchange.Wait().body, kAnswer);
  EXPECT_FALSE(exchange.Handle().Cancel());
  EXPECT_EQ(exchange.Calls(), 1);
}

TEST_F(HttpsExchangeTest, AMalformedPeerNameIsAFailureOfTheExchange) {
  const auto client = MakeClient(Scheme::Https, kAmpleTimeout, "no name");
  const auto session = client.CreateSession();
  for (const auto& result :
       {SendAndWait(*session, request_), AsyncExchange(*session, request_).Wait()}) {
    EXPECT_TRUE(IsCommunicationFailure(result)) << result.errorType << result.body;
    EXPECT_EQ(result.message, "The host name holds a character that no host name may hold.");
  }
  EXPECT_TRUE(AreAllConnectionsClosed());
  EXPECT_TRUE(Sts().Requests().empty());
}

TEST_F(HttpsExchangeTest, CookiesAreSentBackOnlyInTheSameSession) {
  Answer(200, "OK");
  Misbehavior giving;
  giving.httpAnswer = DevSts::HttpAnswer{200, "OK", {}, kAnswer};
  giving.setCookies = {"leg=1; Path=/; Secure; HttpOnly", "elsewhere=2; Path=/elsewhere"};
  const auto client = MakeClient(Scheme::Https, kAmpleTimeout);
  const auto session = client.CreateSession();
  const auto other = client.CreateSession();
  Sts().MisbehaveNext(giving);
  for (const auto* sender : {session.get(), session.get(), other.get(), session.get()}) {
    EXPECT_EQ(SendAndWait(*sender, request_).body, kAnswer);
  }

  const auto requests = Sts().Requests();
  ASSERT_EQ(requests.size(), 4U);
  EXPECT_EQ(requests[0].HeaderCount("Cookie"), 0U);
  EXPECT_EQ(requests[1].Header("Cookie"), "leg=1");
  EXPECT_EQ(requests[1].HeaderCount("Cookie"), 1U);
  EXPECT_EQ(requests[2].HeaderCount("Cookie"), 0U);
  EXPECT_EQ(requests[3].Header("Cookie"), "leg=1");
}

TEST_F(HttpsExchangeTest, CookiesOfAFaultCountToo) {
  Misbehavior fault;
  fault.httpAnswer = DevSts::HttpAnswer{500, "Internal Server Error", {}, kAnswer};
  fault.setCookies = {"leg=1"};
  Sts().SetMisbehavior(fault);
  const auto session = MakeClient(Scheme::Https, kAmpleTimeout).CreateSession();
  SendAndWait(*session, request_);
  AsyncExchange(*session, request_).Wait();
  EXPECT_EQ(Sts().LastRequest().Header("Cookie"), "leg=1");
}

TEST_F(HttpsExchangeTest, LegsOfOneSessionShareAConnection) {
  Answer(200, "OK");
  const auto session = MakeClient(Scheme::Https, kAmpleTimeout).CreateSession();
  SendAndWait(*session, request_);
  SendAndWait(*session, request_);
  const auto requests = Sts().Requests();
  ASSERT_EQ(requests.size(), 2U);
  EXPECT_EQ(requests[0].connectionId, requests[1].connectionId);
  EXPECT_EQ(requests[1].ordinalOnConnection, 2U);
}

struct Status {
  int code;
  const char* reason;
};

class DeliveredStatusTest : public HttpsExchangeTest, public testing::WithParamInterface<Status> {};

TEST_P(DeliveredStatusTest, ReturnsTheBody) {
  Answer(GetParam().code, GetParam().reason);
  const auto session = MakeClient(Scheme::Https, kAmpleTimeout).CreateSession();
  for (const auto& result :
       {SendAndWait(*session, request_), AsyncExchange(*session, request_).Wait()}) {
    EXPECT_EQ(result.body, kAnswer);
    EXPECT_EQ(result.message, "");
  }
}

INSTANTIATE_TEST_SUITE_P(Statuses, DeliveredStatusTest,
                         testing::Values(Status{200, "OK"}, Status{201, "Created"},
                                         Status{299, "Odd"}, Status{500, "Internal Server Error"}),
                         [](const auto& tested) { return std::to_string(tested.param.code); });

class RefusedStatusTest : public HttpsExchangeTest, public testing::WithParamInterface<Status> {};

TEST_P(RefusedStatusTest, NamesCodeAndReason) {
  Answer(GetParam().code, GetParam().reason);
  const auto session = MakeClient(Scheme::Https, kAmpleTimeout).CreateSession();
  for (const auto& result :
       {SendAndWait(*session, request_), AsyncExchange(*session, request_).Wait()}) {
    EXPECT_TRUE(IsCommunicationFailure(result)) << result.errorType << result.body;
    EXPECT_EQ(result.message, "Server returned error: " + std::to_string(GetParam().code) + " " +
                                  GetParam().reason);
  }
  EXPECT_EQ(Sts().Requests().size(), 2U);
}

INSTANTIATE_TEST_SUITE_P(Statuses, RefusedStatusTest,
                         testing::Values(Status{300, "Multiple Choices"}, Status{302, "Found"},
                                         Status{399, ""}, Status{404, "Not Found"},
                                         Status{499, "Odd"}, Status{501, "Not Implemented"},
                                         Status{503, "Service Unavailable"}),
                         [](const auto& tested) { return std::to_string(tested.param.code); });

// An interim answer is not the final answer, which must follow it (RFC 9110, section 15.2).
TEST_F(HttpsExchangeTest, AnInterimStatusWithoutAFinalOneIsAFailure) {
  for (const char* interim : {"HTTP/1.1 199 Odd\r\n\r\n", "HTTP/1.1 100 Continue\r\n\r\n"}) {
    Misbehavior misbehavior;
    misbehavior.rawAnswer = interim;
    misbehavior.closeConnection = true;
    Sts().SetMisbehavior(misbehavior);
    const auto session = MakeClient(Scheme::Https, kAmpleTimeout).CreateSession();
    for (const auto& result :
         {SendAndWait(*session, request_), AsyncExchange(*session, request_).Wait()}) {
      EXPECT_TRUE(IsCommunicationFailure(result)) << result.errorType << result.body;
      EXPECT_THAT(result.message, HasSubstr(Endpoint(Scheme::Https)));
    }
  }
}

TEST_F(HttpsExchangeTest, TheActionIsQuoted) {
  Answer(200, "OK");
  const auto session = MakeClient(Scheme::Https, kAmpleTimeout).CreateSession();
  for (const std::string action : {kAction, "urn:a b", ""}) {
    request_.action = action;
    SendAndWait(*session, request_);
    const auto received = Sts().LastRequest();
    EXPECT_EQ(received.method, "POST");
    EXPECT_EQ(received.HeaderCount("SOAPAction"), 1U);
    EXPECT_THAT(received.head,
                HasSubstr("\r\nContent-Type: text/xml\r\nSOAPAction: \"" + action + "\"\r\n"));
    EXPECT_EQ(received.body, request_.body);
  }
}

TEST_F(HttpsExchangeTest, NoFailureRevealsWhatWasSent) {
  Misbehavior garbage;
  garbage.rawAnswer = "hunter2 <envelope>\r\n\r\n";
  Misbehavior brokenHeader;
  brokenHeader.rawAnswer = "HTTP/1.1 200 OK\r\nhunter2\r\nContent-Length: hunter2\r\n\r\n";
  Misbehavior brokenLength;
  brokenLength.rawAnswer = "HTTP/1.1 200 OK\r\nContent-Length: hunter2\r\n\r\n";
  Misbehavior brokenCoding;
  brokenCoding.rawAnswer = "HTTP/1.1 200 OK\r\nTransfer-Encoding: hunter2\r\n\r\n";
  Misbehavior brokenChunk;
  brokenChunk.rawAnswer = "HTTP/1.1 200 OK\r\nTransfer-Encoding: chunked\r\n\r\nhunter2\r\n";
  Misbehavior cut;
  cut.cutOff = DevSts::CutOff{30, DevSts::CutStyle::WithoutNotice};
  for (auto misbehavior : {garbage, brokenHeader, brokenLength, brokenCoding, brokenChunk, cut}) {
    misbehavior.closeUnannounced = true;
    Sts().SetMisbehavior(misbehavior);
    const auto session = MakeClient(Scheme::Https, kAmpleTimeout).CreateSession();
    const Result result = SendAndWait(*session, request_);
    EXPECT_TRUE(IsCommunicationFailure(result)) << result.errorType << result.body;
    EXPECT_THAT(result.message, Not(HasSubstr("hunter2")));
  }
}

}  // namespace
}  // namespace SsoClient::Testing
