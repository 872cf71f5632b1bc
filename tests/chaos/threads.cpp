#include <cstddef>
#include <string>
#include <typeinfo>

#include "chaos/campaigns.h"
#include "chaos/child.h"
#include "chaos/peer.h"
#include "chaos/process_state.h"
#include "chaos/reported_call.h"
#include "faults/fault_injection.h"

namespace SsoClient::Testing {
namespace {

// A child starts two I/O threads, a worker for each asynchronous call and a look-up thread.
constexpr std::size_t kMaxThread = 6;

struct Case {
  Operation operation;
  std::size_t thread;
  bool isAsync;
  bool needsLookUp;
};

/// In a child, which has no threads yet. Afterwards calls succeed, and no thread or descriptor
/// remains.
void RunShortage(const Run& run, const Case& shortage, const SecurityTokenService& service,
                 const Arguments& arguments) {
  {
    const InjectedFault fault(FaultKind::kThreadStart, shortage.thread);
    const Outcome outcome = Perform(run, shortage.operation, shortage.isAsync, service, arguments);
    if (!fault.HasHappened() || outcome.IsSuccess()) {
      RequireSuccess(run, shortage.operation, outcome);
    } else {
      RequireFailure(run, outcome,
                     {typeid(CommunicationException), typeid(Tarnik::ResourceException)});
    }
  }
  RequireSuccess(run, shortage.operation,
                 Perform(run, shortage.operation, shortage.isAsync, service, arguments));
  const ProcessState before = ProcessState::Settled();
  RequireSuccess(run, shortage.operation,
                 Perform(run, shortage.operation, shortage.isAsync, service, arguments));
  RequireState(run, before, false);
}

}  // namespace

void RunThreads(Run& run) {
  Peer peer;
  run.Begin("undisturbed calls");
  peer.WarmUp(run);
  const ProcessState before = ProcessState::Settled();
  while (run.HasTime()) {
    const Case shortage{run.OneOf(kOperations), run.Below(kMaxThread), run.Below(2) == 1,
                        run.Below(2) == 1};
    const bool hasTls = run.Below(2) == 1;
    run.Begin(CallName(shortage.operation, hasTls || shortage.needsLookUp) +
              (shortage.isAsync ? ", asynchronous" : "") +
              (shortage.needsLookUp ? ", with a look-up" : "") + ", thread " +
              std::to_string(shortage.thread) + " does not start");
    const Arguments& arguments = peer.Arguments();
    const auto& service = shortage.needsLookUp ? peer.ServiceByName() : peer.Service(hasTls);
    // The child must not inherit locks of the STS.
    RequireState(run, before, false);
    RunInChild(run, [&] { RunShortage(run, shortage, service, arguments); });
  }
  run.Begin("the end");
  peer.AwaitIdle(run);
  RequireState(run, before, run.IsLong());
}

}  // namespace SsoClient::Testing
