#ifndef SSOCLIENT_TESTS_FAULTS_CONNECTED_SOCKET_FIXTURE_H
#define SSOCLIENT_TESTS_FAULTS_CONNECTED_SOCKET_FIXTURE_H

#include <cstddef>

#include <gtest/gtest.h>

#include <tarnik/core/exception.h>
#include <tarnik/core/ref.h>
#include <tarnik/system/stream.h>
#include <tarnik/system/tcp_client_socket.h>
#include <tarnik/system/thread_pool.h>

#include "faults/ending.h"
#include "support/loopback.h"

namespace SsoClient::Testing {

inline Tarnik::Ref<Tarnik::System::TCPClientSocket> NewSocket() {
  return Tarnik::System::CreateTCPClientSocket(Tarnik::System::GetThreadPool().get());
}

/// A socket that is connected to this thread: no other thread of the test runs when memory is
/// short.
class ConnectedSocketTest : public testing::Test {
 protected:
  ConnectedSocketTest() {
    Ending connected;
    socket_->ConnectAsync("127.0.0.1", listener_.Port(),
                          [&](Tarnik::System::TCPClientSocket*, Tarnik::Exception* error) {
                            connected.Record(error);
                          });
    connected.Await();
    EXPECT_TRUE(connected.IsSuccess());
    peer_ = listener_.Accept();
  }
  ~ConnectedSocketTest() override { socket_->Close(); }

  // Made in advance, since they need memory.
  Tarnik::System::Stream::ReadCompletion onRead_ =
      [this](std::size_t bytes, Tarnik::Exception* error) { read_.Record(error, bytes); };
  Tarnik::System::Stream::WriteCompletion onWritten_ = [this](Tarnik::Exception* error) {
    written_.Record(error);
  };

  const Tarnik::Testing::LoopbackListener listener_;
  const Tarnik::Ref<Tarnik::System::TCPClientSocket> socket_ = NewSocket();
  Tarnik::Testing::Descriptor peer_;
  char buffer_[16] = {};
  Ending read_;
  Ending written_;
};

}  // namespace SsoClient::Testing

#endif
