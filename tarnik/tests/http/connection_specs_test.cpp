#include <cstdint>
#include <future>
#include <memory>
#include <string>
#include <thread>
#include <utility>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <tarnik/core/checked_cast.h>
#include <tarnik/core/exception.h>
#include <tarnik/core/object_impl.h>
#include <tarnik/http/connection_specs.h>
#include <tarnik/http/http_user_agent.h>
#include <tarnik/system/tcp_client_socket.h>
#include <tarnik/system/thread_pool.h>

#include "http/exchange_fixture.h"
#include "ssl/tls_fixture.h"
#include "support/loopback.h"
#include "support/tls_peer.h"
#include "system/host_lookup.h"
#include "system/tcp_client_socket_impl.h"
#include "system/thread_pool_impl.h"

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::Http;

/// The body of the answer, or the message of the failure.
std::string Exchange(ConnectionSpec& spec) {
  const auto agent = CreateHttpUserAgent(&spec, nullptr, nullptr);
  const auto record = std::make_shared<CompletionRecord>();
  const auto item = agent->SendAsync(PostRequest().get(), RecordIn(record), kPlentyOfTime);
  try {
    agent->Wait(item.get(), kPlentyOfTime);
    return record->body;
  } catch (const Exception& failure) {
    return failure.Message();
  }
}

Ref<CustomConnectionSpec> Custom(const Ref<ConnectionSpec>& spec) {
  return Ref<CustomConnectionSpec>(CheckedCast<CustomConnectionSpec>(spec.get()));
}

class TlsHttpServer {
 public:
  TlsHttpServer()
      : server_(Options(), 1, [](SSL* ssl) {
          TlsReadExactly(ssl, 1);
          TlsWrite(ssl, kHello);
        }) {}

  int Port() const { return server_.Port(); }
  std::string SeenName() { return server_.Join().front().serverName; }

 private:
  static TlsPeerOptions Options() {
    TlsPeerOptions options;
    options.identity = &TestPki::Get().leaf;
    return options;
  }

  TlsServer server_;
};

TEST(ConnectionSpecsAsyncTest, ATcpSpecConnects) {
  const LoopbackListener listener;
  std::thread server([&] {
    const Descriptor peer = listener.Accept();
    ReceiveExactly(peer.Get(), 1);
    SendAll(peer.Get(), kHello);
  });
  EXPECT_EQ(Exchange(*CreateTCPConnectionSpec("127.0.0.1", listener.Port())), "hello");
  server.join();
}

TEST(ConnectionSpecsAsyncTest, ATlsSpecChecksThePeer) {
  const auto context = TrustingContext(TestPki::Get().root);
  {
    TlsHttpServer server;
    EXPECT_EQ(Exchange(*CreateTLSConnectionSpec("127.0.0.1", server.Port(), context.get(),
                                                "sts.example")),
              "hello");
    EXPECT_EQ(server.SeenName(), "sts.example");
  }
  TlsHttpServer server;
  EXPECT_THAT(Exchange(*CreateTLSConnectionSpec("127.0.0.1", server.Port(), context.get(), "")),
              testing::EndsWith("does not name '127.0.0.1'"));
}

TEST(ConnectionSpecsAsyncTest, BothReportARefusal) {
  Descriptor holder;
  const int port = RefusingPort(holder);
  const std::string refused =
      "Cannot connect to 127.0.0.1:" + std::to_string(port) + ": Connection refused";
  const auto context = TrustingContext(TestPki::Get().root);
  EXPECT_EQ(Exchange(*CreateTCPConnectionSpec("127.0.0.1", port)), refused);
  EXPECT_EQ(Exchange(*CreateTLSConnectionSpec("127.0.0.1", port, context.get(), "")), refused);
}

TEST(ConnectionSpecsAsyncTest, ATimeOutSaysThatTheHandshakeIsMissing) {
  const LoopbackListener silent;
  const auto context = TrustingContext(TestPki::Get().root);
  const auto spec = CreateTLSConnectionSpec("127.0.0.1", silent.Port(), context.get(), "");
  const auto agent = CreateHttpUserAgent(spec.get(), nullptr, nullptr);
  const auto record = std::make_shared<CompletionRecord>();
  const auto item = agent->SendAsync(PostRequest().get(), RecordIn(record), 200000);
  EXPECT_THROW(agent->Wait(item.get(), 0), TimeoutException);
  EXPECT_EQ(record->message, "No answer from 127.0.0.1:" + std::to_string(silent.Port()) +
                                 " within 200 milliseconds: waiting for the TLS handshake.");
}

