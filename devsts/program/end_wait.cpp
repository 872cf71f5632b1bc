#include "end_wait.h"

#include <array>
#include <cerrno>
#include <csignal>
#include <cstdint>

#include <poll.h>
#include <pthread.h>
#include <sys/eventfd.h>
#include <sys/signalfd.h>
#include <unistd.h>

#include "errors.h"

namespace DevSts::Program {
namespace {

constexpr std::size_t kMaxInput = 65536;

Descriptor ReceiveSignals() {
  sigset_t signals;
  sigemptyset(&signals);
  sigaddset(&signals, SIGTERM);
  sigaddset(&signals, SIGINT);
  pthread_sigmask(SIG_BLOCK, &signals, nullptr);
  return Descriptor(signalfd(-1, &signals, SFD_CLOEXEC));
}

// Executes the complete lines and removes them from the text. Returns false if one of them ends the
// service.
bool ExecuteLines(std::string& text, const std::function<bool(const std::string&)>& execute) {
  for (std::size_t end = text.find('\n'); end != std::string::npos; end = text.find('\n')) {
    const std::string line = text.substr(0, end);
    text.erase(0, end + 1);
    if (!execute(line)) {
      return false;
    }
  }
  return text.size() <= kMaxInput;
}

// Returns false at the end of standard input.
bool ReadInput(std::string& text) {
  std::array<char, 4096> octets{};
  ssize_t size = 0;
  do {
    size = read(STDIN_FILENO, octets.data(), octets.size());
  } while (size < 0 && errno == EINTR);
  if (size > 0) {
    text.append(octets.data(), static_cast<std::size_t>(size));
  }
  return size > 0;
}

}  // namespace

EndWait::EndWait() : signals_(ReceiveSignals()), requested_(eventfd(0, EFD_CLOEXEC)) {
  if (signals_.Get() < 0 || requested_.Get() < 0) {
    throw ProgramError(ExitStatus::Failed, "there are too few file descriptors");
  }
}

void EndWait::Request() {
  const std::uint64_t one = 1;
  static_cast<void>(write(requested_.Get(), &one, sizeof one) == 0);
}

void EndWait::Wait(bool withStdin, const std::function<bool(const std::string& line)>& execute) {
  std::array<pollfd, 3> entries{{{signals_.Get(), POLLIN, 0},
                                 {requested_.Get(), POLLIN, 0},
                                 {withStdin ? STDIN_FILENO : -1, POLLIN, 0}}};
  std::string input;
  for (;;) {
    if (poll(entries.data(), entries.size(), -1) < 0 && errno != EINTR) {
      return;
    }
    if (entries[0].revents != 0 || entries[1].revents != 0) {
      return;
    }
    if (entries[2].revents != 0 && (!ReadInput(input) || !ExecuteLines(input, execute))) {
      return;
    }
  }
}

}  // namespace DevSts::Program
