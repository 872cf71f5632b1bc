#include "single_thread.h"

#include <atomic>
#include <future>
#include <thread>

#include <boost/asio/io_context.hpp>

#include "input.h"
#include "system/thread_pool_impl.h"

namespace {

bool isSingle = false;

}  // namespace

namespace Fuzz {

// The linker's option --wrap passes the pool's call to this function, and calls of the real one to
// the pool.
void RealStart(Tarnik::System::PoolCore* core) __asm__("__real__ZN6Tarnik6System8PoolCore5StartEv");
void Start(Tarnik::System::PoolCore* core) __asm__("__wrap__ZN6Tarnik6System8PoolCore5StartEv");

void Start(Tarnik::System::PoolCore* core) {
  if (!isSingle) {
    RealStart(core);
  }
}

void RunOnOneThread() {
  isSingle = true;
}

bool RunCompletions() {
  Require(isSingle);
  boost::asio::io_context& completions = Tarnik::System::ProcessThreadPool().IoContext();
  completions.restart();
  return completions.poll() != 0;
}

void RunCompletionsDuring(const std::function<void()>& wait) {
  // Each thread has a context of its own.
  std::promise<boost::asio::io_context*> context;
  std::atomic<bool> hasReturned{false};
  std::thread waiting([&] {
    context.set_value(&Tarnik::System::ProcessThreadPool().IoContext());
    wait();
    hasReturned = true;
  });
  boost::asio::io_context& other = *context.get_future().get();
  while (!hasReturned) {
    RunCompletions();
    other.restart();
    other.poll();
  }
  waiting.join();
}

}  // namespace Fuzz
