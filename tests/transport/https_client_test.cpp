#include "transport/https_client.h"

#include <memory>
#include <string>
#include <type_traits>

#include <gmock/gmock.h>

#include <ssoclient/exceptions.h>
#include <tarnik/core/exception.h>
#include <tarnik/core/object_impl.h>
#include <tarnik/core/reader.h>
#include <tarnik/core/ref.h>
#include <tarnik/http/http_url.h>
#include <tarnik/ssl/ssl_context.h>

#include "support/thrown_message.h"
#include "support/vtable_slot.h"
#include "transport/fake_http.h"
#include "transport/fake_ssl.h"
#include "transport/loopback_server.h"
#include "transport/read_all.h"

namespace SsoClient::Testing {
namespace {

using testing::HasSubstr;
using testing::Not;

constexpr unsigned long kTimeout = 240'000'000;

std::string Send(TransportSession& session) {
  SoapRequest request;
  request.action = "urn:a";
  Tarnik::Ref<Tarnik::Reader> reader;
  session.SendRequest(request, reader);
  return ReadAll(*reader);
}

std::string ConstructionFailure(const std::string& url, Tarnik::Ssl::SSLContext* context) {
  return ThrownMessage<Tarnik::InvalidArgumentException>(
      [&] { const HttpsClient client(url, context, "", kTimeout, false); });
}

constexpr char kNoFailure[] = "Nothing was thrown.";

TEST(HttpsClientTest, PlainHttpNeedsNoSslContext) {
  EXPECT_EQ(ConstructionFailure("http://sts.example/path", nullptr), kNoFailure);
}

TEST(HttpsClientTest, HttpsNeedsAnSslContext) {
  EXPECT_EQ(ConstructionFailure("https://sts.example/path", nullptr),
            "HTTPS connection requested but no SSLContext provided.");
  const auto context = Tarnik::MakeRef<FakeSslContext>();
  EXPECT_EQ(ConstructionFailure("https://sts.example/path", context.get()), kNoFailure);
}

TEST(HttpsClientTest, KeepsTheSslContextAliveForItsLifetime) {
  const auto context = Tarnik::MakeRef<FakeSslContext>();
  {
    const HttpsClient client("https://sts.example/", context.get(), "", kTimeout, false);
    EXPECT_EQ(context->RefCount(), 2);
  }
  EXPECT_EQ(context->RefCount(), 1);
}

TEST(HttpsClientTest, PassesOnErrorsOfTheUrlParser) {
  for (const std::string url :
       {"", "sts.example", "ftp://sts.example/", "http://", "http:///path", "http://a b/",
        "http://a/\r\nX: 1", "http://a:99999/", "https://", "https://a:0/"}) {
    bool isHttps = false;
    std::string host;
    int port = 0;
    std::string path;
    const auto refusal = ThrownMessage<Tarnik::InvalidArgumentException>(
        [&] { Tarnik::Http::ParseHttpURL(url, isHttps, host, port, path); });
    EXPECT_NE(refusal, kNoFailure) << url;
    EXPECT_EQ(ConstructionFailure(url, nullptr), refusal) << url;
  }
}

TEST(HttpsClientTest, PostsToThePathOfTheUrl) {
  const LoopbackServer server([](const std::string&) { return OkAnswer("ok"); });
  for (const bool flag : {false, true}) {
    const HttpsClient client(server.Url("/sts/STSService?a=b"), nullptr, "", kTimeout, flag);
    EXPECT_EQ(Send(*client.CreateSession()), "ok");
  }
  const auto requests = server.Requests();
  ASSERT_EQ(requests.size(), 2U);
  for (const auto& request : requests) {
    EXPECT_THAT(request, testing::StartsWith("POST /sts/STSService?a=b HTTP/1.1\r\n"));
  }
}

TEST(HttpsClientTest, PlainHttpIgnoresTheSslContext) {
  const LoopbackServer server([](const std::string&) { return OkAnswer("ok"); });
  const auto context = Tarnik::MakeRef<FakeSslContext>();
  const HttpsClient client(server.Url("/"), context.get(), "peer", kTimeout, false);
  EXPECT_EQ(Send(*client.CreateSession()), "ok");
  EXPECT_EQ(context->wraps, 0);
  EXPECT_EQ(context->RefCount(), 1);
}

TEST(HttpsClientTest, PassesThePeerNameToTheHandshake) {
  const LoopbackServer server([](const std::string&) { return OkAnswer("ok"); });
  const auto context = Tarnik::MakeRef<FakeSslContext>();
  const std::string url = "https://127.0.0.1:" + std::to_string(server.Port()) + "/";
  const HttpsClient client(url, context.get(), "sts.example", kTimeout, false);
  EXPECT_EQ(Send(*client.CreateSession()), "ok");
  EXPECT_EQ(context->wraps, 1);
  EXPECT_EQ(context->host, "127.0.0.1");
  EXPECT_EQ(context->serverName, "sts.example");
}

TEST(HttpsClientTest, CookiesLiveAsLongAsTheSession) {
  const LoopbackServer server(
      [](const std::string&) { return OkAnswer("ok", "Set-Cookie: leg=1; Path=/\r\n"); });
  const HttpsClient client(server.Url("/sts"), nullptr, "", kTimeout, false);
  const auto session = client.CreateSession();
  Send(*session);
  Send(*session);
  Send(*client.CreateSession());
  const auto requests = server.Requests();
  ASSERT_EQ(requests.size(), 3U);
  EXPECT_THAT(requests[0], Not(HasSubstr("Cookie:")));
  EXPECT_THAT(requests[1], HasSubstr("\r\nCookie: leg=1\r\n"));
  EXPECT_THAT(requests[2], Not(HasSubstr("Cookie:")));
}

TEST(HttpsClientTest, EndsTheExchangeAtItsTimeOut) {
  const LoopbackServer server([](const std::string&) { return std::string(); });
  const HttpsClient client(server.Url("/"), nullptr, "", 50'000, false);
  EXPECT_THROW(Send(*client.CreateSession()), CommunicationException);
}

TEST(HttpsClientTest, SharesTheCallersUserAgentAmongSessions) {
  const auto agent = Tarnik::MakeRef<FakeUserAgent>();
  {
    const HttpsClient client(agent.get(), "not a URL but used as it is", kTimeout);
    EXPECT_EQ(agent->RefCount(), 2);
    const auto first = client.CreateSession();
    const auto second = client.CreateSession();
    EXPECT_NE(first, second);
    EXPECT_EQ(agent->RefCount(), 4);
  }
  EXPECT_EQ(agent->RefCount(), 1);
}

TEST(HttpsClientTest, GivesSessionsItsPathAndTimeOut) {
  const auto agent = Tarnik::MakeRef<FakeUserAgent>();
  const HttpsClient client(agent.get(), "/target", kTimeout);
  EXPECT_EQ(Send(*client.CreateSession()), "answer");
  EXPECT_THAT(agent->waitTimeouts, testing::ElementsAre(kTimeout));
  const HttpsClient badTarget(agent.get(), "/a b", kTimeout);
  EXPECT_THROW(Send(*badTarget.CreateSession()), Tarnik::InvalidArgumentException);
}

TEST(HttpsClientTest, RefusesANullUserAgent) {
  EXPECT_EQ(ThrownMessage<Tarnik::InvalidArgumentException>(
                [] { const HttpsClient client(nullptr, "/", kTimeout); }),
            "The HTTP user agent must not be null.");
}

TEST(HttpsClientTest, CreateSessionIsTheOnlySlot) {
  static_assert(!std::has_virtual_destructor_v<Transport>);
  const auto agent = Tarnik::MakeRef<FakeUserAgent>();
  const HttpsClient client(agent.get(), "/", kTimeout);
  const Transport& transport = client;
  using Create = std::shared_ptr<TransportSession>(const void*);
  EXPECT_EQ(Send(*VtableSlot<Create>(&transport, 0)(&transport)), "answer");
}

}  // namespace
}  // namespace SsoClient::Testing
