#include <cstddef>
#include <string>
#include <typeinfo>

#include <sys/resource.h>

#include "chaos/campaigns.h"
#include "chaos/child.h"
#include "chaos/peer.h"
#include "chaos/process_state.h"
#include "chaos/reported_call.h"

namespace SsoClient::Testing {
namespace {

// The pool needs some descriptors, a connection and its look-up a few more.
constexpr std::size_t kMaxFree = 12;

/// During its lifetime the process can open only this many more descriptors.
class Shortage {
 public:
  Shortage(const Run& run, std::size_t free) {
    run.Require(getrlimit(RLIMIT_NOFILE, &before_) == 0, "getrlimit failed");
    const ProcessState now = ProcessState::Now();
    rlimit limit = before_;
    limit.rlim_cur = LimitWith(now, free);
    run.Require(setrlimit(RLIMIT_NOFILE, &limit) == 0, "setrlimit failed");
  }
  ~Shortage() { setrlimit(RLIMIT_NOFILE, &before_); }
  Shortage(const Shortage&) = delete;
  Shortage& operator=(const Shortage&) = delete;

 private:
  /// The limit is one more than the highest number that a new descriptor may have, and new
  /// descriptors take the lowest free numbers.
  static rlim_t LimitWith(const ProcessState& state, std::size_t free) {
    int next = 0;
    for (std::size_t found = 0;; ++next) {
      found += state.descriptors.count(next) == 0 ? 1 : 0;
      if (found > free) {
        return static_cast<rlim_t>(next);
      }
    }
  }

  rlimit before_ = {};
};

struct Case {
  Operation operation;
  bool isAsync;
  bool isPoolStarted;
  std::size_t free;
};

void RunScarce(const Run& run, const Case& scarce, const SecurityTokenService& service,
               const Arguments& arguments) {
  if (scarce.isPoolStarted) {
    RequireSuccess(run, scarce.operation,
                   Perform(run, scarce.operation, scarce.isAsync, service, arguments));
  }
  {
    const Shortage shortage(run, scarce.free);
    const Outcome outcome = Perform(run, scarce.operation, scarce.isAsync, service, arguments);
    if (outcome.IsSuccess()) {
      RequireSuccess(run, scarce.operation, outcome);
    } else {
      RequireFailure(run, outcome,
                     {typeid(CommunicationException), typeid(Tarnik::ResourceException)});
    }
    run.Require(scarce.free > 0 || !outcome.IsSuccess(), "a call needs no descriptor");
  }
  RequireSuccess(run, scarce.operation,
                 Perform(run, scarce.operation, scarce.isAsync, service, arguments));
  const ProcessState before = ProcessState::Settled();
  {
    const Shortage shortage(run, scarce.free);
    Perform(run, scarce.operation, scarce.isAsync, service, arguments);
  }
  RequireSuccess(run, scarce.operation,
                 Perform(run, scarce.operation, scarce.isAsync, service, arguments));
  RequireState(run, before, false);
}

}  // namespace

void RunDescriptors(Run& run) {
  Peer peer;
  run.Begin("undisturbed calls");
  peer.WarmUp(run);
  const ProcessState before = ProcessState::Settled();
  while (run.HasTime()) {
    const Case scarce{run.OneOf(kOperations), run.Below(2) == 1, run.Below(2) == 1,
                      run.Below(kMaxFree)};
    const std::size_t kind = run.Below(3);
    const auto& service = kind == 2 ? peer.ServiceByName() : peer.Service(kind == 1);
    run.Begin(CallName(scarce.operation, kind != 0) + (scarce.isAsync ? ", asynchronous" : "") +
              (kind == 2 ? ", with a look-up" : "") +
              (scarce.isPoolStarted ? "" : ", the first call") + ", " +
              std::to_string(scarce.free) + " free descriptors");
    const Arguments& arguments = peer.Arguments();
    // The child must not inherit locks of the STS.
    RequireState(run, before, false);
    RunInChild(run, [&] { RunScarce(run, scarce, service, arguments); });
  }
  run.Begin("the end");
  peer.AwaitIdle(run);
  RequireState(run, before, run.IsLong());
}

}  // namespace SsoClient::Testing
