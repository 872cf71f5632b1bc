#include "system/handler_memory.h"

#include <array>
#include <chrono>
#include <cstddef>

#include <boost/asio/buffer.hpp>
#include <boost/asio/io_context.hpp>
#include <boost/asio/ip/tcp.hpp>
#include <boost/asio/post.hpp>
#include <boost/asio/steady_timer.hpp>
#include <gtest/gtest.h>

namespace Tarnik::System {
namespace {

using boost::asio::ip::tcp;
using boost::system::error_code;

/// True while an operation has the memory.
bool IsInUse(HandlerMemory& memory) {
  void* const taken = memory.Allocate(1);
  const auto* const bytes = static_cast<std::byte*>(taken);
  const auto* const begin = reinterpret_cast<std::byte*>(&memory);
  const bool isInside = bytes >= begin && bytes < begin + sizeof(HandlerMemory);
  memory.Deallocate(taken);
  return !isInside;
}

/// The largest handler that the memory is meant for.
struct Handler {
  bool* called;
  std::array<char, HandlerMemory::kMaxHandlerSize - sizeof(bool*)> captures{};

  template <class... Arguments>
  void operator()(const Arguments&...) const {
    *called = true;
  }
};
static_assert(sizeof(Handler) == HandlerMemory::kMaxHandlerSize);

class HandlerMemoryTest : public testing::Test {
 protected:
  /// Expects that the operation just started has the memory until its handler runs.
  void ExpectUse() {
    EXPECT_TRUE(IsInUse(memory_));
    ioContext_.run();
    EXPECT_TRUE(called_);
    EXPECT_FALSE(IsInUse(memory_));
  }
  auto NewHandler() { return WithMemory(memory_, Handler{&called_}); }

  boost::asio::io_context ioContext_;
  HandlerMemory memory_;
  bool called_ = false;
};

TEST_F(HandlerMemoryTest, HasOneUserAtATime) {
  void* const first = memory_.Allocate(HandlerMemory::kSize);
  void* const second = memory_.Allocate(1);
  EXPECT_TRUE(IsInUse(memory_));
  EXPECT_NE(first, second);
  memory_.Deallocate(second);
  EXPECT_TRUE(IsInUse(memory_));
  memory_.Deallocate(first);
  EXPECT_FALSE(IsInUse(memory_));
}

TEST_F(HandlerMemoryTest, TakesFromTheHeapWhatIsTooLarge) {
  void* const large = memory_.Allocate(HandlerMemory::kSize + 1);
  EXPECT_FALSE(IsInUse(memory_));
  memory_.Deallocate(large);
  EXPECT_FALSE(IsInUse(memory_));
}

TEST_F(HandlerMemoryTest, HoldsAPost) {
  boost::asio::post(ioContext_, NewHandler());
  ExpectUse();
}

TEST_F(HandlerMemoryTest, HoldsTheWaitForATimer) {
  boost::asio::steady_timer timer(ioContext_, std::chrono::milliseconds(0));
  timer.async_wait(NewHandler());
  ExpectUse();
}

TEST_F(HandlerMemoryTest, HoldsTheOperationsOfASocket) {
  tcp::acceptor acceptor(ioContext_, tcp::endpoint(boost::asio::ip::address_v4::loopback(), 0));
  tcp::socket socket(ioContext_);
  socket.async_connect(acceptor.local_endpoint(), NewHandler());
  ExpectUse();

  for (const bool isRead : {false, true}) {
    ioContext_.restart();
    called_ = false;
    char byte = 'x';
    if (isRead) {
      tcp::socket peer = acceptor.accept();
      peer.send(boost::asio::buffer(&byte, 1));
      socket.async_read_some(boost::asio::buffer(&byte, 1), NewHandler());
    } else {
      socket.async_write_some(boost::asio::buffer(&byte, 1), NewHandler());
    }
    ExpectUse();
  }
}

TEST_F(HandlerMemoryTest, IsFreeWhenAHandlerRuns) {
  bool wasFree = false;
  boost::asio::post(ioContext_,
                    WithMemory(memory_, [this, &wasFree] { wasFree = !IsInUse(memory_); }));
  ioContext_.run();
  EXPECT_TRUE(wasFree);
}

}  // namespace
}  // namespace Tarnik::System
