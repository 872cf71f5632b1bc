#include "chaos/run.h"

#include <algorithm>
#include <csignal>
#include <cstring>
#include <iostream>
#include <sstream>
#include <utility>

#include <unistd.h>

namespace SsoClient::Testing {
namespace {

constexpr unsigned kCaseLimitSeconds = 60;

// The case for the signal handler.
char currentCase[512] = "";

void EndHangingCase(int /*signal*/) {
  constexpr char kMessage[] = "VIOLATION, the case did not end: ";
  [[maybe_unused]] auto written = write(STDERR_FILENO, kMessage, sizeof(kMessage) - 1);
  written = write(STDERR_FILENO, currentCase, std::strlen(currentCase));
  written = write(STDERR_FILENO, "\n", 1);
  _exit(1);
}

}  // namespace

Run::Run(std::string campaign, std::uint64_t seed, std::chrono::seconds time)
    : campaign_(std::move(campaign)), seed_(seed), time_(time), random_(seed) {
  struct sigaction action = {};
  action.sa_handler = &EndHangingCase;
  sigaction(SIGALRM, &action, nullptr);
}

bool Run::HasTime() const {
  return cases_ == 0 || std::chrono::steady_clock::now() - begin_ < time_;
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