/// Looks its host up until `answer` is set.
class SlowLookUpSpec final : public CustomConnectionSpec, public ObjectImpl {
 public:
  std::string Host() const override { return "sts.example"; }
  std::string CookieHost() const override { return Host(); }
  std::string EndpointKey() const override { return "sts.example:443"; }
  bool IsProxy() const override { return false; }

  Ref<System::CancellableItem> StartConnect(ConnectCompletion completion) override {
    System::ConnectRules rules;
    rules.lookUp = [answered = answer.get_future().share()](const std::string&, int) {
      answered.wait();
      return System::HostAddresses{{}, "unknown"};
    };
    const auto socket = System::CreateTCPClientSocket(
        System::ToThreadPoolImpl(System::GetThreadPool().get()), std::move(rules));
    const auto item = System::CreateConnectItem(socket.get());
    socket->ConnectAsync(Host(), 443, completion);
    return item;
  }

  std::promise<void> answer;
};

// The message of an exchange whose look-up takes longer than `limit` milliseconds.
std::string MessageAfterSlowLookUp(std::uint32_t limit) {
  const auto spec = MakeRef<SlowLookUpSpec>();
  const auto agent = CreateHttpUserAgent(spec.get(), nullptr, nullptr);
  const auto record = std::make_shared<CompletionRecord>();
  const auto item = agent->SendAsync(PostRequest().get(), RecordIn(record), limit * 1000UL);
  EXPECT_THROW(agent->Wait(item.get(), 0), TimeoutException);
  spec->answer.set_value();
  return record->message;
}

TEST(ConnectionSpecsAsyncTest, ATimeOutSaysThatTheLookUpIsMissing) {
  // On a busy machine a short time is over before the look-up begins.
  std::uint32_t limit = 5;
  std::string message = MessageAfterSlowLookUp(limit);
  while (limit < 5000 && message.ends_with("waiting for the connection.")) {
    limit *= 4;
    message = MessageAfterSlowLookUp(limit);
  }
  EXPECT_EQ(message, "No answer from sts.example:443 within " + std::to_string(limit) +
                         " milliseconds: waiting for the host look-up.");
}

TEST(ConnectionSpecsTest, DescribeTheirEndpoint) {
  const auto context = TrustingContext(TestPki::Get().root);
  const auto plain = Custom(CreateTCPConnectionSpec("::1", 8080));
  EXPECT_EQ(plain->Host(), "::1");
  EXPECT_EQ(plain->CookieHost(), "::1");
  EXPECT_EQ(plain->EndpointKey(), "[::1]:8080");
  EXPECT_FALSE(plain->IsProxy());
  EXPECT_EQ(plain->ToString(), "<TCPConnectionSpec:[::1]:8080>");
  const auto tls = Custom(CreateTLSConnectionSpec("sts.example.", 443, context.get(), ""));
  EXPECT_EQ(tls->Host(), "sts.example.");
  EXPECT_EQ(tls->EndpointKey(), "sts.example.:443");
  EXPECT_EQ(tls->ToString(), "<TLSConnectionSpec:sts.example.:443>");
}

TEST(ConnectionSpecsTest, RefuseWhatCannotBeConnectedTo) {
  const auto context = TrustingContext(TestPki::Get().root);
  for (const char* host : {"", "[::1]", "a b", "1.2.3", "fe80::1%eth0"}) {
    EXPECT_THROW(CreateTCPConnectionSpec(host, 443), InvalidArgumentException) << host;
    EXPECT_THROW(CreateTLSConnectionSpec(host, 443, context.get(), ""), InvalidArgumentException)
        << host;
  }
  for (const int port : {-1, 0, 65536}) {
    EXPECT_THROW(CreateTCPConnectionSpec("sts.example", port), InvalidArgumentException);
    EXPECT_THROW(CreateTLSConnectionSpec("sts.example", port, context.get(), ""),
                 InvalidArgumentException);
  }
  EXPECT_THROW(CreateTLSConnectionSpec("sts.example", 443, nullptr, ""), InvalidArgumentException);
  EXPECT_THROW(CreateTLSConnectionSpec("sts.example", 443, context.get(), "a b"),
               InvalidArgumentException);
  EXPECT_NE(CreateTLSConnectionSpec("sts.example", 443, context.get(), "10.0.0.1"), nullptr);
}

}  // namespace
}  // namespace Tarnik::Testing
