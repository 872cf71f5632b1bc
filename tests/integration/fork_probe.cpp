// Forks while calls are in progress:
// fork_probe SCENARIO URL CA_FILE SIGNING_CERTIFICATE_FILE HOLDER_FILE FORKS THREADS
// The exit status is 0 when all calls of all processes succeeded.
#include <algorithm>
#include <atomic>
#include <cstdlib>
#include <functional>
#include <future>
#include <iostream>
#include <map>
#include <memory>
#include <stdexcept>
#include <string>
#include <thread>
#include <vector>

#include <sys/wait.h>
#include <unistd.h>

#include <ssoclient/ssoclient.h>

#include "integration/probe_service.h"
#include "support/forked_child.h"

namespace {

using SsoClient::Testing::ProbeService;

// Ends a child that hangs. Its parent sees the signal.
constexpr unsigned kChildLimitSeconds = 60;
constexpr int kFailed = 3;

const ProbeService* probe = nullptr;
const ProbeService* holder = nullptr;
// A token that the parent acquires.
std::shared_ptr<const SsoClient::SamlToken> boundToken;
int forks = 0;
int threads = 0;

int StatusOf(const std::function<void()>& calls) {
  try {
    calls();
    return EXIT_SUCCESS;
  } catch (const std::exception& failure) {
    std::cerr << getpid() << ": " << failure.what() << '\n';
    return kFailed;
  }
}

/// Waits for a child. Anything but a normal end with status 0 is reported.
bool HasSucceeded(pid_t child) {
  int status = -1;
  if (child < 0 || waitpid(child, &status, 0) != child) {
    std::cerr << "no child\n";
    return false;
  }
  if (status != 0) {
    std::cerr << "child " << child << " ended with wait status " << status << '\n';
  }
  return status == 0;
}

pid_t ForkChild(const std::function<void()>& body) {
  if (threads == 0) {
    Tarnik::Testing::AwaitIdleThreads();
  }
  const pid_t child = fork();
  if (child == 0) {
    alarm(kChildLimitSeconds);
    body();
    _exit(kFailed);
  }
  return child;
}

void CallEverything() {
  const auto token = probe->Login();
  if (!probe->service->ValidateSubject(*token)) {
    throw std::runtime_error("the token is not valid");
  }
  std::promise<bool> done;
  probe->service->AcquireTokenAsync(
      "alice@EXAMPLE.COM", "secret", ProbeService::Spec(),
      [&done](const auto& issued, const Tarnik::Exception*) { done.set_value(issued != nullptr); });
  if (!done.get_future().get()) {
    throw std::runtime_error("the asynchronous login failed");
  }
}

std::shared_ptr<const SsoClient::SamlToken> AcquireBound() {
  SsoClient::TokenSpec spec = ProbeService::Spec();
  spec.renewable = true;
  return holder->service->AcquireTokenByCertificate(spec);
}

/// Signs with the key that the parent has loaded and used.
void CallWithTheKey() {
  constexpr long kLifetimeSeconds = 600;
  for (const auto& token : {AcquireBound(), boundToken}) {
    if (holder->service->RenewToken(*token, kLifetimeSeconds)->ConfirmationType() !=
        SsoClient::HOLDER_OF_KEY) {
      throw std::runtime_error("the renewed token is not bound to the key");
    }
  }
}

/// Threads that are inside calls as long as this object exists.
class Callers {
 public:
  explicit Callers(
      int count, void (*call)() = [] { probe->Login(); }) {
    for (int i = 0; i < count; ++i) {
      threads_.emplace_back([this, call] {
        while (!isStopping_) {
          if (StatusOf(call) != EXIT_SUCCESS) {
            hasFailed_ = true;
          }
        }
      });
    }
  }

  bool Stop() {
    isStopping_ = true;
    for (std::thread& thread : threads_) {
      thread.join();
    }
    return !hasFailed_;
  }

 private:
  std::atomic<bool> isStopping_{false};
  std::atomic<bool> hasFailed_{false};
  std::vector<std::thread> threads_;
};

/// Forks children one after the other.
bool ForkRepeatedly(const std::function<void()>& body) {
  bool isGood = true;
  for (int i = 0; i < forks; ++i) {
    isGood = HasSucceeded(ForkChild(body)) && isGood;
  }
  return isGood;
}

/// The same while threads are inside calls.
bool ForkUnderLoad(const std::function<void()>& body) {
  probe->Login();
  Callers callers(threads);
  const bool isGood = ForkRepeatedly(body);
  return callers.Stop() && isGood;
}

bool CallInChildren() {
  return ForkUnderLoad([] { _exit(StatusOf(CallEverything)); });
}

bool ExitInChildren() {
  return ForkUnderLoad([] { std::exit(EXIT_SUCCESS); });
}

bool SignInChildren() {
  boundToken = AcquireBound();
  Callers callers(threads, [] { AcquireBound(); });
  const bool isGood = ForkRepeatedly([] { _exit(StatusOf(CallWithTheKey)); });
  return callers.Stop() && isGood;
}

bool CallAndExitInChildren() {
  return ForkUnderLoad([] { std::exit(StatusOf(CallEverything)); });
}

/// Children fork in turn, while threads of theirs are inside calls.
bool CallInGrandchildren() {
  probe->Login();
  bool isGood = true;
  for (int i = 0; i < forks; ++i) {
    isGood = HasSucceeded(ForkChild([] {
               auto* const callers = new Callers(std::min(threads, 4));
               const bool isGrandchildGood =
                   HasSucceeded(ForkChild([] { _exit(StatusOf(CallEverything)); }));
               _exit(callers->Stop() && isGrandchildGood ? EXIT_SUCCESS : kFailed);
             })) &&
             isGood;
  }
  return isGood;
}

/// A callback forks, and the child returns from it.
bool ReturnFromACallbackInTheChild() {
  bool isGood = true;
  for (int i = 0; i < forks; ++i) {
    std::promise<pid_t> forked;
    probe->service->AcquireTokenAsync("alice@EXAMPLE.COM", "secret", ProbeService::Spec(),
                                      [&forked](const auto&, const Tarnik::Exception*) {
                                        if (threads == 0) {
                                          Tarnik::Testing::AwaitIdleThreads();
                                        }
                                        const pid_t child = fork();
                                        if (child == 0) {
                                          alarm(kChildLimitSeconds);
                                          return;
                                        }
                                        forked.set_value(child);
                                      });
    isGood = HasSucceeded(forked.get_future().get()) && isGood;
  }
  return isGood && StatusOf(CallEverything) == EXIT_SUCCESS;
}

}  // namespace

int main(int argc, char** argv) {
  const std::map<std::string, bool (*)()> scenarios = {
      {"call", CallInChildren},
      {"sign", SignInChildren},
      {"exit", ExitInChildren},
      {"call-and-exit", CallAndExitInChildren},
      {"grandchildren", CallInGrandchildren},
      {"callback", ReturnFromACallbackInTheChild},
  };
  const auto scenario = scenarios.find(argc == 8 ? argv[1] : "");
  if (scenario == scenarios.end()) {
    return 2;
  }
  probe = new ProbeService(argv[2], argv[3], argv[4]);
  holder = new ProbeService(argv[2], argv[3], argv[4], argv[5]);
  forks = std::atoi(argv[6]);
  threads = std::atoi(argv[7]);
  return scenario->second() ? EXIT_SUCCESS : kFailed;
}
