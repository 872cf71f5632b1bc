#include "system/connect_race.h"

#include <chrono>
#include <cstdlib>
#include <filesystem>
#include <functional>
#include <future>
#include <memory>
#include <new>
#include <string>
#include <system_error>
#include <thread>
#include <utility>
#include <vector>

#include <arpa/inet.h>
#include <dirent.h>
#include <fcntl.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <netinet/in.h>
#include <poll.h>
#include <sys/socket.h>

#include <tarnik/core/exception.h>
#include <tarnik/system/tcp_client_socket.h>
#include <tarnik/system/thread_pool.h>

#include "support/child_process.h"
#include "support/dead_listener.h"
#include "support/loopback.h"
#include "support/outcome.h"
#include "system/connect_stage.h"
#include "system/host_lookup.h"
#include "system/tcp_client_socket_impl.h"
#include "system/thread_pool_impl.h"

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::System;
using namespace std::chrono_literals;
using testing::ElementsAre;

SocketAddress V4(int port) {
  SocketAddress address{};
  auto* const v4 = reinterpret_cast<sockaddr_in*>(&address.storage);
  v4->sin_family = AF_INET;
  v4->sin_addr.s_addr = htonl(INADDR_LOOPBACK);
  v4->sin_port = htons(static_cast<in_port_t>(port));
  address.length = sizeof(sockaddr_in);
  return address;
}

SocketAddress V6(int port) {
  SocketAddress address{};
  auto* const v6 = reinterpret_cast<sockaddr_in6*>(&address.storage);
  v6->sin6_family = AF_INET6;
  v6->sin6_addr = in6addr_loopback;
  v6->sin6_port = htons(static_cast<in_port_t>(port));
  address.length = sizeof(sockaddr_in6);
  return address;
}

/// An address of a family that no host supports.
SocketAddress Unusable() {
  SocketAddress address = V4(1);
  address.storage.ss_family = AF_MAX - 1;
  return address;
}

std::vector<int> PortsOf(const std::vector<SocketAddress>& addresses) {
  std::vector<int> ports;
  for (const SocketAddress& address : addresses) {
    // The port is at the same place in both families.
    ports.push_back(ntohs(reinterpret_cast<const sockaddr_in*>(&address.storage)->sin_port));
  }
  return ports;
}

/// The descriptors of this process's TCP sockets.
std::vector<int> TcpSockets() {
  std::vector<int> found;
  const std::unique_ptr<DIR, int (*)(DIR*)> folder(opendir("/proc/self/fd"), closedir);
  while (const dirent* entry = readdir(folder.get())) {
    const int descriptor = std::atoi(entry->d_name);
    int domain = 0;
    socklen_t length = sizeof(domain);
    if (entry->d_name[0] != '.' &&
        getsockopt(descriptor, SOL_SOCKET, SO_DOMAIN, &domain, &length) == 0 && domain != AF_UNIX) {
      found.push_back(descriptor);
    }
  }
  return found;
}

/// "socket:[12345]", for example.
std::string NameOf(int descriptor) {
  return std::filesystem::read_symlink("/proc/self/fd/" + std::to_string(descriptor)).string();
}

bool HasConnection(const LoopbackListener& listener) {
  pollfd awaited{listener.Get(), POLLIN, 0};
  return poll(&awaited, 1, 0) == 1;
}

/// Connects to a name that has the given addresses.
class Connect {
 public:
  explicit Connect(std::vector<SocketAddress> addresses,
                   std::chrono::milliseconds attemptDelay = 1ms)
      : Connect(ConnectRules{[addresses](const std::string&, int) {
                               return HostAddresses{addresses, {}};
                             },
                             {},
                             attemptDelay}) {}
  explicit Connect(ConnectRules rules)
      : socket(CreateTCPClientSocket(ToThreadPoolImpl(GetThreadPool().get()), std::move(rules))),
        item(CreateConnectItem(socket.get())) {
    socket->ConnectAsync(
        "sts.example", 443,
        [outcome = outcome](TCPClientSocket*, Exception* error) { outcome.Report(error); });
  }
  ~Connect() { socket->Close(); }

