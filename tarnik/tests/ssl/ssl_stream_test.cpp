#include "ssl/ssl_stream.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <atomic>
#include <chrono>
#include <memory>
#include <string>
#include <thread>
#include <vector>

#include "ssl/tls_fixture.h"
#include "support/memory_tls_peer.h"

namespace Tarnik::Ssl {
namespace {

using namespace std::chrono_literals;
using Testing::MemoryTlsPeer;
using Testing::Outcome;
using Testing::ReadAll;
using Testing::TestPki;
using Testing::TlsClient;
using Testing::TlsPeerOptions;
using Testing::TlsServer;
using Testing::TrustingContext;
using Testing::WriteAll;

constexpr const char* kCutOff =
    "The TLS connection with sts.example was closed without close_notify: the data may be cut off.";

/// A TLS stream to a server in memory.
class SSLStreamAsync : public testing::TestWithParam<int> {
 protected:
  SSLStreamAsync() {
    TlsPeerOptions options;
    options.identity = &TestPki::Get().leaf;
    options.minVersion = options.maxVersion = GetParam();
    serverContext_ = Testing::MakeServerContext(options);
    context_ = TrustingContext(TestPki::Get().root);
  }
  ~SSLStreamAsync() override {
    if (stream_ != nullptr) {
      stream_->Close();
    }
  }

  void Wrap(const MemoryTlsPeer::Behaviour& behaviour) {
    if (stream_ != nullptr) {
      stream_->Close();
    }
    peer_ = MakeRef<MemoryTlsPeer>(serverContext_.get(), behaviour);
    stream_ = context_->WrapStream(peer_.get(), "label");
  }

  Outcome StartHandshake() {
    Outcome outcome;
    stream_->HandshakeClientAsync("sts.example", "", outcome.ForWrite());
    return outcome;
  }

  std::string Handshake() {
    const Outcome outcome = StartHandshake();
    return outcome.Wait() ? outcome.Message() : "no completion";
  }

  /// How many bytes the server sends in a good exchange.
  std::size_t MeasureExchange() {
    Wrap({});
    EXPECT_EQ(Handshake(), "");
    std::string error;
    EXPECT_EQ(ReadAll(*stream_, 100, &error), "hello");
    EXPECT_EQ(error, "");
    return peer_->BytesMade();
  }

