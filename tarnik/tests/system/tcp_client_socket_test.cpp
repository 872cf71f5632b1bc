#include <atomic>
#include <chrono>
#include <cstddef>
#include <functional>
#include <string>
#include <thread>
#include <vector>

#include <arpa/inet.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <netinet/in.h>
#include <netinet/tcp.h>
#include <sys/socket.h>

#include <tarnik/core/exception.h>
#include <tarnik/core/object_impl.h>
#include <tarnik/system/tcp_client_socket.h>
#include <tarnik/system/thread_pool.h>

#include "support/loopback.h"
#include "support/outcome.h"

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::System;
using namespace std::chrono_literals;

Ref<TCPClientSocket> NewSocket() {
  return CreateTCPClientSocket(GetThreadPool().get());
}

TCPClientSocket::ConnectCompletion ForConnect(const Outcome& outcome) {
  return [outcome](TCPClientSocket*, Exception* error) { outcome.Report(error); };
}

std::string Connect(TCPClientSocket& socket, const std::string& host, int port) {
  const Outcome outcome;
  socket.ConnectAsync(host, port, ForConnect(outcome));
  return outcome.Wait() ? outcome.Message() : "no completion";
}

/// A connected pair: the socket under test and the descriptor of its peer.
struct Pair {
  Pair() {
    EXPECT_EQ(Connect(*socket, "127.0.0.1", listener.Port()), "");
    peer = listener.Accept();
  }
  ~Pair() { socket->Close(); }

  LoopbackListener listener;
  Ref<TCPClientSocket> socket = NewSocket();
  Descriptor peer;
};

/// A read and a write of `socket` that do not complete by themselves.
struct PendingTransfers {
  explicit PendingTransfers(TCPClientSocket& socket) {
    socket.ReadAsync(buffer, sizeof(buffer), read.ForRead());
    socket.WriteAsync(data.data(), data.size(), write.ForWrite());
  }

  char buffer[10];
  const std::string data = std::string(64 << 20, 'x');
  const Outcome read;
  const Outcome write;
};

TEST(TCPClientSocketAsyncTest, ConnectsToAnAddressAndPassesItselfToTheCompletion) {
  const LoopbackListener listener;
  const auto socket = NewSocket();
  std::atomic<TCPClientSocket*> given{nullptr};
  const Outcome outcome;
  socket->ConnectAsync("127.0.0.1", listener.Port(), [&](TCPClientSocket* self, Exception* error) {
    given = self;
    outcome.Report(error);
  });
  ASSERT_TRUE(outcome.Wait());
  EXPECT_EQ(outcome.Message(), "");
  EXPECT_EQ(given.load(), socket.get());
  EXPECT_NE(outcome.Thread(), std::this_thread::get_id());
  EXPECT_EQ(socket->ToString(),
            "<TCPClientSocket:127.0.0.1:" + std::to_string(listener.Port()) + ">");
}

TEST(TCPClientSocketAsyncTest, ConnectsToAName) {
  const LoopbackListener listener;
  EXPECT_EQ(Connect(*NewSocket(), "localhost", listener.Port()), "");
}

TEST(TCPClientSocketAsyncTest, ConnectsToAnIpv6AddressWithoutBrackets) {
  if (!HasIpv6Loopback()) {
    GTEST_SKIP() << "this machine has no IPv6";
  }
  const LoopbackListener listener(true);
  EXPECT_EQ(Connect(*NewSocket(), "::1", listener.Port()), "");
}

TEST(TCPClientSocketAsyncTest, NamesHostPortAndCauseOfARefusal) {
  Descriptor holder;
  const int port = RefusingPort(holder);
  const auto socket = NewSocket();
  const Outcome outcome;
  socket->ConnectAsync("127.0.0.1", port, ForConnect(outcome));
  ASSERT_TRUE(outcome.Wait());
  EXPECT_EQ(outcome.Message(),
            "Cannot connect to 127.0.0.1:" + std::to_string(port) + ": Connection refused");
  EXPECT_TRUE(outcome.IsError<IOException>());
  EXPECT_FALSE(outcome.IsError<CancelledException>());
}

TEST(TCPClientSocketAsyncTest, PutsAnIpv6AddressInBracketsInMessages) {
  if (!HasIpv6Loopback()) {
    GTEST_SKIP() << "this machine has no IPv6";
  }
  Descriptor holder;
  const int port = RefusingPort(holder);
  EXPECT_EQ(Connect(*NewSocket(), "::1", port),
            "Cannot connect to [::1]:" + std::to_string(port) + ": Connection refused");
}

