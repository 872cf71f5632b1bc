// Ends while calls are in progress:
// exit_probe SCENARIO URL CA_FILE SIGNING_CERTIFICATE_FILE MICROSECONDS
// The exit status is 0 when all calls that the scenario observes ended as they should.
#include <atomic>
#include <chrono>
#include <cstdlib>
#include <functional>
#include <future>
#include <iostream>
#include <map>
#include <string>
#include <thread>

#include <unistd.h>

#include <ssoclient/ssoclient.h>

#include "integration/probe_service.h"

namespace {

using SsoClient::Testing::ProbeService;

// Never destroyed: scenarios use it in exit handlers and destructors.
const ProbeService* probe = nullptr;
std::chrono::microseconds untilExit{0};
std::chrono::steady_clock::time_point exitBegan;

/// Ends the process when a call at its end did not fail as it should; destructors cannot return a
/// status.
void RequireEnding(const std::function<void()>& call) {
  try {
    call();
    std::cerr << "the call succeeded\n";
  } catch (const SsoClient::CommunicationException& failure) {
    if (failure.Message().find("the process is ending") != std::string::npos) {
      return;
    }
    std::cerr << failure.Message() << '\n';
  } catch (const std::exception& failure) {
    std::cerr << "another class: " << failure.what() << '\n';
  }
  _exit(3);
}

void RequireLoginEnds() {
  RequireEnding([] { probe->Login(); });
}

/// Waits for its thread at the end of the process, as many globals do.
class JoiningGlobal {
 public:
  ~JoiningGlobal() {
    if (thread_.joinable()) {
      thread_.join();
    }
  }
  void Start(std::function<void()> body) { thread_ = std::thread(std::move(body)); }

 private:
  std::thread thread_;
};

// Constructed before the library's threads start, so it is destroyed after its exit handler has
// run.
JoiningGlobal joiningGlobal;

/// Runs after the library's exit handler, which waits for at most 200 ms.
void RequireQuickExit() {
  constexpr std::chrono::seconds kLimitOnABusyMachine{3};
  if (std::chrono::steady_clock::now() - exitBegan > kLimitOnABusyMachine) {
    std::cerr << "the exit handler took too long\n";
    _exit(4);
  }
}

void StartAsyncCalls() {
  for (int i = 0; i < 100; ++i) {
    probe->service->AcquireTokenAsync("alice@EXAMPLE.COM", "secret", ProbeService::Spec(),
                                      [](const auto&, const Tarnik::Exception*) {});
  }
  std::this_thread::sleep_for(untilExit);
}

void JoinACallThatWaits() {
  // Starts the library's threads and so registers its exit handler.
  probe->service->AcquireTokenAsync("alice@EXAMPLE.COM", "secret", ProbeService::Spec(),
                                    [](const auto&, const Tarnik::Exception*) {});
  std::promise<void> started;
  joiningGlobal.Start([&started] {
    started.set_value();
    RequireLoginEnds();
  });
  started.get_future().wait();
  std::this_thread::sleep_for(untilExit);
}

void CallFromAnExitHandler() {
  std::atexit(&RequireLoginEnds);
  // The library's exit handler is registered after the one above.
  probe->service->AcquireTokenAsync("alice@EXAMPLE.COM", "secret", ProbeService::Spec(),
                                    [](const auto&, const Tarnik::Exception*) {});
  std::this_thread::sleep_for(untilExit);
}

void CallAsynchronouslyFromAnExitHandler() {
  std::atexit([] {
    RequireEnding([] {
      probe->service->AcquireTokenAsync("alice@EXAMPLE.COM", "secret", ProbeService::Spec(),
                                        [](const auto&, const Tarnik::Exception*) {});
    });
  });
  StartAsyncCalls();
}

/// More calls than workers: those that wait for a worker report too.
void AwaitQueuedCallbacksInAnExitHandler() {
  constexpr int kCalls = 300;
  static std::atomic<int> reported{0};
  static std::promise<void> allReported;
  std::atexit([] { allReported.get_future().wait(); });
  for (int i = 0; i < kCalls; ++i) {
    probe->service->AcquireTokenAsync("alice@EXAMPLE.COM", "secret", ProbeService::Spec(),
                                      [](const auto&, const Tarnik::Exception* failure) {
                                        RequireEnding([&] { failure->Throw(); });
                                        if (++reported == kCalls) {
                                          allReported.set_value();
                                        }
                                      });
  }
  std::this_thread::sleep_for(untilExit);
}

/// A call that was begun before the end reports to its callback, which an exit handler waits for.
void AwaitACallbackInAnExitHandler() {
  static std::promise<std::string> reported;
  std::atexit([] {
    const std::string message = reported.get_future().get();
    if (message.find("the process is ending") == std::string::npos) {
      std::cerr << message << '\n';
      _exit(3);
    }
  });
  probe->service->AcquireTokenAsync(
      "alice@EXAMPLE.COM", "secret", ProbeService::Spec(),
      [](const auto&, const Tarnik::Exception* failure) {
        reported.set_value(failure == nullptr ? "a token" : failure->Message());
      });
  std::this_thread::sleep_for(untilExit);
}

}  // namespace

int main(int argc, char** argv) {
  const std::map<std::string, void (*)()> scenarios = {
      {"async", StartAsyncCalls},
      {"join", JoinACallThatWaits},
      {"call-in-handler", CallFromAnExitHandler},
      {"async-call-in-handler", CallAsynchronouslyFromAnExitHandler},
      {"callback-in-handler", AwaitACallbackInAnExitHandler},
      {"queued-callbacks-in-handler", AwaitQueuedCallbacksInAnExitHandler},
  };
  const auto scenario = scenarios.find(argc == 6 ? argv[1] : "");
  if (scenario == scenarios.end()) {
    return 2;
  }
  probe = new ProbeService(argv[2], argv[3], argv[4]);
  untilExit = std::chrono::microseconds(std::atol(argv[5]));
  std::atexit(&RequireQuickExit);
  scenario->second();
  exitBegan = std::chrono::steady_clock::now();
  return 0;
}
