// Sockets while memory is short on all threads.
#include <atomic>
#include <cstddef>
#include <functional>
#include <new>
#include <string>
#include <thread>
#include <utility>

#include <arpa/inet.h>
#include <gtest/gtest.h>
#include <netinet/in.h>
#include <sys/socket.h>
#include <unistd.h>

#include <tarnik/core/exception.h>
#include <tarnik/core/ref.h>
#include <tarnik/system/tcp_client_socket.h>
#include <tarnik/system/thread_pool.h>

#include "faults/fault_injection.h"

namespace SsoClient::Testing {
namespace {

using Tarnik::System::TCPClientSocket;

/// How an operation ended. Recording it and waiting for it need no memory.
class Ending {
 public:
  void Record(const Tarnik::Exception* error, std::size_t bytes = 0) {
    isIoFailure_ = dynamic_cast<const Tarnik::IOException*>(error) != nullptr;
    isCancelled_ = dynamic_cast<const Tarnik::CancelledException*>(error) != nullptr;
    bytes_ = bytes;
    hasError_ = error != nullptr;
    ++count_;
  }
  void Await() const {
    while (count_ == 0) {
      std::this_thread::yield();
    }
  }

  int Count() const { return count_; }
  bool IsSuccess() const { return !hasError_; }
  bool IsIoFailure() const { return isIoFailure_; }
  bool IsCancelled() const { return isCancelled_; }
  std::size_t Bytes() const { return bytes_; }

 private:
  bool hasError_ = false;
  bool isIoFailure_ = false;
  bool isCancelled_ = false;
  std::size_t bytes_ = 0;
  std::atomic<int> count_{0};
};

class Listener {
 public:
  Listener() : descriptor_(socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0)) {
    sockaddr_in address{};
    address.sin_family = AF_INET;
    address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
    socklen_t length = sizeof(address);
    EXPECT_EQ(bind(descriptor_, reinterpret_cast<sockaddr*>(&address), length), 0);
    EXPECT_EQ(listen(descriptor_, 64), 0);
    EXPECT_EQ(getsockname(descriptor_, reinterpret_cast<sockaddr*>(&address), &length), 0);
    port_ = ntohs(address.sin_port);
  }
  ~Listener() { close(descriptor_); }
  Listener(const Listener&) = delete;
  Listener& operator=(const Listener&) = delete;

  int Port() const { return port_; }
  int Accept() const { return accept4(descriptor_, nullptr, nullptr, SOCK_CLOEXEC); }

 private:
  int descriptor_;
  int port_ = 0;
};

Tarnik::Ref<TCPClientSocket> NewSocket() {
  return Tarnik::System::CreateTCPClientSocket(Tarnik::System::GetThreadPool().get());
}

class SocketFaultsTest : public testing::Test {
 protected:
  SocketFaultsTest() {
    Ending connected;
    socket_->ConnectAsync(
        "127.0.0.1", listener_.Port(),
        [&](TCPClientSocket*, Tarnik::Exception* error) { connected.Record(error); });
    connected.Await();
    EXPECT_TRUE(connected.IsSuccess());
    peer_ = listener_.Accept();
  }
  ~SocketFaultsTest() override {
    socket_->Close();
    close(peer_);
  }

  TCPClientSocket::ReadCompletion onRead_ = [this](std::size_t bytes, Tarnik::Exception* error) {
    read_.Record(error, bytes);
  };
  TCPClientSocket::WriteCompletion onWritten_ = [this](Tarnik::Exception* error) {
    written_.Record(error);
  };

  const Listener listener_;
  const Tarnik::Ref<TCPClientSocket> socket_ = NewSocket();
  int peer_ = -1;
  char buffer_[16] = {};
  Ending read_;
  Ending written_;
};

TEST_F(SocketFaultsTest, ReadsAndWritesNeedNoMemory) {
  {
    const MemoryShortage shortage;
    socket_->WriteAsync("hello", 5, std::move(onWritten_));
    written_.Await();
    socket_->ReadAsync(buffer_, sizeof(buffer_), std::move(onRead_));
    send(peer_, "answer", 6, MSG_NOSIGNAL);
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
    const linger abort{1, 0};
    setsockopt(peer_, SOL_SOCKET, SO_LINGER, &abort, sizeof(abort));
    close(std::exchange(peer_, -1));
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