TEST(TCPClientSocketAsyncTest, TriesEachAddressOfANameInTurn) {
  // "localhost" may resolve to ::1 as well; the listener has only 127.0.0.1.
  const LoopbackListener listener;
  const auto socket = NewSocket();
  ASSERT_EQ(Connect(*socket, "localhost", listener.Port()), "");
  EXPECT_GE(listener.Accept().Get(), 0);
}

TEST(TCPClientSocketAsyncTest, NamesTheHostThatCannotBeResolved) {
  const auto socket = NewSocket();
  const Outcome outcome;
  socket->ConnectAsync("nonexistent.invalid", 443, ForConnect(outcome));
  if (!outcome.Wait(10s)) {
    socket->Close();
    GTEST_SKIP() << "the resolver of this machine takes too long";
  }
  EXPECT_THAT(outcome.Message(),
              testing::StartsWith("Cannot connect to nonexistent.invalid:443: "));
  EXPECT_GT(outcome.Message().size(),
            std::string("Cannot connect to nonexistent.invalid:443: ").size());
  EXPECT_TRUE(outcome.IsError<IOException>());
}

TEST(TCPClientSocketAsyncTest, RefusesMalformedHosts) {
  const std::vector<std::string> hosts = {
      "",    " ",   "a b", "a\r\nb", "a\nb",        "a\tb", {"a\0b", 3},          "[::1]",
      "a/b", "a@b", ".a",  "a\x7f",  "caf\xc3\xa9", "a\\b", std::string(254, 'a')};
  for (const std::string& host : hosts) {
    EXPECT_THROW(NewSocket()->ConnectAsync(host, 443, ForConnect(Outcome())),
                 InvalidArgumentException)
        << testing::PrintToString(host);
  }
}

TEST(TCPClientSocketAsyncTest, RefusesPortsOutOfRange) {
  for (const int port : {-1, 0, 65536}) {
    EXPECT_THROW(NewSocket()->ConnectAsync("localhost", port, ForConnect(Outcome())),
                 InvalidArgumentException);
  }
}

TEST(TCPClientSocketAsyncTest, RefusesToConnectTwice) {
  const Pair pair;
  EXPECT_THROW(pair.socket->ConnectAsync("localhost", 1, ForConnect(Outcome())),
               InvalidStateException);
}

TEST(TCPClientSocketAsyncTest, RefusesAForeignPool) {
  class OtherPool final : public ThreadPool, public ObjectImpl {
    void Run(std::function<void()>) override {}
    void Post(std::function<void()>) override {}
    Ref<CancellableItem> RunAfter(unsigned long, std::function<void()>) override { return nullptr; }
  };
  const auto pool = MakeRef<OtherPool>();
  EXPECT_THROW(CreateTCPClientSocket(pool.get()), InvalidArgumentException);
  EXPECT_THROW(CreateTCPClientSocket(nullptr), InvalidArgumentException);
}

TEST(TCPClientSocketAsyncTest, RefusesToReadAndWriteUnlessConnected) {
  char buffer[1];
  const auto socket = NewSocket();
  EXPECT_THROW(socket->ReadAsync(buffer, 1, Outcome().ForRead()), InvalidStateException);
  EXPECT_THROW(socket->WriteAsync(buffer, 1, Outcome().ForWrite()), InvalidStateException);
}

TEST(TCPClientSocketAsyncTest, DisablesTheDelayOfSmallWrites) {
  // The peer cannot see the option, so inspect the sockets of this process.
  const Pair pair;
  sockaddr_in peerName{};
  socklen_t length = sizeof(peerName);
  ASSERT_EQ(getpeername(pair.peer.Get(), reinterpret_cast<sockaddr*>(&peerName), &length), 0);
  bool found = false;
  for (int descriptor = 0; descriptor < 1024 && !found; ++descriptor) {
    sockaddr_in own{};
    length = sizeof(own);
    if (getsockname(descriptor, reinterpret_cast<sockaddr*>(&own), &length) == 0 &&
        own.sin_family == AF_INET && own.sin_port == peerName.sin_port) {
      int noDelay = 0;
      length = sizeof(noDelay);
      ASSERT_EQ(getsockopt(descriptor, IPPROTO_TCP, TCP_NODELAY, &noDelay, &length), 0);
      EXPECT_EQ(noDelay, 1);
      found = true;
    }
  }
  EXPECT_TRUE(found);
}

