#include "input/terminal.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <csignal>
#include <cstddef>
#include <cstring>

#include <fcntl.h>
#include <poll.h>
#include <termios.h>
#include <unistd.h>

#include <tarnik/text/display_text.h>

#include "failure.h"
#include "input/descriptor.h"
#include "input/ending_signals.h"

namespace SsoClient::Tool {
namespace {

constexpr auto kSignals = [] {
  std::array<int, kEndingSignals.size() + 2> signals{SIGTSTP, SIGCONT};
  std::copy(kEndingSignals.begin(), kEndingSignals.end(), signals.begin() + 2);
  return signals;
}();

constexpr std::size_t kMaxPromptBytes = 1000;

volatile std::sig_atomic_t lastSignal = 0;

extern "C" void NoteSignal(int signal) {
  lastSignal = signal;
}

[[noreturn]] void FailWithTerminal(int error) {
  throw ToolException(
      {ExitStatus::kLocal, "terminal", "cannot use the terminal: " + SystemMessage(error), ""});
}

int OpenTerminal() {
  return open("/dev/tty", O_RDWR | O_CLOEXEC | O_NOCTTY);
}

/// Catches the signals that end, stop or continue a process, and lets them arrive only where
/// `Arrivals` is the mask. Signals that are ignored stay so.
class CaughtSignals {
 public:
  CaughtSignals() {
    lastSignal = 0;
    sigset_t caught;
    sigemptyset(&caught);
    struct sigaction action {};
    action.sa_handler = NoteSignal;
    sigemptyset(&action.sa_mask);
    for (std::size_t i = 0; i < kSignals.size(); ++i) {
      sigaction(kSignals[i], nullptr, &actions_[i]);
      if (actions_[i].sa_handler != SIG_IGN) {
        sigaddset(&caught, kSignals[i]);
      }
    }
    pthread_sigmask(SIG_BLOCK, &caught, &mask_);
    for (std::size_t i = 0; i < kSignals.size(); ++i) {
      if (actions_[i].sa_handler != SIG_IGN) {
        sigaction(kSignals[i], &action, nullptr);
      }
    }
  }
  ~CaughtSignals() {
    for (std::size_t i = 0; i < kSignals.size(); ++i) {
      sigaction(kSignals[i], &actions_[i], nullptr);
    }
    pthread_sigmask(SIG_SETMASK, &mask_, nullptr);
  }
  CaughtSignals(const CaughtSignals&) = delete;
  CaughtSignals& operator=(const CaughtSignals&) = delete;

  const sigset_t& Arrivals() const { return mask_; }

 private:
  std::array<struct sigaction, kSignals.size()> actions_{};
  sigset_t mask_{};
};

/// Switches echo off, and restores the terminal. What was typed before or after is dropped.
class QuietTerminal {
 public:
  explicit QuietTerminal(int terminal) : terminal_(terminal) {
    if (tcgetattr(terminal_, &before_) != 0) {
      FailWithTerminal(errno);
    }
    termios quiet = before_;
    quiet.c_lflag &= ~static_cast<tcflag_t>(ECHO | ECHOE | ECHOK | ECHONL);
    quiet.c_lflag |= ICANON | ISIG;
    if (tcsetattr(terminal_, TCSAFLUSH, &quiet) != 0) {
      FailWithTerminal(errno);
    }
  }
  ~QuietTerminal() {
    while (tcsetattr(terminal_, TCSAFLUSH, &before_) != 0 && errno == EINTR) {
    }
    WriteAll(terminal_, "\n");
  }
  QuietTerminal(const QuietTerminal&) = delete;
  QuietTerminal& operator=(const QuietTerminal&) = delete;

 private:
  int terminal_;
  termios before_{};
};

// Returns the signal that has interrupted it, or 0 after a line or the end of input.
int ReadLineQuietly(int terminal, const sigset_t& arrivals, std::size_t maxBytes,
                    SecretText& line) {
  std::array<char, 256> buffer{};
  for (;;) {
    pollfd waiting{.fd = terminal, .events = POLLIN, .revents = 0};
    const int ready = ppoll(&waiting, 1, nullptr, &arrivals);
    if (lastSignal != 0) {
      return lastSignal;
    }
    if (ready < 0 && errno != EINTR) {
      FailWithTerminal(errno);
    }
    if (ready <= 0) {
      continue;
    }
    const ssize_t size = read(terminal, buffer.data(), buffer.size());
    if (size < 0) {
      FailWithTerminal(errno);
    }
    line.Append(buffer.data(), static_cast<std::size_t>(size));
    explicit_bzero(buffer.data(), buffer.size());
    const bool isLine = !line.Text().empty() && line.Text().back() == '\n';
    if (isLine) {
      line.Truncate(line.Text().size() - 1);
    }
    if (isLine || size == 0 || line.Text().size() > maxBytes) {
      return 0;
    }
  }
}

int Ask(int terminal, const std::string& prompt, std::size_t maxBytes, SecretText& line) {
  const CaughtSignals signals;
  const QuietTerminal quiet(terminal);
  // A name in it may come from others, with control characters.
  const std::string shown = Tarnik::ToDisplayText(prompt, kMaxPromptBytes);
  if (!WriteAll(terminal, shown) && errno != EBADF) {
    FailWithTerminal(errno);
  }
  return ReadLineQuietly(terminal, signals.Arrivals(), maxBytes, line);
}

}  // namespace

bool HasTerminal() {
  return Descriptor(OpenTerminal()).Get() >= 0;
}

SecretText ReadFromTerminal(const std::string& prompt, std::size_t maxBytes) {
  const Descriptor terminal(OpenTerminal());
  if (terminal.Get() < 0) {
    FailWithTerminal(errno);
  }
  return ReadFromTerminal(terminal.Get(), prompt, maxBytes);
}

SecretText ReadFromTerminal(int descriptor, const std::string& prompt, std::size_t maxBytes) {
  for (;;) {
    SecretText line;
    const int signal = Ask(descriptor, prompt, maxBytes, line);
    if (signal == 0) {
      return line;
    }
    // With the process's own action: most end it here, and a stopped one continues here.
    if (signal != SIGCONT) {
      raise(signal);
    }
  }
}

}  // namespace SsoClient::Tool
