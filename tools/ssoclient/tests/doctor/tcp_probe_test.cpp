#include "doctor/tcp_probe.h"

#include <chrono>
#include <string>

#include <gtest/gtest.h>
#include <sys/socket.h>

namespace SsoClient::Tool::Doctor {
namespace {

using Clock = TimeLimit::Clock;

TEST(TcpProbeTest, NothingIsReadOrWrittenAfterTheEnd) {
  int sockets[2] = {-1, -1};
  ASSERT_EQ(socketpair(AF_UNIX, SOCK_STREAM | SOCK_NONBLOCK | SOCK_CLOEXEC, 0, sockets), 0);
  const Descriptor own(sockets[0]);
  const Descriptor peer(sockets[1]);
  ASSERT_EQ(send(peer.Get(), "octets", 6, MSG_NOSIGNAL), 6);

  std::string read;
  const Clock::time_point past = Clock::now() - std::chrono::milliseconds(1);
  EXPECT_EQ(ReadSome(own.Get(), past, read), Reading::kTimedOut);
  EXPECT_EQ(read, "");
  EXPECT_FALSE(SendAll(own.Get(), "octets", past));

  const Clock::time_point future = Clock::now() + std::chrono::minutes(1);
  EXPECT_EQ(ReadSome(own.Get(), future, read), Reading::kOctets);
  EXPECT_EQ(read, "octets");
  EXPECT_TRUE(SendAll(own.Get(), "octets", future));
}

}  // namespace
}  // namespace SsoClient::Tool::Doctor
