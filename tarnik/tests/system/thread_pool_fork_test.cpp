#include <atomic>
#include <cstdlib>
#include <future>
#include <string>

#include <gtest/gtest.h>
#include <unistd.h>

#include <tarnik/core/exception.h>
#include <tarnik/system/tcp_client_socket.h>
#include <tarnik/system/thread_pool.h>

#include "support/forked_child.h"
#include "support/loopback.h"

namespace Tarnik::Testing {
namespace {

using System::GetThreadPool;

bool RunsItemsCompletionsAndTimers() {
  std::promise<void> item;
  std::promise<void> completion;
  std::promise<void> timer;
  GetThreadPool()->Run([&] { item.set_value(); });
  GetThreadPool()->Post([&] { completion.set_value(); });
  GetThreadPool()->RunAfter(1, [&] { timer.set_value(); });
  item.get_future().wait();
  completion.get_future().wait();
  timer.get_future().wait();
  return true;
}

TEST(ForkedChildTest, RunsEverythingInAChild) {
  RunsItemsCompletionsAndTimers();
  EXPECT_TRUE(HoldsInChild(RunsItemsCompletionsAndTimers));
  RunsItemsCompletionsAndTimers();
}

TEST(ForkedChildTest, RunsEverythingInAChildOfAChild) {
  EXPECT_TRUE(HoldsInChild([] {
    return RunsItemsCompletionsAndTimers() && HoldsInChild(RunsItemsCompletionsAndTimers);
  }));
}

TEST(ForkedChildTest, HandleOfTheParentWorksInAChild) {
  const auto pool = GetThreadPool();
  EXPECT_TRUE(HoldsInChild([&] {
    std::promise<void> done;
    pool->Run([&] { done.set_value(); });
    done.get_future().wait();
    return true;
  }));
}

TEST(ForkedChildTest, TimerOfTheParentRunsOnlyInTheParent) {
  std::promise<pid_t> ran;
  const auto timer = GetThreadPool()->RunAfter(200000, [&] { ran.set_value(getpid()); });
  EXPECT_TRUE(HoldsInChild([&] {
    std::promise<void> later;
    GetThreadPool()->RunAfter(400000, [&] { later.set_value(); });
    later.get_future().wait();
    return !timer->Cancel() &&
           ran.get_future().wait_for(std::chrono::seconds(0)) == std::future_status::timeout;
  }));
  EXPECT_EQ(ran.get_future().get(), getpid());
}

TEST(ForkedChildTest, ChildThatReturnsFromAnItemEnds) {
  for (const bool isItem : {true, false}) {
    std::promise<pid_t> forked;
    const auto body = [&forked] {
      AwaitIdleThreads();
      if (const pid_t child = ForkWithLimit(); child != 0) {
        forked.set_value(child);
        return;
      }
      // Runs first at exit, before a check for leaks, which does not work in a forked child.
      std::atexit([] { EndChild(true); });
    };
    isItem ? GetThreadPool()->Run(body) : GetThreadPool()->Post(body);
    EXPECT_TRUE(HasSucceeded(forked.get_future().get())) << isItem;
  }
  RunsItemsCompletionsAndTimers();
}

class SocketForkTest : public testing::Test {
 protected:
  SocketForkTest() {
    std::promise<std::string> connected;
    socket_->ConnectAsync("127.0.0.1", listener_.Port(),
                          [&](System::TCPClientSocket*, Exception* error) {
                            connected.set_value(error == nullptr ? "" : error->Message());
                          });
    peer_ = listener_.Accept();
    EXPECT_EQ(connected.get_future().get(), "");
  }

  std::string Read(std::size_t size) {
    std::string bytes(size, '\0');
    std::promise<std::size_t> read;
    socket_->ReadAsync(bytes.data(), size,
                       [&](std::size_t count, Exception*) { read.set_value(count); });
    bytes.resize(read.get_future().get());
    return bytes;
  }

  const LoopbackListener listener_;
  const Ref<System::TCPClientSocket> socket_ = System::CreateTCPClientSocket(GetThreadPool().get());
  Descriptor peer_;
};

TEST_F(SocketForkTest, BelongsToTheParent) {
  EXPECT_TRUE(HoldsInChild([&] {
    char byte = 0;
    int refused = 0;
    for (const bool isRead : {true, false}) {
      try {
        isRead ? socket_->ReadAsync(&byte, 1, [](std::size_t, Exception*) {})
               : socket_->WriteAsync(&byte, 1, [](Exception*) {});
      } catch (const InvalidStateException& refusal) {
        refused += refusal.Message() == "The socket belongs to the parent process." ? 1 : 0;
      }
    }
    socket_->Close();
    return refused == 2;
  }));
  ASSERT_TRUE(SendAll(peer_.Get(), "still open"));
  EXPECT_EQ(Read(10), "still open");
}

TEST_F(SocketForkTest, IsNotKeptOpenByAChild) {
  // The child ends when the other end of the pipe is closed.
  int pipeEnds[2];
  ASSERT_EQ(pipe(pipeEnds), 0);
  const pid_t child = ForkWithLimit();
  if (child == 0) {
    char byte = 0;
    close(pipeEnds[1]);
    EndChild(read(pipeEnds[0], &byte, 1) == 0);
  }
  close(pipeEnds[0]);
  socket_->Close();
  EXPECT_EQ(ReceiveExactly(peer_.Get(), 1), "");  // the end of the connection
  close(pipeEnds[1]);
  EXPECT_TRUE(HasSucceeded(child));
}

}  // namespace
}  // namespace Tarnik::Testing
