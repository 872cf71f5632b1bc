#include "stage.h"

#include <stdexcept>
#include <thread>

#include <arpa/inet.h>
#include <gtest/gtest.h>
#include <netinet/in.h>
#include <sys/socket.h>
#include <unistd.h>

#include <ssoclient/exceptions.h>
#include <tarnik/http/bounded_user_agent.h>
#include <tarnik/http/connection_specs.h>
#include <tarnik/http/http_user_agent.h>

#include "support/source_fixture.h"

namespace SsoClient::Access::Testing {

namespace {

using Limit = Tarnik::Http::CallLimit;
using Tarnik::Http::ExchangeStage;

const std::string kWaitingFor = "The deadline passed while the call was waiting for ";

TEST(StageTest, StagesOfAnAttemptNameTheEndpoint) {
  const std::pair<ExchangeStage, const char*> stages[] = {
      {ExchangeStage::kNone, "the attempt at URL"},
      {ExchangeStage::kLookUp, "the look-up of the host of URL"},
      {ExchangeStage::kConnection, "the connection to URL"},
      {ExchangeStage::kHandshake, "the TLS handshake with URL"},
      {ExchangeStage::kSending, "the request to be sent to URL"},
      {ExchangeStage::kAnswer, "the answer of URL"},
      {ExchangeStage::kRestOfAnswer, "the rest of the answer of URL"}};
  for (const auto& [exchange, expected] : stages) {
    EXPECT_EQ(Describe(Stage::kAttempt, "URL", exchange), expected);
  }
}

TEST(StageTest, OtherStagesDoNot) {
  const std::pair<Stage, const char*> stages[] = {
      {Stage::kWorker, "a worker thread"},
      {Stage::kTurnOfFunction, "its turn to call the login's function"},
      {Stage::kFunction, "the login's function"},
      {Stage::kGate, "the login of another call"},
      {Stage::kBase, "the token to exchange"},
      {Stage::kTurn, "its turn, since as many attempts as may be are under way"},
      {Stage::kPause, "the next attempt"}};
  for (const auto& [stage, expected] : stages) {
    EXPECT_EQ(Describe(stage, "URL", ExchangeStage::kAnswer), expected);
  }
}

class StageMessageTest : public SourceFixture {};

/// A service that accepts connections and never answers.
class SilentService {
 public:
  SilentService() : socket_(socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0)) {
    sockaddr_in address{};
    address.sin_family = AF_INET;
    address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
    socklen_t size = sizeof address;
    auto* const generic = reinterpret_cast<sockaddr*>(&address);
    if (bind(socket_, generic, size) != 0 || listen(socket_, 1) != 0 ||
        getsockname(socket_, generic, &size) != 0) {
      throw std::runtime_error("no port");
    }
    port_ = ntohs(address.sin_port);
  }
  ~SilentService() { close(socket_); }
  SilentService(const SilentService&) = delete;
  SilentService& operator=(const SilentService&) = delete;

  int Port() const { return port_; }

 private:
  const int socket_;
  int port_ = 0;
};

TEST_F(StageMessageTest, WithoutAWorker) {
  Make();
  const auto reply = Ask(spec, Within(seconds(1)));
  runtime->Pass(seconds(2));
  runtime->Settle();
  EXPECT_EQ(reply->Message(), kWaitingFor + "a worker thread.");
}

TEST_F(StageMessageTest, AttemptNamesTheEndpointThatIsAsked) {
  scripts[0]->Set(Fails(Unreachable()));
  scripts[1]->Set([&](const AttemptRequest&, Limit&) {
    runtime->Pass(seconds(2));
    return Unreachable();
  });
  Make();
  EXPECT_EQ(Get(spec, Within(seconds(1))).Message(),
            kWaitingFor +
                "the attempt at https://b.example.com/sts. The last attempt had failed: Connection "
                "refused.");
}

TEST_F(StageMessageTest, StageOfTheExchangeUnderWay) {
  UseCertificate();
  const SilentService service;
  scripts[0]->Set([&](const AttemptRequest&, Limit& limit) {
    const auto connections = Tarnik::Http::CreateTCPConnectionSpec("127.0.0.1", service.Port());
    const auto inner = Tarnik::Http::CreateHttpUserAgent(connections.get(), nullptr, nullptr);
    const auto agent = Tarnik::Http::CreateBoundedUserAgent(inner.get(), &limit);
    Tarnik::Ref<Tarnik::Http::ClientRequest> request;
    Tarnik::Http::CreateHttpRequest(Tarnik::Http::Method::GET, "/", request);
    const auto item = agent->SendAsync(
        request.get(), [](Tarnik::Exception*, auto*, auto*) {}, 0);
    while (limit.Stage() != ExchangeStage::kAnswer) {
      std::this_thread::yield();
    }
    runtime->Pass(seconds(2));
    EXPECT_TRUE(limit.IsCancelled());
    EXPECT_EQ(limit.Stage(), ExchangeStage::kNone);
    return Unreachable();
  });
  Make();
  EXPECT_EQ(Get(spec, Within(seconds(1))).Message(),
            kWaitingFor + "the answer of https://a.example.com/sts.");
}

TEST_F(StageMessageTest, RequestOfAnotherCall) {
  scripts[0]->Set([&](const AttemptRequest&, Limit&) {
    runtime->Pass(seconds(2));
    return Issued(NewToken(hours(1)));
  });
  Make();
  const auto first = Ask(spec);
  const auto second = Ask(spec, Within(seconds(1)));
  runtime->Settle();
  EXPECT_NE(first->token, nullptr);
  EXPECT_EQ(second->Message(), kWaitingFor +
                                   "the request of another call, which was waiting for the attempt "
                                   "at https://a.example.com/sts.");
}

TEST_F(StageMessageTest, RequestOfAnotherCallThatPauses) {
  ForAll(Fails(Unreachable()));
  config.retry.firstDelay = minutes(1);
  Make();
  const auto first = Ask(spec);
  const auto second = Ask(spec, Within(seconds(1)));
  runtime->Advance(seconds(1));
  EXPECT_FALSE(first->Has());
  EXPECT_EQ(second->Message(), kWaitingFor +
                                   "the request of another call, which was waiting for the next "
                                   "attempt. The last attempt had failed: Connection refused.");
}

TEST_F(StageMessageTest, RequestInTheBackground) {
  config.keepFresh = {spec};
  scripts[0]->Set([&](const AttemptRequest&, Limit&) {
    const auto reply = Ask(spec, Within(seconds(1)));
    runtime->Pass(seconds(2));
    runtime->Settle();
    EXPECT_EQ(reply->Message(), kWaitingFor +
                                    "a request of the source, which was waiting for the attempt at "
                                    "https://a.example.com/sts.");
    return Issued(NewToken(hours(1)));
  });
  Make();
  runtime->Settle();
  EXPECT_EQ(Attempts(), 1U);
}

}  // namespace

}  // namespace SsoClient::Access::Testing
