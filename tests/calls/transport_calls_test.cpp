// How the transport uses the platform, and the limits that each of its users sets.
#include <memory>
#include <string>

#include <gmock/gmock.h>

#include <ssoclient/gss_negotiation_context.h>
#include <ssoclient/security_token_service.h>
#include <ssoclient/security_token_service_config.h>
#include <ssoclient/token_spec.h>
#include <tarnik/core/exception.h>
#include <tarnik/core/object_impl.h>
#include <tarnik/core/reader.h>
#include <tarnik/core/ref.h>
#include <tarnik/http/http_user_agent.h>
#include <tarnik/ssl/ssl_context.h>

#include "calls/recorded_calls.h"
#include "sts/fakes.h"
#include "transport/fake_ssl.h"
#include "transport/https_client.h"
#include "transport/read_all.h"

namespace SsoClient::Testing {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;
using testing::SizeIs;

constexpr unsigned long kTimeout = 5'000'000;
constexpr char kHttps[] = "https://sts.example:8443/sts/STSService?a=b";
constexpr char kOwnAgent[] = "user agent: the spec, the cookie store, no pool";

class TransportCallsTest : public testing::Test {
 protected:
  TransportCallsTest() { ForgetCalls(); }
  ~TransportCallsTest() override { ForgetCalls(); }

  Tarnik::Ref<FakeSslContext> sslContext_ = Tarnik::MakeRef<FakeSslContext>();
};

TEST_F(TransportCallsTest, APlainUrlMakesAPlainSpec) {
  for (const bool flag : {false, true}) {
    ForgetCalls();
    const HttpsClient client("http://sts.example/", sslContext_.get(), "peer", kTimeout, flag);
    EXPECT_THAT(Recorded().log, ElementsAre(std::string("plain spec: sts.example:80, flag ") +
                                            (flag ? "set" : "not set")));
  }
}

TEST_F(TransportCallsTest, AnHttpsUrlMakesATlsSpec) {
  for (const bool flag : {false, true}) {
    ForgetCalls();
    const HttpsClient client(kHttps, sslContext_.get(), "peer", kTimeout, flag);
    EXPECT_THAT(Recorded().log, ElementsAre(std::string("TLS spec: sts.example:8443, flag ") +
                                            (flag ? "set" : "not set") + ", peer 'peer'"));
    EXPECT_EQ(Recorded().lastSslContext, sslContext_.get());
  }
}

TEST_F(TransportCallsTest, AClientHoldsItsSpecForItsLifetime) {
  {
    const HttpsClient client(kHttps, sslContext_.get(), "", kTimeout, false);
    EXPECT_EQ(Recorded().lastSpec->RefCount(), 2);
  }
  EXPECT_EQ(Recorded().lastSpec->RefCount(), 1);
}

TEST_F(TransportCallsTest, EachSessionHasItsOwnAgentAndCookies) {
  const HttpsClient client(kHttps, sslContext_.get(), "", kTimeout, false);
  Recorded().log.clear();
  const auto first = client.CreateSession();
  const auto second = client.CreateSession();
  EXPECT_THAT(Recorded().log,
              ElementsAre("cookie store ''", kOwnAgent, "cookie store ''", kOwnAgent));
  ASSERT_THAT(Recorded().agents, SizeIs(2));
  EXPECT_NE(Recorded().agents[0], Recorded().agents[1]);
}

TEST_F(TransportCallsTest, SessionsOfASharedAgentCreateNothing) {
  const auto agent = Tarnik::MakeRef<FakeUserAgent>();
  const HttpsClient client(agent.get(), kHttps, kTimeout);
  client.CreateSession();
  EXPECT_THAT(Recorded().log, IsEmpty());
}

TEST_F(TransportCallsTest, ARequestHasItsHeadersAndThenItsBodyInOneWrite) {
  const HttpsClient client(kHttps, sslContext_.get(), "", kTimeout, false);
  SoapRequest request;
  request.action = "urn:action";
  request.body = std::string(100'000, 'x');
  const auto session = client.CreateSession();
  const auto posted = ElementsAre("POST /sts/STSService?a=b", "Content-Type: text/xml",
                                  "SOAPAction: \"urn:action\"", "body: " + request.body, "sent");
  const auto& agent = Recorded().agents.at(0);
  agent->onSend = [] { Recorded().log.emplace_back("sent"); };

  Recorded().log.clear();
  Tarnik::Ref<Tarnik::Reader> reader;
  session->SendRequest(request, reader);
  EXPECT_THAT(Recorded().log, posted);
  EXPECT_EQ(ReadAll(*reader), "answer");
  EXPECT_THAT(agent->waitTimeouts, ElementsAre(kTimeout));

  Recorded().log.clear();
  Tarnik::Ref<Tarnik::Http::PendingRequestItem> handle;
  session->SendRequestAsync(
      request, [](const Tarnik::Exception*, Tarnik::Reader*) {}, handle);
  EXPECT_THAT(Recorded().log, posted);
  EXPECT_THAT(agent->sendTimeouts, ElementsAre(0UL, kTimeout));
}

TokenSpec OneMinute() {
  TokenSpec spec;
  spec.tokenLifetimeSec = 60;
  return spec;
}

SecurityTokenServiceConfig ConfigWith(Tarnik::Ssl::SSLContext* sslContext, bool flag) {
  SecurityTokenServiceConfig config;
  config.url = kHttps;
  config.tokenFactory = std::make_shared<FakeTokenFactory>();
  config.sslContext = sslContext;
  config.sslPeerName = "peer";
  config.flag = flag;
  return config;
}

// The fake agents return nothing that the operations understand. Only the time limit that they are
// given is checked.

TEST_F(TransportCallsTest, AServiceGivesEachExchange240SecondsAndPassesItsFlagOn) {
  for (const bool flag : {false, true}) {
    ForgetCalls();
    const auto service = CreateSecurityTokenService(ConfigWith(sslContext_.get(), flag));
    EXPECT_THAT(Recorded().log, ElementsAre(std::string("TLS spec: sts.example:8443, flag ") +
                                            (flag ? "set" : "not set") + ", peer 'peer'"));
    EXPECT_EQ(Recorded().lastSslContext, sslContext_.get());
    EXPECT_THROW(service->AcquireToken("alice", "pw", OneMinute()), Tarnik::Exception);
    ASSERT_THAT(Recorded().agents, SizeIs(1));
    EXPECT_THAT(Recorded().agents[0]->waitTimeouts, ElementsAre(240'000'000UL));
  }
}

TEST_F(TransportCallsTest, ANegotiationGivesEachLeg40SecondsOnOneSessionAndSetsNoFlag) {
  const auto context =
      InternalApi::CreateGssNegotiationContext(ConfigWith(sslContext_.get(), true), OneMinute());
  EXPECT_THAT(Recorded().log, ElementsAre("TLS spec: sts.example:8443, flag not set, peer 'peer'",
                                          "cookie store ''", kOwnAgent));
  EXPECT_EQ(Recorded().lastSslContext, sslContext_.get());
  EXPECT_EQ(Recorded().lastSpec->RefCount(), 1);  // the client is gone, and the session still works
  EXPECT_THROW(context->Negotiate({1}), Tarnik::Exception);
  EXPECT_THROW(context->Negotiate({1}), Tarnik::Exception);
  ASSERT_THAT(Recorded().agents, SizeIs(1));
  EXPECT_THAT(Recorded().agents[0]->waitTimeouts, ElementsAre(40'000'000UL, 40'000'000UL));
}

}  // namespace
}  // namespace SsoClient::Testing