  std::string Result() const { return outcome.Wait() ? outcome.Message() : "no completion"; }
  ConnectStage Stage() const { return dynamic_cast<ConnectProgress&>(*item).Stage(); }

  const Outcome outcome;
  const Ref<TCPClientSocket> socket;
  const Ref<CancellableItem> item;
};

TEST(ConnectRaceTest, TheFamiliesTakeTurnsBeginningWithTheFirst) {
  EXPECT_THAT(PortsOf(InterleaveFamilies({V6(1), V6(2), V6(3), V4(4), V4(5)})),
              ElementsAre(1, 4, 2, 5, 3));
  EXPECT_THAT(PortsOf(InterleaveFamilies({V4(1), V6(2), V6(3), V6(4)})), ElementsAre(1, 2, 3, 4));
  EXPECT_THAT(PortsOf(InterleaveFamilies({V4(1), V4(2)})), ElementsAre(1, 2));
  EXPECT_THAT(PortsOf(InterleaveFamilies({})), ElementsAre());
}

TEST(ConnectRaceAsyncTest, AnAddressThatDoesNotAnswerDoesNotHoldUpTheNext) {
  const DeadListener dead;
  const LoopbackListener listener;
  const auto before = TcpSockets().size();
  const Connect connect({V4(dead.Port()), V4(dead.Port()), V4(listener.Port())});
  ASSERT_EQ(connect.Result(), "");
  EXPECT_GE(listener.Accept().Get(), 0);
  EXPECT_EQ(TcpSockets().size(), before + 1) << "only the connected socket is open";
}

TEST(ConnectRaceAsyncTest, AFailureStartsTheNextAttemptAtOnce) {
  Descriptor holder;
  const int refusing = RefusingPort(holder);
  const LoopbackListener listener;
  const Connect connect({V4(refusing), Unusable(), V4(refusing), V4(listener.Port())}, 1h);
  EXPECT_EQ(connect.Result(), "");
}

TEST(ConnectRaceAsyncTest, TheOtherFamilyIsTriedBeforeTheSecondAddressOfTheFirst) {
  if (!HasIpv6Loopback()) {
    GTEST_SKIP() << "this machine has no IPv6";
  }
  Descriptor holder;
  const DeadListener dead;
  const LoopbackListener listener(true);
  const Connect connect({V4(RefusingPort(holder)), V4(dead.Port()), V6(listener.Port())}, 1h);
  EXPECT_EQ(connect.Result(), "");
}

TEST(ConnectRaceAsyncTest, TheFirstAddressHasItsShareOfTheTime) {
  const LoopbackListener first;
  const LoopbackListener second;
  const Connect connect({V4(first.Port()), V4(second.Port())}, 1h);
  ASSERT_EQ(connect.Result(), "");
  EXPECT_TRUE(HasConnection(first));
  EXPECT_FALSE(HasConnection(second));
}

TEST(ConnectRaceAsyncTest, ReportsTheLastFailureOfAnAddressThatTheHostCanUse) {
  Descriptor holder;
  const int refusing = RefusingPort(holder);
  const std::string refused = "Cannot connect to sts.example:443: Connection refused";
  EXPECT_EQ(Connect({V4(refusing), Unusable()}).Result(), refused);
  EXPECT_EQ(Connect({Unusable(), V4(refusing)}).Result(), refused);
  EXPECT_EQ(Connect(std::vector{Unusable()}).Result(),
            "Cannot connect to sts.example:443: Address family not supported by protocol");
}

TEST(ConnectRaceAsyncTest, CloseEndsAllAttempts) {
  const DeadListener dead;
  const auto before = TcpSockets().size();
  const Connect connect({V4(dead.Port()), V4(dead.Port()), V4(dead.Port())});
  while (TcpSockets().size() < before + 3) {
    std::this_thread::yield();
  }
  EXPECT_EQ(connect.outcome.Count(), 0);
  connect.socket->Close();
  EXPECT_EQ(TcpSockets().size(), before);
  ASSERT_TRUE(connect.outcome.Wait());
  EXPECT_TRUE(connect.outcome.IsError<CancelledException>());
  EXPECT_EQ(connect.outcome.Message(),
            "The connection to sts.example:443 was closed on this side.");
  EXPECT_EQ(connect.outcome.Count(), 1);
}

