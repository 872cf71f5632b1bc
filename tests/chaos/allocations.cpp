#include <chrono>
#include <cstddef>
#include <functional>
#include <future>
#include <new>
#include <optional>
#include <string>
#include <thread>

#include <pthread.h>

#include "chaos/campaigns.h"
#include "chaos/peer.h"
#include "chaos/process_state.h"
#include "chaos/reported_call.h"
#include "faults/fault_injection.h"

namespace SsoClient::Testing {
namespace {

using namespace std::chrono_literals;

constexpr auto kCallLimit = 20s;
// An exchange makes a few thousand allocations.
constexpr std::size_t kMaxIndexBits = 12;

struct Threads {
  FaultKind kind;
  const char* name;
};

constexpr Threads kThreads[] = {
    {FaultKind::kIoThreadAllocation, "an I/O thread"},
    {FaultKind::kWorkerAllocation, "a worker"},
    {FaultKind::kCallerAllocation, "the caller's thread"},
};

struct Call {
  Operation operation;
  bool hasTls;
  bool isAsync;
  Threads threads;
  /// Of the allocation that fails.
  std::size_t index;
};

/// What happened; without an outcome, the call threw `std::bad_alloc`.
struct Ending {
  std::optional<Outcome> outcome;
  bool hasFaultHappened = false;
};

void PerformAsync(const Run& run, const Call& call, const SecurityTokenService& service,
                  const Arguments& arguments, ReportedCall& reported, Ending& ending) {
  try {
    reported.Start(call.operation, service, arguments);
  } catch (const std::bad_alloc&) {
    run.Require(reported.Callbacks() == 0, "the call threw and reported to its callback");
    return;
  }
  ending.outcome = reported.Wait();
  run.Require(reported.Callbacks() == 1, "the callback ran more than once");
}

/// Performs the call on a thread that the injection knows by its name.
Ending PerformWithFault(const Run& run, Peer& peer, const Call& call) {
  const Arguments& arguments = peer.Arguments();
  const SecurityTokenService& service = peer.Service(call.hasTls);
  Ending ending;
  std::thread caller([&] {
    pthread_setname_np(pthread_self(), kCallerThreadName);
    ReportedCall reported(&InjectedFault::Disarm);
    const InjectedFault fault(call.threads.kind, call.index);
    if (call.isAsync) {
      PerformAsync(run, call, service, arguments, reported, ending);
    } else {
      try {
        ending.outcome = CallNow(call.operation, service, arguments);
      } catch (const std::bad_alloc&) {
      }
    }
    InjectedFault::Disarm();
    ending.hasFaultHappened = fault.HasHappened();
  });
  caller.join();
  return ending;
}

void RequireEnding(const Run& run, const Call& call, const Ending& ending) {
  if (!ending.outcome) {
    run.Require(ending.hasFaultHappened && call.threads.kind == FaultKind::kCallerAllocation,
                "the call threw std::bad_alloc");
    return;
  }
  // A call may do without some allocations, for example those of a cache.
  if (!ending.hasFaultHappened || ending.outcome->IsSuccess()) {
    RequireSuccess(run, call.operation, *ending.outcome);
    return;
  }
  RequireFailure(
      run, *ending.outcome,
      {typeid(CommunicationException), typeid(Tarnik::ResourceException),
       typeid(Tarnik::Crypto::CryptoException), typeid(Tarnik::Xml::Security::XmlSecurityException),
       typeid(InvalidSignatureException)});
  // A good token is not said to be bad.
  run.Require(ending.outcome->message.find("tampered") == std::string::npos,
              "the message is: " + ending.outcome->message);
}

Call ChooseCall(Run& run) {
  const Threads& threads = run.OneOf(kThreads);
  Call call{run.OneOf(kOperations), run.Below(2) == 1, run.Below(2) == 1, threads,
            run.Below(std::size_t{1} << run.Below(kMaxIndexBits + 1))};
  // A synchronous call needs no worker.
  call.isAsync = call.isAsync || threads.kind == FaultKind::kWorkerAllocation;
  return call;
}

}  // namespace

void RunAllocations(Run& run) {
  Peer peer;
  run.Begin("undisturbed calls");
  peer.WarmUp(run);
  const ProcessState before = ProcessState::Settled();
  std::size_t faults = 0;
  while (run.HasTime()) {
    const Call call = ChooseCall(run);
    run.Begin(CallName(call.operation, call.hasTls) + (call.isAsync ? ", asynchronous" : "") +
              ", allocation " + std::to_string(call.index) + " of " + call.threads.name);
    const auto begin = std::chrono::steady_clock::now();
    const Ending ending = PerformWithFault(run, peer, call);
    faults += ending.hasFaultHappened ? 1 : 0;
    RequireEnding(run, call, ending);
    RequireSuccess(run, call.operation,
                   CallNow(call.operation, peer.Service(call.hasTls), peer.Arguments()));
    run.Require(std::chrono::steady_clock::now() - begin < kCallLimit, "the calls took too long");
  }
  run.Begin("the end");
  run.Require(faults > 0 || run.Cases() < 50, "no fault happened");
  peer.AwaitIdle(run);
  RequireState(run, before, run.IsLong());
}

}  // namespace SsoClient::Testing
