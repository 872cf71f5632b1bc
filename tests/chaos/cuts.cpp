#include <chrono>
#include <cstddef>
#include <numeric>
#include <vector>

#include "chaos/campaigns.h"
#include "chaos/peer.h"
#include "chaos/process_state.h"

namespace SsoClient::Testing {
namespace {

using namespace std::chrono_literals;

constexpr auto kCallLimit = 20s;

struct Ending {
  bool hasTls;
  DevSts::CutStyle style;
  const char* name;
};

constexpr Ending kEndings[] = {
    {false, DevSts::CutStyle::Orderly, "FIN"},
    {false, DevSts::CutStyle::Reset, "RST"},
    {true, DevSts::CutStyle::Orderly, "close_notify"},
    {true, DevSts::CutStyle::WithoutNotice, "FIN without close_notify"},
    {true, DevSts::CutStyle::Reset, "RST"},
};

void CutAt(Peer& peer, std::size_t octets, DevSts::CutStyle style) {
  DevSts::Misbehavior cut;
  cut.cutOff = DevSts::CutOff{octets, style};
  peer.Sts().SetMisbehavior(cut);
}

/// The length of the STS's answer to an operation: the least number of octets with which it
/// succeeds.
std::size_t AnswerLength(Peer& peer, Operation operation) {
  std::size_t tooFew = 0;
  std::size_t enough = 1 << 20;
  while (enough - tooFew > 1) {
    const std::size_t middle = std::midpoint(tooFew, enough);
    const Arguments& arguments = peer.Arguments();
    CutAt(peer, middle, DevSts::CutStyle::Orderly);
    const bool hasSucceeded = CallNow(operation, peer.Service(false), arguments).IsSuccess();
    (hasSucceeded ? enough : tooFew) = middle;
  }
  return enough;
}

/// All cases, of which the n-th is chosen without a list of them.
class Cases {
 public:
  explicit Cases(Peer& peer) {
    for (const Operation operation : kOperations) {
      lengths_.push_back(AnswerLength(peer, operation));
      count_ += lengths_.back() * std::size(kEndings);
    }
  }

  struct Case {
    Operation operation;
    Ending ending;
    std::size_t octets;
  };
  std::size_t Count() const { return count_; }
  Case At(std::size_t index) const {
    std::size_t operation = 0;
    while (index >= lengths_[operation] * std::size(kEndings)) {
      index -= lengths_[operation++] * std::size(kEndings);
    }
    return {kOperations[operation], kEndings[index % std::size(kEndings)],
            index / std::size(kEndings)};
  }

 private:
  std::vector<std::size_t> lengths_;
  std::size_t count_ = 0;
};

/// A synchronous and an asynchronous call at the same time; each answer is cut.
void CutBoth(const Run& run, Peer& peer, const Cases::Case& cut) {
  const Arguments& arguments = peer.Arguments();
  const SecurityTokenService& service = peer.Service(cut.ending.hasTls);
  CutAt(peer, cut.octets, cut.ending.style);
  const auto begin = std::chrono::steady_clock::now();
  auto later = CallAsync(cut.operation, service, arguments);
  RequireFailure(run, CallNow(cut.operation, service, arguments), {typeid(CommunicationException)});
  RequireFailure(run, later.get(), {typeid(CommunicationException)});
  run.Require(std::chrono::steady_clock::now() - begin < kCallLimit, "the calls took too long");
}

}  // namespace

/// Visits each case once, in an order that depends on the seed.
void RunCuts(Run& run) {
  Peer peer;
  run.Begin("undisturbed calls");
  peer.WarmUp(run);
  const Cases cases(peer);
  peer.AwaitIdle(run);
  const ProcessState before = ProcessState::Settled();

  std::size_t step = cases.Count() / 3 + run.Below(cases.Count() / 3);
  while (std::gcd(step, cases.Count()) != 1) {
    ++step;
  }
  std::size_t index = run.Below(cases.Count());
  for (std::size_t i = 0; i < cases.Count() && run.HasTime(); ++i) {
    const Cases::Case cut = cases.At(index);
    run.Begin(CallName(cut.operation, cut.ending.hasTls) + " cut by " + cut.ending.name +
              " after " + std::to_string(cut.octets) + " octets");
    CutBoth(run, peer, cut);
    index = (index + step) % cases.Count();
  }

  run.Begin("undisturbed calls after " + std::to_string(run.Cases()) + " of " +
            std::to_string(cases.Count()) + " cases");
  peer.Sts().ClearMisbehavior();
  peer.WarmUp(run);
  RequireState(run, before, run.IsLong());
}

}  // namespace SsoClient::Testing