TEST(TCPClientSocketAsyncTest, ReadsWhatThePeerSendsUntilTheEnd) {
  Pair pair;
  ASSERT_TRUE(SendAll(pair.peer.Get(), "hello"));
  pair.peer.Close();
  std::string error;
  EXPECT_EQ(ReadAll(*pair.socket, 100, &error), "hello");
  EXPECT_EQ(error, "");
}

TEST(TCPClientSocketAsyncTest, ReportsAResetAndNamesThePeer) {
  Pair pair;
  ResetOnClose(pair.peer.Get());
  pair.peer.Close();
  std::string error;
  EXPECT_EQ(ReadAll(*pair.socket, 100, &error), "");
  EXPECT_EQ(error, "Cannot read from 127.0.0.1:" + std::to_string(pair.listener.Port()) +
                       ": Connection reset by peer");
}

TEST(TCPClientSocketAsyncTest, ReportsAWriteToAPeerThatHasGone) {
  Pair pair;
  ResetOnClose(pair.peer.Get());
  pair.peer.Close();
  std::string error;
  for (int i = 0; i < 100 && error.empty(); ++i) {
    error = WriteAll(*pair.socket, std::string(100000, 'x'));
  }
  EXPECT_THAT(error, testing::StartsWith("Cannot write to 127.0.0.1:" +
                                         std::to_string(pair.listener.Port()) + ": "));
}

TEST(TCPClientSocketAsyncTest, TransfersMuchDataInBothDirectionsAtOnce) {
  const Pair pair;
  std::string sent(4 << 20, '\0');
  for (std::size_t i = 0; i < sent.size(); ++i) {
    sent[i] = static_cast<char>(i * 31 + i / 4096);
  }
  std::string received;
  std::thread peer([&] {
    std::thread sender([&] { SendAll(pair.peer.Get(), sent); });
    received = ReceiveExactly(pair.peer.Get(), sent.size());
    sender.join();
  });
  const Outcome written;
  pair.socket->WriteAsync(sent.data(), sent.size(), written.ForWrite());
  std::string error;
  const std::string echoed = ReadAll(*pair.socket, sent.size(), &error);
  EXPECT_TRUE(written.Wait());
  EXPECT_EQ(written.Message(), "");
  peer.join();
  EXPECT_EQ(error, "");
  EXPECT_TRUE(echoed == sent);
  EXPECT_TRUE(received == sent);
}

TEST(TCPClientSocketAsyncTest, CompletesAnEmptyWrite) {
  const Pair pair;
  EXPECT_EQ(WriteAll(*pair.socket, ""), "");
}

TEST(TCPClientSocketAsyncTest, RefusesASecondReadAndASecondWriteAtTheSameTime) {
  const Pair pair;
  PendingTransfers pending(*pair.socket);
  EXPECT_THROW(pair.socket->ReadAsync(pending.buffer, 1, pending.read.ForRead()),
               InvalidStateException);
  EXPECT_THROW(pair.socket->WriteAsync(pending.buffer, 1, pending.write.ForWrite()),
               InvalidStateException);
  pair.socket->Close();
  EXPECT_TRUE(pending.read.Wait());
  EXPECT_TRUE(pending.write.Wait());
  EXPECT_EQ(pending.read.Count(), 1);
  EXPECT_EQ(pending.write.Count(), 1);
}

TEST(TCPClientSocketAsyncTest, RefusesAnEmptyRead) {
  const Pair pair;
  EXPECT_THROW(pair.socket->ReadAsync(nullptr, 0, Outcome().ForRead()), InvalidArgumentException);
}

TEST(TCPClientSocketAsyncTest, CancelsPendingReadAndWriteAtClose) {
  const Pair pair;
  const PendingTransfers pending(*pair.socket);
  pair.socket->Close();
  pair.socket->Close();
  ASSERT_TRUE(pending.read.Wait());
  ASSERT_TRUE(pending.write.Wait());
  const std::string closed = "The connection to 127.0.0.1:" + std::to_string(pair.listener.Port()) +
                             " was closed on this side.";
  EXPECT_TRUE(pending.read.IsError<CancelledException>());
  EXPECT_TRUE(pending.write.IsError<CancelledException>());
  EXPECT_EQ(pending.read.Message(), closed);
  EXPECT_EQ(pending.write.Message(), closed);
}

