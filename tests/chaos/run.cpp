#include "chaos/run.h"

#include <algorithm>
#include <csignal>
#include <cstring>
#include <iostream>
#include <iterator>
#include <sstream>
#include <string_view>
#include <utility>

#include <unistd.h>

namespace SsoClient::Testing {
namespace {

constexpr unsigned kCaseLimitSeconds = 60;

// The case for the signal handler.
char currentCase[512] = "";

// Signals that end the process, with what a sanitizer does about them.
constexpr int kEndings[] = {SIGABRT, SIGSEGV, SIGBUS};
struct sigaction formerActions[std::size(kEndings)];

void WriteCase(std::string_view what) {
  for (const std::string_view text :
       {what, std::string_view(currentCase), std::string_view("\n")}) {
    [[maybe_unused]] const auto written = write(STDERR_FILENO, text.data(), text.size());
  }
}

void EndHangingCase(int /*signal*/) {
  WriteCase("VIOLATION, the case did not end; ");
  _exit(1);
}

/// Returns to what raised the signal, which then ends the process.
void NameEndingCase(int signal) {
  WriteCase("VIOLATION, a signal; ");
  for (std::size_t i = 0; i < std::size(kEndings); ++i) {
    if (kEndings[i] == signal) {
      sigaction(signal, &formerActions[i], nullptr);
    }
  }
}

void Handle(int signal, void (*handler)(int), struct sigaction* former) {
  struct sigaction action = {};
  action.sa_handler = handler;
  action.sa_flags = SA_NODEFER;
  sigaction(signal, &action, former);
}

}  // namespace

Run::Run(std::string campaign, std::uint64_t seed, std::chrono::seconds time)
    : campaign_(std::move(campaign)), seed_(seed), time_(time), random_(seed) {
  Handle(SIGALRM, &EndHangingCase, nullptr);
  for (std::size_t i = 0; i < std::size(kEndings); ++i) {
    Handle(kEndings[i], &NameEndingCase, &formerActions[i]);
  }
}

bool Run::HasTime() {
  const auto now = std::chrono::steady_clock::now();
  if (!begin_) {
    begin_ = now;
    return true;
  }
  return now - *begin_ < time_;
}

std::size_t Run::Below(std::size_t bound) {
  return random_() % bound;
}

void Run::Begin(const std::string& description) {
  ++cases_;
  std::ostringstream text;
  text << "campaign " << campaign_ << ", seed " << seed_ << ", case " << cases_ << ": "
       << description;
  case_ = text.str();
  const std::size_t length = std::min(case_.size(), sizeof(currentCase) - 1);
  std::memcpy(currentCase, case_.data(), length);
  currentCase[length] = '\0';
  alarm(kCaseLimitSeconds);
}

void Run::Require(bool holds, const std::string& message) const {
  if (!holds) {
    Fail(message);
  }
}

void Run::Fail(const std::string& message) const {
  std::cerr << "VIOLATION, " + message + "; " + case_ + "\n" << std::flush;
  _exit(1);
}

}  // namespace SsoClient::Testing
