#include <atomic>
#include <chrono>
#include <string>
#include <thread>
#include <typeinfo>

#include "chaos/campaigns.h"
#include "chaos/child.h"
#include "chaos/clock_jump.h"
#include "chaos/peer.h"
#include "chaos/process_state.h"
#include "chaos/reported_call.h"

namespace SsoClient::Testing {
namespace {

using namespace std::chrono_literals;
using Clock = Tarnik::Http::CallLimit::Clock;

constexpr auto kCallLimit = 20s;
// The STS accepts clocks that differ by a minute. Half of it leaves room for a busy machine.
constexpr auto kAccepted = 30s;

struct Jump {
  std::chrono::seconds offset;
  /// Jumps at this time after the beginning of the call, or before the call if it is zero.
  std::chrono::microseconds moment;
};

/// Small and large offsets alike, in both directions.
std::chrono::seconds ChooseOffset(Run& run) {
  constexpr std::chrono::seconds kSizes[] = {kAccepted, 10min, 24h, 24h * 365 * 20};
  const auto size = run.OneOf(kSizes).count();
  const auto offset = static_cast<long>(run.Below(static_cast<std::size_t>(2 * size))) - size;
  return std::chrono::seconds(offset);
}

void RequireEnding(const Run& run, Operation operation, const Outcome& outcome,
                   std::chrono::seconds offset) {
  if (outcome.IsSuccess()) {
    RequireSuccess(run, operation, outcome);
    return;
  }
  run.Require(std::chrono::abs(offset) > kAccepted,
              "a small jump failed the call: " + outcome.message);
  RequireFailure(
      run, outcome,
      {typeid(CommunicationException), typeid(InvalidCredentialsException), typeid(ParseException),
       typeid(SsoException), typeid(Tarnik::InvalidStateException)});
}

/// A call during which the clock jumps.
void CallWithJump(const Run& run, Operation operation, bool isAsync, const Jump& jump,
                  const SecurityTokenService& service, const Arguments& arguments) {
  const auto begin = Clock::now();
  std::thread jumper([&] {
    std::this_thread::sleep_until(begin + jump.moment);
    SetClockOffset(jump.offset);
  });
  if (jump.moment == 0us) {
    jumper.join();
  }
  RequireEnding(run, operation, Perform(run, operation, isAsync, service, arguments), jump.offset);
  if (jumper.joinable()) {
    jumper.join();
  }
  run.Require(Clock::now() - begin < kCallLimit, "the call took too long");
  SetClockOffset(0s);
  RequireSuccess(run, operation, Perform(run, operation, isAsync, service, arguments));
}

/// A jump neither ends a waiting call nor prolongs it.
void WaitWithJump(const Run& run, Operation operation, bool isAsync, const Jump& jump,
                  const SecurityTokenService& service, Clock::time_point end,
                  const Arguments& arguments) {
  std::thread jumper([&] {
    std::this_thread::sleep_for(jump.moment);
    SetClockOffset(jump.offset);
  });
  const Outcome outcome = Perform(run, operation, isAsync, service, arguments);
  const auto now = Clock::now();
  jumper.join();
  RequireFailure(run, outcome,
                 {typeid(CommunicationException), typeid(Tarnik::InvalidStateException)});
  // The certificate of a key is not valid any more after some jumps, and nothing is sent.
  run.Require(now >= end - 1ms || outcome.message.find("deadline") == std::string::npos,
              "the call ended before its limit: " + outcome.message);
  run.Require(now < end + kCallLimit, "the call ended long after its limit");
}

}  // namespace

void RunClock(Run& run) {
  Peer peer;
  run.Begin("undisturbed calls");
  peer.WarmUp(run);
  const ProcessState before = ProcessState::Settled();
  while (run.HasTime()) {
    const Operation operation = run.OneOf(kOperations);
    const bool hasTls = run.Below(2) == 1;
    const bool isAsync = run.Below(2) == 1;
    const bool isSilent = run.Below(4) == 0;
    const Jump jump{ChooseOffset(run), run.Below(2) == 0 ? 0us : run.TimeBelow(10ms)};
    run.Begin(CallName(operation, hasTls) + (isAsync ? ", asynchronous" : "") +
              (isSilent ? ", of a silent STS" : "") + ", the clock jumps by " +
              std::to_string(jump.offset.count()) + " s after " +
              std::to_string(jump.moment.count()) + " us");
    const Arguments& arguments = peer.Arguments();
    // The child must not inherit locks of the STS.
    RequireState(run, before, false);
    if (!isSilent) {
      RunInChild(run, [&] {
        CallWithJump(run, operation, isAsync, jump, peer.Service(hasTls), arguments);
      });
      continue;
    }
    DevSts::Misbehavior silent;
    silent.stall = DevSts::Stall::BeforeAnswer;
    peer.Sts().SetMisbehavior(silent);
    RunInChild(run, [&] {
      const auto end = Clock::now() + 100ms;
      const auto limit = Tarnik::Http::CreateCallLimit(end);
      const int port = hasTls ? peer.Sts().HttpsPort() : peer.Sts().HttpPort();
      const auto service = peer.ServiceWithin(*limit, hasTls, port);
      WaitWithJump(run, operation, isAsync, jump, *service, end, arguments);
    });
    peer.Sts().ClearMisbehavior();
  }
  run.Begin("the end");
  peer.AwaitIdle(run);
  RequireState(run, before, run.IsLong());
}

}  // namespace SsoClient::Testing
