// Forks while token sources are at work:
// fork_probe URL SILENT_URL CA_FILE SIGNING_CERTIFICATE_FILE FORKS THREADS
// The exit status is 0 when all calls of all processes ended as they should.
#include <atomic>
#include <chrono>
#include <cstdlib>
#include <future>
#include <iostream>
#include <memory>
#include <stdexcept>
#include <string>
#include <thread>
#include <vector>

#include <sys/wait.h>
#include <unistd.h>

#include "end_to_end/awaiting_listener.h"
#include "end_to_end/probe_config.h"
#include "support/forked_child.h"

namespace {

using namespace std::chrono_literals;
using SsoClient::Access::CallContext;
using SsoClient::Access::TokenSource;
using SsoClient::Access::TokenSourceConfig;
using SsoClient::Access::Testing::AwaitingListener;
using SsoClient::Access::Testing::ProbeSpec;

constexpr int kFailed = 3;
constexpr int kSpecs = 4;

TokenSourceConfig config;
// Its refreshes are under way all the time.
std::shared_ptr<TokenSource> busy;
// Its requests are not answered.
std::shared_ptr<TokenSource> silent;
std::atomic<bool> isStopping{false};

void Require(bool condition, const char* what) {
  if (!condition) {
    throw std::runtime_error(what);
  }
}

void CallAsync(TokenSource& source) {
  std::promise<bool> done;
  source.GetTokenAsync(ProbeSpec(kSpecs), {}, [&done](const auto& token, const auto*) {
    done.set_value(token != nullptr);
  });
  Require(done.get_future().get(), "the asynchronous call failed");
}

void CallEverything() {
  Require(busy->TryGetToken(ProbeSpec(0)) == nullptr, "the cache of the child is not empty");
  Require(busy->Metrics().callersWaiting == 0, "callers of the parent wait in the child");
  const auto inherited = busy->GetToken(ProbeSpec(0));
  Require(busy->TryGetToken(ProbeSpec(0)) == inherited, "the token is not in the cache");
  CallAsync(*busy);
  const auto own = SsoClient::Access::CreateTokenSource(config);
  Require(own->GetToken(ProbeSpec(0)) != inherited, "two sources share a token");
  CallAsync(*own);
  try {
    silent->GetToken(ProbeSpec(0), CallContext::Within(50ms));
    throw std::runtime_error("the silent service has answered");
  } catch (const SsoClient::CommunicationException&) {
  }
  Require(silent->Stop(30s), "a function of the parent runs in the child");
  busy.reset();
}

int Status(void (*calls)()) {
  try {
    calls();
    return EXIT_SUCCESS;
  } catch (const std::exception& failure) {
    std::cerr << getpid() << ": " << failure.what() << '\n';
    return kFailed;
  }
}

void AskUntilStopped(int number) {
  while (!isStopping) {
    busy->GetToken(ProbeSpec(number % kSpecs));
    std::this_thread::yield();
  }
}

bool ForkChildren(int forks, bool isIdle) {
  for (int i = 0; i < forks; ++i) {
    if (isIdle) {
      Tarnik::Testing::AwaitIdleThreads();
    }
    const pid_t child = Tarnik::Testing::ForkWithLimit();
    if (child == 0) {
      const int status = Status(&CallEverything);
      // Half of the children run the exit handlers.
      i % 2 == 0 ? _exit(status) : std::exit(status);
    }
    if (!Tarnik::Testing::HasSucceeded(child)) {
      std::cerr << "child " << child << " failed\n";
      return false;
    }
  }
  return true;
}

}  // namespace

int main(int argc, char** argv) {
  if (argc != 7) {
    return 2;
  }
  const int threads = std::atoi(argv[6]);
  config = SsoClient::Access::Testing::ProbeConfig(argv[1], argv[3], argv[4]);
  TokenSourceConfig silentConfig = config;
  const auto listener = std::make_shared<AwaitingListener>();
  silentConfig.endpoints = {{argv[2], ""}};
  silentConfig.keepFresh = {ProbeSpec(1), ProbeSpec(2)};
  silentConfig.listener = listener;
  silent = SsoClient::Access::CreateTokenSource(silentConfig);
  TokenSourceConfig busyConfig = config;
  if (threads > 0) {
    busyConfig.refresh.fraction = 0.0001;
    busyConfig.refresh.jitter = 0;
  }
  busy = SsoClient::Access::CreateTokenSource(busyConfig);
  const auto token = busy->GetToken(ProbeSpec(0));
  listener->Await([](const auto& seen) { return !seen.begun.empty(); });
  std::vector<std::thread> callers;
  for (int i = 0; i < threads; ++i) {
    callers.emplace_back(&AskUntilStopped, i);
  }
  const bool isGood = ForkChildren(std::atoi(argv[5]), threads == 0);
  isStopping = true;
  for (std::thread& caller : callers) {
    caller.join();
  }
  const bool isParentGood = busy->GetToken(ProbeSpec(0)) != nullptr;
  return isGood && isParentGood ? EXIT_SUCCESS : kFailed;
}
