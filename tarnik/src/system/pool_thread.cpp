#include "system/pool_thread.h"

#include <cstdlib>
#include <system_error>
#include <thread>
#include <utility>

#include <pthread.h>
#include <signal.h>
#include <unistd.h>

#include <tarnik/core/exception.h>

namespace Tarnik::System {
namespace {

// Blocks signals while a thread is created, since a new thread inherits its creator's signal mask.
class SignalBlock {
 public:
  SignalBlock() {
    sigset_t blocked;
    sigfillset(&blocked);
    for (const int raisedByTheThread :
         {SIGSEGV, SIGBUS, SIGFPE, SIGILL, SIGABRT, SIGTRAP, SIGSYS, SIGPROF}) {
      sigdelset(&blocked, raisedByTheThread);
    }
    pthread_sigmask(SIG_SETMASK, &blocked, &previous_);
  }
  ~SignalBlock() { pthread_sigmask(SIG_SETMASK, &previous_, nullptr); }
  SignalBlock(const SignalBlock&) = delete;
  SignalBlock& operator=(const SignalBlock&) = delete;

 private:
  sigset_t previous_;
};

}  // namespace

void StartPoolThread(const char* name, std::function<void()> body) {
  const SignalBlock block;
  try {
    std::thread([name, body = std::move(body)] {
      pthread_setname_np(pthread_self(), name);
      body();
    }).detach();
  } catch (const std::system_error& error) {
    throw ResourceException("Cannot start a thread: " + error.code().message() + ".");
  }
}

void ParkThread() noexcept {
  for (;;) {
    pause();
  }
}

CompletionScope::~CompletionScope() {
  if (mark_.IsFromParent()) {
    std::exit(EXIT_SUCCESS);
  }
}

void RunCompletion(const std::function<void()>& completion) {
  const CompletionScope scope;
  completion();
}

}  // namespace Tarnik::System