  OpenSsl::OwnedSslContext serverContext_;
  Ref<SSLContext> context_;
  Ref<MemoryTlsPeer> peer_;
  Ref<SSLStream> stream_;
};

INSTANTIATE_TEST_SUITE_P(Versions, SSLStreamAsync, testing::Values(TLS1_2_VERSION, TLS1_3_VERSION),
                         Testing::NameOfVersion);

TEST_P(SSLStreamAsync, TakesCloseNotifyForTheOrderlyEnd) {
  Wrap({});
  ASSERT_EQ(Handshake(), "");
  std::string error;
  EXPECT_EQ(ReadAll(*stream_, 100, &error), "hello");
  EXPECT_EQ(error, "");
  EXPECT_EQ(ReadAll(*stream_, 100, &error), "");
  EXPECT_EQ(error, "");
  EXPECT_EQ(stream_->ToString(), "<SSLStream:label>");
}

TEST_P(SSLStreamAsync, WorksOnBytesThatDribbleIn) {
  MemoryTlsPeer::Behaviour behaviour;
  behaviour.pieceSize = 1;
  Wrap(behaviour);
  ASSERT_EQ(Handshake(), "");
  std::string error;
  EXPECT_EQ(ReadAll(*stream_, 100, &error, 1), "hello");
  EXPECT_EQ(error, "");
}

TEST_P(SSLStreamAsync, NeverTakesCutOffDataForAllOfIt) {
  const std::size_t size = MeasureExchange();
  for (std::size_t cut = 0; cut < size; ++cut) {
    context_ = TrustingContext(TestPki::Get().root);  // A full handshake each time.
    MemoryTlsPeer::Behaviour behaviour;
    behaviour.cutAfter = cut;
    behaviour.atCut = cut % 2 == 0 ? MemoryTlsPeer::AtCut::kEnd : MemoryTlsPeer::AtCut::kReset;
    Wrap(behaviour);
    const Outcome handshake = StartHandshake();
    ASSERT_TRUE(handshake.Wait());
    // Signatures, and so sizes, differ by a few bytes from one handshake to the next.
    if (cut >= peer_->BytesMade()) {
      continue;
    }
    const bool isReset = behaviour.atCut == MemoryTlsPeer::AtCut::kReset;
    if (!handshake.Message().empty()) {
      ASSERT_EQ(handshake.Message(),
                std::string("TLS handshake with sts.example failed: ") +
                    (isReset ? "reset in memory" : "the peer closed the connection"))
          << "cut after " << cut;
      ASSERT_TRUE(handshake.IsError<SSLException>());
      ASSERT_EQ(handshake.Count(), 1);
      continue;
    }
    std::string error;
    const std::string data = ReadAll(*stream_, 100, &error);
    ASSERT_EQ(error, isReset ? "reset in memory" : kCutOff) << "cut after " << cut;
    ASSERT_EQ(data, std::string("hello").substr(0, data.size()));
  }
}

TEST_P(SSLStreamAsync, FailsWithEachWriteThatFails) {
  MeasureExchange();
  const std::size_t writes = peer_->Writes();
  ASSERT_GE(writes, 2U);
  for (std::size_t failing = 0; failing < writes; ++failing) {
    context_ = TrustingContext(TestPki::Get().root);
    MemoryTlsPeer::Behaviour behaviour;
    behaviour.failingWrite = failing;
    Wrap(behaviour);
    const Outcome handshake = StartHandshake();
    ASSERT_TRUE(handshake.Wait());
    const bool isAfterHandshake = handshake.Message().empty();
    std::string error = handshake.Message();
    if (isAfterHandshake) {
      ReadAll(*stream_, 100, &error);
    }
    EXPECT_EQ(error, isAfterHandshake
                         ? "write failed in memory"
                         : "TLS handshake with sts.example failed: write failed in memory");
  }
}

TEST_P(SSLStreamAsync, CancelsAtEveryStage) {
  const std::size_t size = MeasureExchange();
  int cancelled = 0;
  for (std::size_t stall = 0; stall < size; stall += 37) {
    context_ = TrustingContext(TestPki::Get().root);
    MemoryTlsPeer::Behaviour behaviour;
    behaviour.cutAfter = stall;
    behaviour.atCut = MemoryTlsPeer::AtCut::kSilence;
    Wrap(behaviour);
    Outcome outcome = StartHandshake();
    if (outcome.Wait(5ms) && outcome.Message().empty()) {
      outcome = Outcome();
      const auto buffer = std::make_shared<std::vector<char>>(1);
      stream_->ReadAsync(buffer->data(), 1, [outcome, buffer](std::size_t bytes, Exception* error) {
        outcome.Report(error, bytes);
      });
    }
    stream_->Close();
    stream_->Close();
    ASSERT_TRUE(outcome.Wait());
    // Only what has ended before is not cancelled.
    EXPECT_TRUE(outcome.IsError<CancelledException>() || outcome.Message().empty())
        << outcome.Message();
    cancelled += outcome.IsError<CancelledException>() ? 1 : 0;
    EXPECT_EQ(outcome.Count(), 1);
    EXPECT_TRUE(peer_->IsClosed());
  }
  EXPECT_GT(cancelled, 10);
}

TEST_P(SSLStreamAsync, ClosesTheStreamBelowOnceItHasFailed) {
  context_ = CreateSSLContext({});
  Wrap({});
  EXPECT_NE(Handshake(), "");
  const auto limit = std::chrono::steady_clock::now() + Testing::kPatience;
  while (!peer_->IsClosed() && std::chrono::steady_clock::now() < limit) {
    std::this_thread::yield();
  }
  EXPECT_TRUE(peer_->IsClosed());
}

TEST_P(SSLStreamAsync, CompletesOnceWhenClosedAtAnyMoment) {
  for (int i = 0; i < 60; ++i) {
    Wrap({});
    const Outcome outcome = StartHandshake();
    std::thread closer([stream = stream_, i] {
      for (int spin = 0; spin < i * 2000; ++spin) {
        std::atomic_signal_fence(std::memory_order_seq_cst);
      }
      stream->Close();
    });
    ASSERT_TRUE(outcome.Wait());
    closer.join();
    EXPECT_EQ(outcome.Count(), 1);
  }
}

TEST_P(SSLStreamAsync, CancelsWhatIsStartedAfterClose) {
  Wrap({});
  ASSERT_EQ(Handshake(), "");
  stream_->Close();
  char buffer[1];
  const Outcome read;
  stream_->ReadAsync(buffer, 1, read.ForRead());
  ASSERT_TRUE(read.Wait());
  EXPECT_TRUE(read.IsError<CancelledException>());
  EXPECT_EQ(read.Message(), "The TLS connection was closed on this side.");
  EXPECT_EQ(WriteAll(*stream_, "x"), read.Message());
}

TEST_P(SSLStreamAsync, CancelsTheHandshakeOfAClosedStream) {
  Wrap({});
  stream_->Close();
  const Outcome outcome = StartHandshake();
  ASSERT_TRUE(outcome.Wait());
  EXPECT_TRUE(outcome.IsError<CancelledException>());
}

TEST_P(SSLStreamAsync, KeepsFailingAfterAFailedHandshake) {
  context_ = CreateSSLContext({});
  Wrap({});
  const std::string message = Handshake();
  EXPECT_NE(message, "");
  std::string error;
  EXPECT_EQ(ReadAll(*stream_, 1, &error), "");
  EXPECT_EQ(error, message);
  EXPECT_EQ(WriteAll(*stream_, "x"), message);
}

TEST_P(SSLStreamAsync, RefusesOperationsOutOfOrder) {
  Wrap({});
  char buffer[1];
  EXPECT_THROW(stream_->ReadAsync(buffer, 1, Outcome().ForRead()), InvalidStateException);
  EXPECT_THROW(stream_->WriteAsync(buffer, 1, Outcome().ForWrite()), InvalidStateException);
  ASSERT_EQ(Handshake(), "");
  EXPECT_THROW(StartHandshake(), InvalidStateException);
  EXPECT_THROW(stream_->ReadAsync(buffer, 0, Outcome().ForRead()), InvalidArgumentException);
}

TEST_P(SSLStreamAsync, RefusesNamesBeforeAnythingIsSent) {
  Wrap({});
  for (const std::string& name : {std::string(), std::string("a\r\nb"), std::string("a\0b", 3)}) {
    EXPECT_THROW(stream_->HandshakeClientAsync(name, "", Outcome().ForWrite()),
                 InvalidArgumentException);
  }
  EXPECT_THROW(stream_->HandshakeClientAsync("sts.example", "a b", Outcome().ForWrite()),
               InvalidArgumentException);
  EXPECT_THROW(stream_->HandshakeClientAsync("sts.example", "", {}), InvalidArgumentException);
  EXPECT_EQ(peer_->Writes(), 0U);
}

TEST_P(SSLStreamAsync, CompletesOnPoolThreadsAlone) {
  Wrap({});
  const Outcome handshake = StartHandshake();
  ASSERT_TRUE(handshake.Wait());
  EXPECT_NE(handshake.Thread(), std::this_thread::get_id());
  char buffer[100];
  const Outcome read;
  stream_->ReadAsync(buffer, sizeof(buffer), read.ForRead());
  ASSERT_TRUE(read.Wait());
  EXPECT_NE(read.Thread(), std::this_thread::get_id());
}

TEST_P(SSLStreamAsync, SaysWhenThePeerDoesNotSpeakTls) {
  Testing::LoopbackListener listener;
  std::thread peer([&] {
    const auto socket = listener.Accept();
    Testing::SendAll(socket.Get(), "HTTP/1.1 400 Bad Request\r\n\r\n");
    Testing::ReceiveExactly(socket.Get(), 100000);
  });
  {
    const TlsClient client(*context_, listener.Port());
    EXPECT_EQ(client.Message(), "TLS handshake with sts.example failed: wrong version number");
    EXPECT_TRUE(client.Handshake().IsError<SSLException>());
  }
  peer.join();
}

TEST_P(SSLStreamAsync, RefusesAnAlteredRecord) {
  // The server's memory is altered between two records by a stream in the middle.
  class Altering final : public System::Stream, public ObjectImpl {
   public:
    Altering(System::Stream* below, std::size_t at) : below_(below), at_(at) {}
    void ReadAsync(char* buffer, std::size_t size, ReadCompletion completion) override {
      below_->ReadAsync(buffer, size,
                        [this, self = Ref<Altering>(this), buffer, completion](std::size_t bytes,
                                                                               Exception* error) {
                          if (at_ >= seen_ && at_ < seen_ + bytes) {
                            buffer[at_ - seen_] = static_cast<char>(buffer[at_ - seen_] ^ 1);
                          }
                          seen_ += bytes;
                          completion(bytes, error);
                        });
    }
    void WriteAsync(const char* data, std::size_t size, WriteCompletion completion) override {
      below_->WriteAsync(data, size, std::move(completion));
    }
    void Close() noexcept override { below_->Close(); }

   private:
    const Ref<System::Stream> below_;
    const std::size_t at_;
    std::size_t seen_ = 0;
  };
  const std::size_t size = MeasureExchange();
  context_ = TrustingContext(TestPki::Get().root);
  peer_ = MakeRef<MemoryTlsPeer>(serverContext_.get(), MemoryTlsPeer::Behaviour());
  // The last byte of the close_notify may lie a few bytes off; the one before it surely is in it.
  const auto altering = MakeRef<Altering>(peer_.get(), size - 12);
  stream_ = context_->WrapStream(altering.get(), "");
  ASSERT_EQ(Handshake(), "");
  std::string error;
  const std::string data = ReadAll(*stream_, 100, &error);
  EXPECT_THAT(error, testing::StartsWith("Cannot read from the TLS connection with sts.example: "));
  EXPECT_EQ(data, std::string("hello").substr(0, data.size()));
}

TEST_P(SSLStreamAsync, MovesMuchDataBothWaysAtOnce) {
  std::string sent(4 << 20, '\0');
  for (std::size_t i = 0; i < sent.size(); ++i) {
    sent[i] = static_cast<char>(i * 31 + i / 4096);
  }
  // One thread serves a connection, so it answers piece by piece: both directions stay busy.
  TlsPeerOptions options;
  options.identity = &TestPki::Get().leaf;
  options.minVersion = options.maxVersion = GetParam();
  std::string received;
  TlsServer server(options, 1, [&](SSL* ssl) {
    constexpr std::size_t kPiece = 65536;
    while (received.size() < sent.size()) {
      const std::string piece = Testing::TlsReadExactly(ssl, kPiece);
      if (piece.empty() || !Testing::TlsWrite(ssl, piece)) {
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

TEST_P(SSLStreamAsync, WritesNothingAtOnce) {
  Wrap({});
  ASSERT_EQ(Handshake(), "");
  EXPECT_EQ(WriteAll(*stream_, ""), "");
}

TEST_P(SSLStreamAsync, RefusesASecondReadAndASecondWriteAtOnce) {
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

TEST_P(SSLStreamAsync, RefusesToRenegotiate) {
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

TEST(SSLStreamConcurrent, SharesOneContextAmongManyConnections) {
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
}  // namespace Tarnik::Ssl
