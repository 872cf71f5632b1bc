#include "ssl/ssl_stream.h"

#include <atomic>
#include <chrono>
#include <cstddef>
#include <memory>
#include <string>
#include <thread>
#include <utility>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <tarnik/core/exception.h>
#include <tarnik/core/object_impl.h>
#include <tarnik/ssl/ssl_context.h>
#include <tarnik/ssl/ssl_exception.h>
#include <tarnik/system/stream.h>

#include "ssl/tls_fixture.h"
#include "support/memory_tls_peer.h"
#include "support/openssl.h"
#include "support/outcome.h"
#include "support/tls_peer.h"

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::Ssl;
using namespace std::chrono_literals;

constexpr const char* kCutOff =
    "The TLS connection with sts.example was closed without close_notify: the data may be cut off.";

/// A TLS stream to a server in memory.
class SSLStreamAsyncTest : public testing::TestWithParam<int> {
 protected:
  SSLStreamAsyncTest() {
    TlsPeerOptions options;
    options.identity = &TestPki::Get().leaf;
    options.minVersion = options.maxVersion = GetParam();
    serverContext_ = MakeServerContext(options);
    context_ = TrustingContext(TestPki::Get().root);
  }
  ~SSLStreamAsyncTest() override {
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

  /// How many bytes the server sends in a successful exchange.
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

INSTANTIATE_TEST_SUITE_P(Versions, SSLStreamAsyncTest,
                         testing::Values(TLS1_2_VERSION, TLS1_3_VERSION), NameOfVersion);

TEST_P(SSLStreamAsyncTest, TreatsCloseNotifyAsTheEndOfTheStream) {
  Wrap({});
  ASSERT_EQ(Handshake(), "");
  std::string error;
  EXPECT_EQ(ReadAll(*stream_, 100, &error), "hello");
  EXPECT_EQ(error, "");
  EXPECT_EQ(ReadAll(*stream_, 100, &error), "");
  EXPECT_EQ(error, "");
  EXPECT_EQ(stream_->ToString(), "<SSLStream:label>");
}

TEST_P(SSLStreamAsyncTest, WorksWhenBytesArriveOneByOne) {
  MemoryTlsPeer::Behaviour behaviour;
  behaviour.pieceSize = 1;
  Wrap(behaviour);
  ASSERT_EQ(Handshake(), "");
  std::string error;
  EXPECT_EQ(ReadAll(*stream_, 100, &error, 1), "hello");
  EXPECT_EQ(error, "");
}

TEST_P(SSLStreamAsyncTest, DetectsTruncationAtEveryByte) {
  const std::size_t size = MeasureExchange();
  for (std::size_t cut = 0; cut < size; ++cut) {
    context_ = TrustingContext(TestPki::Get().root);  // A full handshake each time.
    MemoryTlsPeer::Behaviour behaviour;
    behaviour.cutAfter = cut;
    behaviour.atCut = cut % 2 == 0 ? MemoryTlsPeer::AtCut::kEnd : MemoryTlsPeer::AtCut::kReset;
    Wrap(behaviour);
    const Outcome handshake = StartHandshake();
    ASSERT_TRUE(handshake.Wait());
    // The sizes of signatures, and so of handshakes, differ by a few bytes.
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

TEST_P(SSLStreamAsyncTest, ReportsEveryWriteThatFails) {
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

TEST_P(SSLStreamAsyncTest, CancelsAtEveryStage) {
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
    // Operations that ended before the close are not cancelled.
    EXPECT_TRUE(outcome.IsError<CancelledException>() || outcome.Message().empty())
        << outcome.Message();
    cancelled += outcome.IsError<CancelledException>() ? 1 : 0;
    EXPECT_EQ(outcome.Count(), 1);
    EXPECT_TRUE(peer_->IsClosed());
  }
  EXPECT_GT(cancelled, 10);
}

TEST_P(SSLStreamAsyncTest, ClosesTheUnderlyingStreamAfterAFailure) {
  context_ = CreateSSLContext({});
  Wrap({});
  EXPECT_NE(Handshake(), "");
  const auto limit = std::chrono::steady_clock::now() + kPatience;
  while (!peer_->IsClosed() && std::chrono::steady_clock::now() < limit) {
    std::this_thread::yield();
  }
  EXPECT_TRUE(peer_->IsClosed());
}

TEST_P(SSLStreamAsyncTest, CompletesOnceWhenClosedAtAnyMoment) {
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

TEST_P(SSLStreamAsyncTest, CancelsWhatIsStartedAfterClose) {
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

TEST_P(SSLStreamAsyncTest, CancelsTheHandshakeOfAClosedStream) {
  Wrap({});
  stream_->Close();
  const Outcome outcome = StartHandshake();
  ASSERT_TRUE(outcome.Wait());
  EXPECT_TRUE(outcome.IsError<CancelledException>());
}

TEST_P(SSLStreamAsyncTest, KeepsFailingAfterAFailedHandshake) {
  context_ = CreateSSLContext({});
  Wrap({});
  const std::string message = Handshake();
  EXPECT_NE(message, "");
  std::string error;
  EXPECT_EQ(ReadAll(*stream_, 1, &error), "");
  EXPECT_EQ(error, message);
  EXPECT_EQ(WriteAll(*stream_, "x"), message);
}

TEST_P(SSLStreamAsyncTest, RefusesOperationsOutOfOrder) {
  Wrap({});
  char buffer[1];
  EXPECT_THROW(stream_->ReadAsync(buffer, 1, Outcome().ForRead()), InvalidStateException);
  EXPECT_THROW(stream_->WriteAsync(buffer, 1, Outcome().ForWrite()), InvalidStateException);
  ASSERT_EQ(Handshake(), "");
  EXPECT_THROW(StartHandshake(), InvalidStateException);
  EXPECT_THROW(stream_->ReadAsync(buffer, 0, Outcome().ForRead()), InvalidArgumentException);
}

TEST_P(SSLStreamAsyncTest, RefusesBadNamesBeforeAnythingIsSent) {
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

TEST_P(SSLStreamAsyncTest, CompletesOnlyOnPoolThreads) {
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

TEST_P(SSLStreamAsyncTest, RefusesAnAlteredRecord) {
  // A stream in between alters one byte that the server sends.
  class AlteringStream final : public System::Stream, public ObjectImpl {
   public:
    AlteringStream(System::Stream* inner, std::size_t at) : inner_(inner), at_(at) {}
    void ReadAsync(char* buffer, std::size_t size, ReadCompletion completion) override {
      inner_->ReadAsync(buffer, size,
                        [this, self = Ref<AlteringStream>(this), buffer, completion](
                            std::size_t bytes, Exception* error) {
                          if (at_ >= seen_ && at_ < seen_ + bytes) {
                            buffer[at_ - seen_] = static_cast<char>(buffer[at_ - seen_] ^ 1);
                          }
                          seen_ += bytes;
                          completion(bytes, error);
                        });
    }
    void WriteAsync(const char* data, std::size_t size, WriteCompletion completion) override {
      inner_->WriteAsync(data, size, std::move(completion));
    }
    void Close() noexcept override { inner_->Close(); }

   private:
    const Ref<System::Stream> inner_;
    const std::size_t at_;
    std::size_t seen_ = 0;
  };
  const std::size_t size = MeasureExchange();
  context_ = TrustingContext(TestPki::Get().root);
  peer_ = MakeRef<MemoryTlsPeer>(serverContext_.get(), MemoryTlsPeer::Behaviour());
  // The exchange may be a few bytes longer or shorter than the measured one, so aim before its end.
  const auto altering = MakeRef<AlteringStream>(peer_.get(), size - 12);
  stream_ = context_->WrapStream(altering.get(), "");
  ASSERT_EQ(Handshake(), "");
  std::string error;
  const std::string data = ReadAll(*stream_, 100, &error);
  EXPECT_THAT(error, testing::StartsWith("Cannot read from the TLS connection with sts.example: "));
  EXPECT_EQ(data, std::string("hello").substr(0, data.size()));
}

TEST_P(SSLStreamAsyncTest, CompletesAnEmptyWrite) {
  Wrap({});
  ASSERT_EQ(Handshake(), "");
  EXPECT_EQ(WriteAll(*stream_, ""), "");
}

}  // namespace
}  // namespace Tarnik::Testing
