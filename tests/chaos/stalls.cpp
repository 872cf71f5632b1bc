#include <chrono>
#include <cstddef>
#include <future>
#include <string>
#include <thread>
#include <vector>

#include "chaos/campaigns.h"
#include "chaos/peer.h"
#include "chaos/process_state.h"
#include "support/dead_listener.h"

namespace SsoClient::Testing {
namespace {

using namespace std::chrono_literals;
using Clock = Tarnik::Http::CallLimit::Clock;

/// How much later than its limit a call may end on a busy machine.
constexpr auto kDelay = 10s;

struct Stage {
  const char* name;
  /// None for a connect that nobody answers.
  DevSts::Stall stall;
  bool isOnlyTls;
  /// What the message says that an exchange in this stage waits for. A long request may still be in
  /// the way to a service that does not read it.
  std::vector<std::string> awaited;
};

const Stage kStages[] = {
    {"the connect", DevSts::Stall::None, false, {"the connection"}},
    {"the handshake", DevSts::Stall::BeforeTlsHandshake, true, {"the TLS handshake"}},
    {"the request",
     DevSts::Stall::BeforeRequest,
     false,
     {"the answer", "the request to be sent", "the connection", "the TLS handshake"}},
    {"the answer", DevSts::Stall::BeforeAnswer, false, {"the answer"}},
    {"the head of the answer", DevSts::Stall::AfterHeaders, false, {"the answer"}},
    {"the body of the answer", DevSts::Stall::InMidBody, false, {"the answer"}},
};

bool Contains(const std::string& text, const std::string& part) {
  return text.find(part) != std::string::npos;
}

/// A call ends by its limit in any stage that it has reached until then: on a busy machine it may
/// not have reached the stage of the stall.
void RequireEndedByLimit(const Run& run, const Outcome& outcome, bool isCancelled) {
  RequireFailure(run, outcome, {typeid(CommunicationException)});
  run.Require(Contains(outcome.message, isCancelled ? "was cancelled" : "deadline has passed"),
              "the message is: " + outcome.message);
}

bool NamesStage(const Outcome& outcome, const Stage& stage) {
  for (const std::string& awaited : stage.awaited) {
    if (Contains(outcome.message, "waiting for " + awaited)) {
      return true;
    }
  }
  return false;
}

struct Limits {
  std::chrono::microseconds time;
  bool isCancelled;
};

/// Every operation at the same time, one of them synchronous.
std::vector<Outcome> CallEverything(Operation synchronous, const SecurityTokenService& service,
                                    const Arguments& arguments) {
  std::vector<std::future<Outcome>> calls;
  for (const Operation operation : kOperations) {
    calls.push_back(CallAsync(operation, service, arguments));
  }
  std::vector<Outcome> outcomes = {CallNow(synchronous, service, arguments)};
  for (auto& call : calls) {
    outcomes.push_back(call.get());
  }
  return outcomes;
}

void RunStalledCalls(Run& run, Peer& peer, const Stage& stage, bool hasTls, int port,
                     const Limits& limits) {
  const Arguments& arguments = peer.Arguments();
  DevSts::Misbehavior silent;
  silent.stall = stage.stall;
  peer.Sts().SetMisbehavior(silent);
  const auto end = Clock::now() + limits.time;
  const auto limit =
      Tarnik::Http::CreateCallLimit(limits.isCancelled ? Clock::time_point::max() : end);
  const auto service = peer.ServiceWithin(*limit, hasTls, port);
  std::thread canceller;
  if (limits.isCancelled) {
    canceller = std::thread([limit, end] {
      std::this_thread::sleep_until(end);
      limit->Cancel();
    });
  }
  const auto outcomes = CallEverything(run.OneOf(kOperations), *service, arguments);
  const auto now = Clock::now();
  if (canceller.joinable()) {
    canceller.join();
  }
  run.Require(now >= end - 1ms, "the calls ended before their limit");
  run.Require(now < end + kDelay, "the calls ended long after their limit");
  bool isStageNamed = limits.isCancelled;
  for (const Outcome& outcome : outcomes) {
    RequireEndedByLimit(run, outcome, limits.isCancelled);
    isStageNamed = isStageNamed || NamesStage(outcome, stage);
  }
  run.Require(isStageNamed || limits.time < 100ms,
              "no message names the stage: " + outcomes.back().message);
}

}  // namespace

void RunStalls(Run& run) {
  Peer peer;
  const Tarnik::Testing::DeadListener dead;
  run.Begin("undisturbed calls");
  peer.WarmUp(run);
  const ProcessState before = ProcessState::Settled();
  while (run.HasTime()) {
    const Stage& stage = run.OneOf(kStages);
    const bool hasTls = stage.isOnlyTls || run.Below(2) == 1;
    const Limits limits{run.TimeBelow(300ms), run.Below(3) == 0};
    const int port = stage.stall == DevSts::Stall::None ? dead.Port()
                     : hasTls                           ? peer.Sts().HttpsPort()
                                                        : peer.Sts().HttpPort();
    run.Begin(std::string(hasTls ? "TLS" : "TCP") + ", silent before " + stage.name +
              (limits.isCancelled ? ", cancelled" : "") + " after " +
              std::to_string(limits.time.count()) + " us");
    RunStalledCalls(run, peer, stage, hasTls, port, limits);
    peer.Sts().ClearMisbehavior();
    const Operation operation = run.OneOf(kOperations);
    RequireSuccess(run, operation, CallNow(operation, peer.Service(hasTls), peer.Arguments()));
  }
  run.Begin("the end");
  peer.AwaitIdle(run);
  RequireState(run, before, run.IsLong());
}

}  // namespace SsoClient::Testing
