// TLS streams that are closed while memory is short on all threads.
#include <cstddef>
#include <string>
#include <utility>

#include <gtest/gtest.h>
#include <openssl/ssl.h>

#include <tarnik/core/exception.h>
#include <tarnik/core/ref.h>
#include <tarnik/ssl/ssl_context.h>

#include "faults/connected_socket_fixture.h"
#include "faults/ending.h"
#include "faults/fault_injection.h"
#include "support/loopback.h"
#include "support/openssl.h"
#include "support/test_pki.h"
#include "support/tls_peer.h"

namespace SsoClient::Testing {
namespace {

using Tarnik::Ssl::SSLStream;

const Tarnik::Testing::Identity& Ca() {
  static const Tarnik::Testing::Identity ca = Tarnik::Testing::MakeCa("Root");
  return ca;
}

const Tarnik::Testing::Identity& Peer() {
  static const Tarnik::Testing::Identity peer = Tarnik::Testing::MakeIdentity({}, &Ca());
  return peer;
}

/// A TLS stream to this thread.
class TlsCloseFaultsTest : public ConnectedSocketTest {
 protected:
  TlsCloseFaultsTest() {
    Tarnik::Ssl::SSLContextConfig trust;
    trust.caCertificates = {Ca().ToCertificate()};
    stream_ = Tarnik::Ssl::CreateSSLContext(trust)->WrapStream(socket_.get(), "");
  }
  ~TlsCloseFaultsTest() override { stream_->Close(); }

  void StartHandshake() { stream_->HandshakeClientAsync("sts.example", "", onHandshake_); }
  void Handshake() {
    StartHandshake();
    Tarnik::Testing::TlsPeerOptions options;
    options.identity = &Peer();
    context_ = Tarnik::Testing::MakeServerContext(options);
    server_.reset(SSL_new(context_.get()));
    SSL_set_fd(server_.get(), peer_.Get());
    EXPECT_EQ(SSL_accept(server_.get()), 1);
    handshake_.Await();
    EXPECT_TRUE(handshake_.IsSuccess());
  }
  /// Closes the stream and waits until `ending` is reported, all without memory.
  void CloseUntil(const Ending& ending) const {
    const MemoryShortage shortage;
    stream_->Close();
    ending.Await();
  }
  static void ExpectCancelledOnce(const Ending& ending) {
    EXPECT_TRUE(ending.IsCancelled());
    EXPECT_EQ(ending.Count(), 1);
  }

  SSLStream::HandshakeCompletion onHandshake_ = [this](Tarnik::Exception* error) {
    handshake_.Record(error);
  };

  Tarnik::Ref<SSLStream> stream_;
  Tarnik::OpenSsl::OwnedSslContext context_;
  Tarnik::OpenSsl::OwnedSsl server_;
  Ending handshake_;
};

TEST_F(TlsCloseFaultsTest, CloseOfAReadNeedsNoMemory) {
  Handshake();
  stream_->ReadAsync(buffer_, sizeof(buffer_), std::move(onRead_));
  CloseUntil(read_);
  ExpectCancelledOnce(read_);
}

TEST_F(TlsCloseFaultsTest, CloseOfAReadAndAWriteNeedsNoMemory) {
  Handshake();
  // More than all buffers of the connection hold. The peer does not read.
  const std::string data(std::size_t{32} << 20, 'x');
  stream_->WriteAsync(data.data(), data.size(), std::move(onWritten_));
  stream_->ReadAsync(buffer_, sizeof(buffer_), std::move(onRead_));
  CloseUntil(written_);
  read_.Await();
  ExpectCancelledOnce(written_);
  ExpectCancelledOnce(read_);
}

TEST_F(TlsCloseFaultsTest, CloseOfAHandshakeNeedsNoMemory) {
  StartHandshake();
  // The ClientHello has arrived: the handshake waits for the answer.
  EXPECT_EQ(Tarnik::Testing::ReceiveExactly(peer_.Get(), 5).size(), 5U);
  CloseUntil(handshake_);
  ExpectCancelledOnce(handshake_);
}

TEST_F(TlsCloseFaultsTest, CloseBeforeTheHandshakeNeedsNoMemory) {
  {
    const MemoryShortage shortage;
    stream_->Close();
  }
  StartHandshake();
  handshake_.Await();
  ExpectCancelledOnce(handshake_);
}

TEST_F(TlsCloseFaultsTest, SecondCloseAndCloseOfAnIdleStreamNeedNoMemory) {
  Handshake();
  {
    const MemoryShortage shortage;
    stream_->Close();
    stream_->Close();
  }
  stream_->ReadAsync(buffer_, sizeof(buffer_), std::move(onRead_));
  read_.Await();
  ExpectCancelledOnce(read_);
}

}  // namespace
}  // namespace SsoClient::Testing
