// Ends while a token source is at work:
// end_probe SCENARIO URL CA_FILE SIGNING_CERTIFICATE_FILE MICROSECONDS
// The exit status is 0 when all calls that the scenario observes ended as they should.
#include <array>
#include <atomic>
#include <chrono>
#include <cstddef>
#include <cstdlib>
#include <future>
#include <iostream>
#include <map>
#include <memory>
#include <string>
#include <thread>

#include <unistd.h>

#include "end_to_end/probe_config.h"

namespace {

using SsoClient::Access::TokenSource;
using SsoClient::Access::TokenSourceConfig;
using SsoClient::Access::Testing::ProbeSpec;

constexpr int kSpecs = 8;
constexpr std::size_t kCalls = 300;

/// Counts the reports of each call. Never destroyed.
struct Reports {
  std::array<std::atomic<int>, kCalls> counts{};
  std::atomic<std::size_t> calls{0};
  std::promise<void> all;
};

// Never destroyed, unless a scenario does it.
std::shared_ptr<TokenSource>* source = nullptr;
Reports* const reports = new Reports;
std::chrono::microseconds untilExit{0};
std::chrono::steady_clock::time_point exitBegan;

[[noreturn]] void Fail(const std::string& reason) {
  std::cerr << reason << '\n';
  _exit(3);
}

/// Waits for its thread at the end of the process, as many globals do.
class JoiningGlobal {
 public:
  ~JoiningGlobal() {
    if (thread_.joinable()) {
      thread_.join();
    }
  }
  void Start(void (*body)()) { thread_ = std::thread(body); }

 private:
  std::thread thread_;
};

/// A global that is destroyed after the exit handlers of the libraries have run.
class SourceGlobal {
 public:
  void Take(std::shared_ptr<TokenSource> taken) { source_ = std::move(taken); }

 private:
  std::shared_ptr<TokenSource> source_;
};

// Constructed before the libraries register their exit handlers, so destroyed after those have run.
SourceGlobal sourceGlobal;
JoiningGlobal joiningGlobal;

void BeginCalls(std::size_t count = kCalls) {
  for (std::size_t i = 0; i < count; ++i) {
    (*source)->GetTokenAsync(ProbeSpec(static_cast<int>(i % kSpecs)), {},
                             [i, count](const auto&, const Tarnik::Exception*) {
                               if (++reports->counts[i] != 1) {
                                 Fail("a call has reported twice");
                               }
                               if (++reports->calls == count) {
                                 reports->all.set_value();
                               }
                             });
  }
}

void RequireEnding() {
  try {
    (*source)->GetToken(ProbeSpec(kSpecs));
  } catch (const SsoClient::CommunicationException& failure) {
    if (failure.Message().find("rocess is ending") == std::string::npos) {
      Fail(failure.Message());
    }
    return;
  } catch (const std::exception& failure) {
    Fail(std::string("another class: ") + failure.what());
  }
  Fail("the call succeeded");
}

void ExitWithCalls() {
  BeginCalls();
  std::this_thread::sleep_for(untilExit);
}

/// Runs after the exit handlers of the libraries.
void RequireReports() {
  if (reports->all.get_future().wait_for(std::chrono::seconds(30)) != std::future_status::ready) {
    Fail("only " + std::to_string(reports->calls) + " calls have reported");
  }
}

void JoinACallThatWaits() {
  BeginCalls(1);
  joiningGlobal.Start(&RequireEnding);
  std::this_thread::sleep_for(untilExit);
}

void DestroyAtTheEnd() {
  BeginCalls();
  sourceGlobal.Take(std::move(*source));
  std::this_thread::sleep_for(untilExit);
}

/// Runs after the exit handlers of the libraries, each of which waits for at most 200 ms.
void RequireQuickExit() {
  constexpr std::chrono::seconds kLimitOnABusyMachine{5};
  if (std::chrono::steady_clock::now() - exitBegan > kLimitOnABusyMachine) {
    Fail("the exit handlers took too long");
  }
}

}  // namespace

int main(int argc, char** argv) {
  struct Scenario {
    void (*body)();
    void (*exitHandler)();
  };
  const std::map<std::string, Scenario> scenarios = {
      {"exit", {ExitWithCalls, nullptr}},      {"reports", {ExitWithCalls, RequireReports}},
      {"join", {JoinACallThatWaits, nullptr}}, {"call-in-handler", {ExitWithCalls, RequireEnding}},
      {"global", {DestroyAtTheEnd, nullptr}},
  };
  const auto scenario = scenarios.find(argc == 6 ? argv[1] : "");
  if (scenario == scenarios.end()) {
    return 2;
  }
  // Registered before those of the libraries, so that they run after them.
  std::atexit(&RequireQuickExit);
  if (scenario->second.exitHandler != nullptr) {
    std::atexit(scenario->second.exitHandler);
  }
  TokenSourceConfig config = SsoClient::Access::Testing::ProbeConfig(argv[2], argv[3], argv[4]);
  // Refreshes are under way too.
  config.refresh.fraction = 0.0001;
  config.refresh.jitter = 0;
  config.keepFresh = {ProbeSpec(0), ProbeSpec(1)};
  source = new std::shared_ptr<TokenSource>(SsoClient::Access::CreateTokenSource(config));
  untilExit = std::chrono::microseconds(std::atol(argv[5]));
  scenario->second.body();
  exitBegan = std::chrono::steady_clock::now();
  return 0;
}
