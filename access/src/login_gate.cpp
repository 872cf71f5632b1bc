#include "login_gate.h"

namespace SsoClient::Access {

namespace {

constexpr std::chrono::seconds kAcceptedFor{10};

}  // namespace

Failure LoginGate::RefusalOf(Tag tag, Instant::Steady now) const noexcept {
  const auto found = states_.find(tag);
  return found != states_.end() && now < found->second.refusedUntil ? found->second.refusal
                                                                    : Failure();
}

bool LoginGate::Enter(Tag tag, const RequestPtr& request, Instant::Steady now) {
  DropIdle(now);
  State& state = states_[tag];
  if (now < state.acceptedUntil || state.holder == request) {
    return true;
  }
  if (state.holder == nullptr) {
    state.holder = request;
    return true;
  }
  state.queue.push_back(request);
  return false;
}

void LoginGate::Begin(Tag tag) noexcept {
  if (const auto found = states_.find(tag); found != states_.end()) {
    ++found->second.underWay;
  }
}

LoginGate::State* LoginGate::End(Tag tag, LoginVerdict verdict, const Failure& refusal,
                                 Instant::Steady now) noexcept {
  const auto found = states_.find(tag);
  if (found == states_.end()) {
    return nullptr;
  }
  State& state = found->second;
  --state.underWay;
  if (verdict == LoginVerdict::kAccepted) {
    state.acceptedUntil = now + kAcceptedFor;
    state.refusedUntil = Instant::Steady::min();
  } else if (verdict == LoginVerdict::kRefused) {
    state.acceptedUntil = Instant::Steady::min();
    state.refusedUntil = now + refusalMemory_;
    state.refusal = refusal;
  }
  return &state;
}

// Not the state of a login under way, which may be refused.
void LoginGate::DropIdle(Instant::Steady now) {
  std::erase_if(states_, [now](const auto& item) {
    const State& state = item.second;
    return state.underWay == 0 && state.holder == nullptr && state.queue.empty() &&
           now >= state.acceptedUntil && now >= state.refusedUntil;
  });
}

}  // namespace SsoClient::Access
