#include "end_wait.h"

#include <array>
#include <cerrno>
#include <csignal>

#include <poll.h>
#include <pthread.h>
#include <sys/signalfd.h>

#include "errors.h"

namespace DevSts::Program {
namespace {

Descriptor ReceiveSignals() {
  sigset_t signals;
  sigemptyset(&signals);
  sigaddset(&signals, SIGTERM);
  sigaddset(&signals, SIGINT);
  pthread_sigmask(SIG_BLOCK, &signals, nullptr);
  return Descriptor(signalfd(-1, &signals, SFD_CLOEXEC));
}

}  // namespace

EndWait::EndWait() : signals_(ReceiveSignals()) {
  if (signals_.Get() < 0) {
    throw ProgramError(ExitStatus::Failed, "there are too few file descriptors");
  }
}

void EndWait::Request() {
  requested_.Set();
}

void EndWait::Fail(const std::string& message) {
  {
    const std::lock_guard lock(mutex_);
    if (failure_.empty()) {
      failure_ = message;
    }
  }
  Request();
}

void EndWait::Wait() {
  std::array<pollfd, 2> entries{{{signals_.Get(), POLLIN, 0}, {requested_.Get(), POLLIN, 0}}};
  while (poll(entries.data(), entries.size(), -1) < 0 && errno == EINTR) {
  }
  const std::lock_guard lock(mutex_);
  if (!failure_.empty()) {
    throw ProgramError(ExitStatus::Failed, failure_);
  }
}

}  // namespace DevSts::Program
