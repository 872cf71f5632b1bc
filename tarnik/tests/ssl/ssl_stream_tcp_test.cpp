#include <atomic>
#include <cstddef>
#include <string>
#include <thread>
#include <utility>
#include <vector>

#include <gtest/gtest.h>
#include <sys/socket.h>

#include <tarnik/core/exception.h>
#include <tarnik/ssl/ssl_context.h>
#include <tarnik/ssl/ssl_exception.h>

#include "ssl/tls_fixture.h"
#include "support/loopback.h"
#include "support/outcome.h"
#include "support/tls_peer.h"

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::Ssl;

/// TLS streams over TCP to a server on the loopback interface.
class SSLStreamTcpAsyncTest : public testing::TestWithParam<int> {
 protected:
  const Ref<SSLContext> context_ = TrustingContext(TestPki::Get().root);
};

INSTANTIATE_TEST_SUITE_P(Versions, SSLStreamTcpAsyncTest,
                         testing::Values(TLS1_2_VERSION, TLS1_3_VERSION), NameOfVersion);

TEST_P(SSLStreamTcpAsyncTest, ReportsAPeerThatDoesNotSpeakTls) {
  const std::string plainHttp = "the peer answers in plain HTTP";
  const std::string other = "the peer does not answer in TLS";
  for (const auto& [answer, reason] :
       {std::pair{std::string("HTTP/1.1 400 Bad Request\r\n\r\n"), plainHttp},
        std::pair{std::string("220 mail.example ESMTP\r\n"), other},
        std::pair{std::string("\x16HTTP/1.1"), other}, std::pair{std::string("H"), other}}) {
    LoopbackListener listener;
    std::thread peer([&listener, text = answer] {
      const auto socket = listener.Accept();
      SendAll(socket.Get(), text);
      shutdown(socket.Get(), SHUT_WR);
      ReceiveExactly(socket.Get(), 100000);
    });
    {
      const TlsClient client(*context_, listener.Port());
      EXPECT_EQ(client.Message(), "TLS handshake with sts.example:PORT failed: " + reason);
      EXPECT_TRUE(client.Handshake().IsError<SSLException>());
    }
    peer.join();
  }
}

TEST_P(SSLStreamTcpAsyncTest, TransfersMuchDataInBothDirectionsAtOnce) {
  std::string sent(4 << 20, '\0');
  for (std::size_t i = 0; i < sent.size(); ++i) {
    sent[i] = static_cast<char>(i * 31 + i / 4096);
  }
  // One thread serves a connection and echoes piece by piece, so both directions stay busy.
  TlsPeerOptions options;
  options.identity = &TestPki::Get().leaf;
  options.minVersion = options.maxVersion = GetParam();
  std::string received;
  TlsServer server(options, 1, [&](SSL* ssl) {
    constexpr std::size_t kPiece = 65536;
    while (received.size() < sent.size()) {
      const std::string piece = TlsReadExactly(ssl, kPiece);
      if (piece.empty() || !TlsWrite(ssl, piece)) {
        return;
      }
      received += piece;
    }
    SSL_shutdown(ssl);
  });
  const TlsClient client(*context_, server.Port());
  ASSERT_EQ(client.Message(), "");
  const Outcome written;
  client.Stream().WriteAsync(sent.data(), sent.size(), written.ForWrite());
  std::string error;
  const std::string echoed = ReadAll(client.Stream(), sent.size() + 1, &error);
  ASSERT_TRUE(written.Wait());
  EXPECT_EQ(written.Message(), "");
  EXPECT_EQ(error, "");
  server.Join();
  EXPECT_TRUE(echoed == sent);
  EXPECT_TRUE(received == sent);
}

TEST_P(SSLStreamTcpAsyncTest, RefusesASecondReadAndASecondWriteAtTheSameTime) {
  TlsPeerOptions options;
  options.identity = &TestPki::Get().leaf;
  std::atomic<bool> go{false};
  TlsServer server(options, 1, [&](SSL*) { go.wait(false); });
  {
    const TlsClient client(*context_, server.Port());
    ASSERT_EQ(client.Message(), "");
    char buffer[1];
    const std::string much(64 << 20, 'x');
    const Outcome read;
    const Outcome write;
    client.Stream().ReadAsync(buffer, 1, read.ForRead());
    client.Stream().WriteAsync(much.data(), much.size(), write.ForWrite());
    EXPECT_THROW(client.Stream().ReadAsync(buffer, 1, read.ForRead()), InvalidStateException);
    EXPECT_THROW(client.Stream().WriteAsync(buffer, 1, write.ForWrite()), InvalidStateException);
    client.Stream().Close();
    EXPECT_TRUE(read.Wait());
    EXPECT_TRUE(write.Wait());
    EXPECT_TRUE(write.IsError<CancelledException>());
  }
  go = true;
  go.notify_all();
}

TEST_P(SSLStreamTcpAsyncTest, RefusesToRenegotiate) {
  if (GetParam() != TLS1_2_VERSION) {
    GTEST_SKIP() << "TLS 1.3 has no renegotiation";
  }
  TlsPeerOptions options;
  options.identity = &TestPki::Get().leaf;
  options.maxVersion = TLS1_2_VERSION;
  std::atomic<int> handshake{1};
  TlsServer server(options, 1, [&](SSL* ssl) {
    SSL_renegotiate(ssl);
    handshake = SSL_do_handshake(ssl);
    char byte = 0;
    SSL_read(ssl, &byte, 1);
    handshake = SSL_renegotiate_pending(ssl) == 0 ? 1 : 0;
  });
  {
    const TlsClient client(*context_, server.Port());
    ASSERT_EQ(client.Message(), "");
    std::string error;
    EXPECT_EQ(ReadAll(client.Stream(), 100, &error), "");
    EXPECT_NE(error, "");
  }
  server.Join();
  EXPECT_EQ(handshake, 0);
}

TEST(SSLStreamConcurrencyTest, SharesOneContextAmongManyConnections) {
  constexpr int kThreads = 4;
  constexpr int kConnections = 10;
  const auto context = TrustingContext(TestPki::Get().root);
  TlsPeerOptions options;
  options.identity = &TestPki::Get().leaf;
  std::atomic<int> good{0};
  std::vector<std::thread> threads;
  for (int i = 0; i < kThreads; ++i) {
    threads.emplace_back([&] {
      TlsServer server(options, kConnections);
      for (int j = 0; j < kConnections; ++j) {
        const TlsClient client(*context, server.Port());
        std::string error;
        good += client.Message().empty() && ReadAll(client.Stream(), 100, &error) == "hello" &&
                error.empty();
      }
    });
  }
  for (auto& thread : threads) {
    thread.join();
  }
  EXPECT_EQ(good, kThreads * kConnections);
}

}  // namespace
}  // namespace Tarnik::Testing
