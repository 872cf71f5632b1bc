#include "wire/connection_threads.h"

#include <array>
#include <chrono>
#include <cstdint>

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/socket.h>
#include <unistd.h>

#include "devsts/server.h"
#include "raw_client.h"
#include "replaced_calls.h"
#include "request_text.h"

namespace DevSts::Testing {
namespace {

using testing::StartsWith;

TEST(ConnectionThreadsTest, RefuseAConnectionForWhichThereIsNoThread) {
  std::array<int, 2> ends{};
  ASSERT_EQ(socketpair(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0, ends.data()), 0);
  ConnectionThreads threads;
  int closed = 0;
  {
    const NoThreads none;
    EXPECT_NO_THROW(threads.Start(
        ends[0], nullptr, [](Connection&, std::uint64_t) {}, [&] { ++closed; }));
  }
  char octet = 0;
  EXPECT_EQ(recv(ends[1], &octet, 1, MSG_DONTWAIT), 0) << "the connection is closed";
  EXPECT_EQ(closed, 1);
  close(ends[1]);
}

TEST(ConnectionThreadsTest, AServerServesAgainWhenThereAreThreads) {
  const Server server;
  {
    const NoThreads none;
    EXPECT_EQ(RawClient(server.HttpPort()).ReadToEnd(), "");
  }
  EXPECT_TRUE(
      server.WaitUntil([](const Counters& counters) { return counters.connectionsOpen == 0; },
                       std::chrono::seconds(30)));
  RawClient client(server.HttpPort());
  client.Send(PostOf(AliceEnvelope(), kIssueAction));
  EXPECT_THAT(client.ReadAnswer(), StartsWith("HTTP/1.1 200 "));
}

}  // namespace
}  // namespace DevSts::Testing