TEST(TCPClientSocketAsyncTest, CancelsReadsAndWritesAfterClose) {
  const Pair pair;
  pair.socket->Close();
  char buffer[1];
  const Outcome read;
  pair.socket->ReadAsync(buffer, 1, read.ForRead());
  ASSERT_TRUE(read.Wait());
  EXPECT_TRUE(read.IsError<CancelledException>());
  EXPECT_EQ(WriteAll(*pair.socket, "x"), read.Message());
}

TEST(TCPClientSocketAsyncTest, CancelsTheConnectOfAClosedSocket) {
  const auto socket = NewSocket();
  socket->Close();
  const Outcome outcome;
  socket->ConnectAsync("127.0.0.1", 1, ForConnect(outcome));
  ASSERT_TRUE(outcome.Wait());
  EXPECT_TRUE(outcome.IsError<CancelledException>());
}

TEST(TCPClientSocketAsyncTest, CancelsAConnectDuringItsLookup) {
  for (int i = 0; i < 50; ++i) {
    const auto socket = NewSocket();
    const Outcome outcome;
    socket->ConnectAsync("localhost", 1, ForConnect(outcome));
    socket->Close();
    ASSERT_TRUE(outcome.Wait());
    EXPECT_TRUE(outcome.IsError<IOException>());
    EXPECT_EQ(outcome.Count(), 1);
  }
}

TEST(TCPClientSocketAsyncTest, CancelsAnUnansweredConnect) {
  // Connects beyond a full backlog stay unanswered.
  const LoopbackListener listener(false, 0);
  std::vector<Ref<TCPClientSocket>> fillers;
  Ref<TCPClientSocket> waiting;
  Outcome outcome;
  for (int i = 0; i < 20; ++i) {
    waiting = NewSocket();
    outcome = Outcome();
    waiting->ConnectAsync("127.0.0.1", listener.Port(), ForConnect(outcome));
    if (!outcome.Wait(200ms)) {
      break;
    }
    fillers.push_back(waiting);
  }
  ASSERT_EQ(outcome.Count(), 0) << "the backlog never filled up";
  waiting->Close();
  ASSERT_TRUE(outcome.Wait());
  EXPECT_TRUE(outcome.IsError<CancelledException>());
  EXPECT_EQ(outcome.Count(), 1);
  for (const auto& filler : fillers) {
    filler->Close();
  }
}

TEST(TCPClientSocketAsyncTest, CompletesOnceWheneverItIsClosed) {
  for (int i = 0; i < 200; ++i) {
    const LoopbackListener listener;
    const auto socket = NewSocket();
    const Outcome outcome;
    socket->ConnectAsync("127.0.0.1", listener.Port(), ForConnect(outcome));
    std::thread closer([socket, i] {
      for (int spin = 0; spin < i * 50; ++spin) {
        std::atomic_signal_fence(std::memory_order_seq_cst);
      }
      socket->Close();
    });
    ASSERT_TRUE(outcome.Wait());
    closer.join();
    EXPECT_EQ(outcome.Count(), 1);
  }
}

TEST(TCPClientSocketAsyncTest, LivesUntilItsOperationHasEnded) {
  LoopbackListener listener;
  char buffer[10];
  const Outcome read;
  Descriptor peer;
  {
    const auto socket = NewSocket();
    ASSERT_EQ(Connect(*socket, "127.0.0.1", listener.Port()), "");
    peer = listener.Accept();
    socket->ReadAsync(buffer, sizeof(buffer), read.ForRead());
  }
  ASSERT_TRUE(SendAll(peer.Get(), "late"));
  ASSERT_TRUE(read.Wait());
  EXPECT_EQ(read.Bytes(), 4U);
  EXPECT_EQ(ReceiveExactly(peer.Get(), 1), "");
}

TEST(TCPClientSocketAsyncTest, SupportsManyConnectionsAtOnce) {
  const LoopbackListener listener;
  constexpr std::size_t kConnections = 100;
  std::vector<Ref<TCPClientSocket>> sockets;
  std::vector<Outcome> connected(kConnections);
  std::vector<Descriptor> peers;
  for (std::size_t i = 0; i < kConnections; ++i) {
    sockets.push_back(NewSocket());
    sockets[i]->ConnectAsync("127.0.0.1", listener.Port(), ForConnect(connected[i]));
    peers.push_back(listener.Accept());
  }
  for (std::size_t i = 0; i < kConnections; ++i) {
    ASSERT_TRUE(connected[i].Wait());
    EXPECT_EQ(connected[i].Message(), "");
    sockets[i]->Close();
  }
}

}  // namespace
}  // namespace Tarnik::Testing