TEST(ConnectRaceAsyncTest, CompletesOnceWhenSeveralAddressesAnswer) {
  const LoopbackListener first;
  const LoopbackListener second;
  for (int i = 0; i < 50; ++i) {
    const Connect connect({V4(first.Port()), V4(second.Port())}, 0ms);
    ASSERT_EQ(connect.Result(), "");
    connect.socket->Close();
    EXPECT_EQ(connect.outcome.Count(), 1);
    for (const LoopbackListener* listener : {&first, &second}) {
      while (HasConnection(*listener)) {
        listener->Accept();
      }
    }
  }
}

TEST(ConnectRaceAsyncTest, AThreadForTheLookUpThatCannotStartEndsTheConnect) {
  ConnectRules rules;
  rules.runLookUp = [](const std::function<void()>&) {
    throw std::system_error(EAGAIN, std::system_category());
  };
  const Connect connect(std::move(rules));
  EXPECT_EQ(connect.Result(),
            "Cannot connect to sts.example:443: the thread for the host look-up cannot start");
  EXPECT_TRUE(connect.outcome.IsError<IOException>());
}

TEST(ConnectRaceAsyncTest, ALookUpWithoutMemoryEndsTheConnect) {
  ConnectRules rules;
  rules.lookUp = [](const std::string&, int) -> HostAddresses { throw std::bad_alloc(); };
  const Connect connect(std::move(rules));
  EXPECT_EQ(connect.Result(), "There is not enough memory for the connection to sts.example:443.");
  EXPECT_TRUE(connect.outcome.IsError<IOException>());
}

TEST(ConnectRaceAsyncTest, KnowsWhatItIsWaitingFor) {
  const DeadListener dead;
  const LoopbackListener listener;
  std::promise<std::vector<SocketAddress>> answer;
  ConnectRules rules;
  rules.lookUp = [found = answer.get_future().share()](const std::string&, int) {
    return HostAddresses{found.get(), {}};
  };
  const Connect connect(std::move(rules));
  EXPECT_EQ(connect.Stage(), ConnectStage::kLookUp);
  answer.set_value({V4(dead.Port())});
  while (connect.Stage() == ConnectStage::kLookUp) {
    std::this_thread::yield();
  }
  EXPECT_EQ(connect.Stage(), ConnectStage::kConnection);

  const Connect connected({V4(listener.Port())});
  ASSERT_EQ(connected.Result(), "");
  EXPECT_EQ(connected.Stage(), ConnectStage::kConnected);
}

TEST(ConnectRaceAsyncTest, ItsSocketsAreNotInherited) {
  const DeadListener dead;
  const LoopbackListener listener;
  const auto before = TcpSockets().size();
  const Connect waiting({V4(dead.Port()), V4(dead.Port())});
  const Connect connected({V4(listener.Port())});
  ASSERT_EQ(connected.Result(), "");
  while (TcpSockets().size() < before + 3) {
    std::this_thread::yield();
  }
  const std::string inherited = RunInShell("ls -l /proc/self/fd").output;
  EXPECT_THAT(inherited, testing::HasSubstr("/proc/"));
  for (const int descriptor : TcpSockets()) {
    EXPECT_EQ(fcntl(descriptor, F_GETFD) & FD_CLOEXEC, FD_CLOEXEC);
    EXPECT_THAT(inherited, testing::Not(testing::HasSubstr(NameOf(descriptor))));
  }
}

TEST(ConnectRaceTest, AnItemHoldsItsSocketOnce) {
  const auto socket = CreateTCPClientSocket(GetThreadPool().get());
  {
    const auto item = CreateConnectItem(socket.get());
    EXPECT_EQ(socket->RefCount(), 2);
    EXPECT_TRUE(item->Cancel());
    EXPECT_TRUE(item->Cancel());
  }
  EXPECT_EQ(socket->RefCount(), 1);
  EXPECT_THROW(CreateConnectItem(nullptr), InvalidArgumentException);
}

}  // namespace
}  // namespace Tarnik::Testing
