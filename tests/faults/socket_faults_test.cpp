// Sockets while memory is short on all threads.
#include <cstddef>
#include <new>
#include <utility>

#include <gtest/gtest.h>
#include <sys/socket.h>

#include <tarnik/core/exception.h>
#include <tarnik/system/tcp_client_socket.h>

#include "faults/connected_socket_fixture.h"
#include "faults/ending.h"
#include "faults/fault_injection.h"

namespace SsoClient::Testing {
namespace {

using Tarnik::System::TCPClientSocket;

class SocketFaultsTest : public ConnectedSocketTest {};

TEST_F(SocketFaultsTest, ReadsAndWritesNeedNoMemory) {
  {
    const MemoryShortage shortage;
    socket_->WriteAsync("hello", 5, std::move(onWritten_));
    written_.Await();
    socket_->ReadAsync(buffer_, sizeof(buffer_), std::move(onRead_));
    send(peer_.Get(), "answer", 6, MSG_NOSIGNAL);
    read_.Await();
  }
  EXPECT_TRUE(written_.IsSuccess());
  EXPECT_TRUE(read_.IsSuccess());
  EXPECT_EQ(read_.Bytes(), 6U);
}

TEST_F(SocketFaultsTest, CloseNeedsNoMemory) {
  socket_->ReadAsync(buffer_, sizeof(buffer_), std::move(onRead_));
  {
    const MemoryShortage shortage;
    socket_->Close();
    read_.Await();
  }
  EXPECT_TRUE(read_.IsCancelled());
  EXPECT_EQ(read_.Count(), 1);
}

TEST_F(SocketFaultsTest, AFailureIsReportedWithoutMemory) {
  socket_->ReadAsync(buffer_, sizeof(buffer_), std::move(onRead_));
  {
    const MemoryShortage shortage;
    Tarnik::Testing::ResetOnClose(peer_.Get());
    peer_.Close();
    read_.Await();
  }
  EXPECT_TRUE(read_.IsIoFailure());
  EXPECT_FALSE(read_.IsCancelled());
}

/// Closes a connect at its look-up or later, without memory.
TEST_F(SocketFaultsTest, CloseOfAConnectNeedsNoMemory) {
  for (int i = 0; i < 100; ++i) {
    Ending connected;
    const auto socket = NewSocket();
    socket->ConnectAsync(
        "127.0.0.1", listener_.Port(),
        [&](TCPClientSocket*, Tarnik::Exception* error) { connected.Record(error); });
    {
      const MemoryShortage shortage;
      socket->Close();
      connected.Await();
    }
    EXPECT_TRUE(connected.IsSuccess() || connected.IsIoFailure());
    EXPECT_EQ(connected.Count(), 1);
  }
}

TEST_F(SocketFaultsTest, EveryFailedAllocationEndsAConnectOnce) {
  // The first look-up of the process may have other allocations than later ones.
  for (const char* host : {"127.0.0.1", "localhost"}) {
    bool hasHappened = true;
    int refused = 0;
    for (std::size_t index = 0; hasHappened; ++index) {
      Ending connected;
      const auto socket = NewSocket();
      TCPClientSocket::ConnectCompletion completion =
          [&connected](TCPClientSocket*, Tarnik::Exception* error) { connected.Record(error); };
      {
        const InjectedFault fault(FaultKind::kAllocation, index);
        try {
          socket->ConnectAsync(host, listener_.Port(), std::move(completion));
          connected.Await();
          refused += connected.IsSuccess() ? 0 : 1;
          EXPECT_TRUE(connected.IsSuccess() || connected.IsIoFailure());
        } catch (const std::bad_alloc&) {
          EXPECT_EQ(connected.Count(), 0);
          ++refused;
        }
        hasHappened = fault.HasHappened();
      }
      socket->Close();
      EXPECT_LE(connected.Count(), 1);
      ASSERT_LT(index, 1000U);
    }
    EXPECT_GT(refused, 0);
  }
}

}  // namespace
}  // namespace SsoClient::Testing
