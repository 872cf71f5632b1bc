#include "login_gate.h"

#include <algorithm>

#include "backoff.h"

namespace SsoClient::Access {

namespace {

constexpr std::chrono::seconds kAcceptedFor{10};

}  // namespace

Failure LoginGate::RefusalOf(Tag tag, Instant::Steady now) const noexcept {
  const auto found = states_.find(tag);
  return found != states_.end() && now < found->second.refusedUntil ? found->second.refusal
                                                                    : Failure();
}

Instant::Steady LoginGate::ClosedUntil(Tag tag) const noexcept {
  const auto found = states_.find(tag);
  return found == states_.end() ? Instant::Steady::min() : found->second.closedUntil;
}

bool LoginGate::IsAccepted(Tag tag, Instant::Steady now) const noexcept {
  const auto found = states_.find(tag);
  return found != states_.end() && now < found->second.acceptedUntil;
}

bool LoginGate::Enter(Tag tag, const RequestPtr& request, Instant::Steady now) {
  DropIdle(now);
  State& state = states_[tag];
  if (IsOpen(state, now) || IsHolder(state, request)) {
    return true;
  }
  if (RequestPtr* const place = FreePlace(state, now)) {
    *place = request;
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

RequestPtr* LoginGate::FreePlace(State& state, Instant::Steady now) noexcept {
  if (IsHeld(state) && now >= state.acceptedUntil) {
    return nullptr;
  }
  const auto place = std::find(state.holders.begin(), state.holders.end(), nullptr);
  return place == state.holders.end() ? nullptr : &*place;
}

bool LoginGate::IsHeld(const State& state) noexcept {
  return std::any_of(state.holders.begin(), state.holders.end(),
                     [](const RequestPtr& holder) { return holder != nullptr; });
}

bool LoginGate::IsHolder(const State& state, const RequestPtr& request) noexcept {
  return std::find(state.holders.begin(), state.holders.end(), request) != state.holders.end();
}

bool LoginGate::Release(State& state, const RequestPtr& request) noexcept {
  const auto found = std::find(state.holders.begin(), state.holders.end(), request);
  if (found == state.holders.end()) {
    return false;
  }
  *found = nullptr;
  return true;
}

RequestPtr LoginGate::TakeFirst(State& state) noexcept {
  RequestPtr first = std::move(state.queue.front());
  state.queue.pop_front();
  return first;
}

LoginGate::State* LoginGate::End(Tag tag, const LoginOutcome& outcome,
                                 Instant::Steady now) noexcept {
  const auto found = states_.find(tag);
  if (found == states_.end()) {
    return nullptr;
  }
  State& state = found->second;
  --state.underWay;
  switch (outcome.verdict) {
    case LoginVerdict::kAccepted:
      state.acceptedUntil = now + kAcceptedFor;
      state.refusedUntil = Instant::Steady::min();
      state.closedUntil = Instant::Steady::min();
      state.unknown = 0;
      break;
    case LoginVerdict::kRefused:
      state.acceptedUntil = Instant::Steady::min();
      state.refusedUntil = now + config_.refusalMemory;
      state.refusal = outcome.refusal;
      state.unknown = 0;
      break;
    case LoginVerdict::kUnknown:
      Close(state, outcome.draw, now);
      break;
    case LoginVerdict::kUndecided:
      break;
  }
  return &state;
}

// The next login with a password that was accepted must show whether it still is.
void LoginGate::Close(State& state, double draw, Instant::Steady now) const noexcept {
  if (now < state.acceptedUntil) {
    state.acceptedUntil = Instant::Steady::min();
    return;
  }
  state.closedUntil = now + Backoff(config_, ++state.unknown, std::chrono::milliseconds(0), draw);
}

// Not the state of a login under way, which may be refused. Unknown verdicts count for a while
// longer, so that the pauses grow.
void LoginGate::DropIdle(Instant::Steady now) {
  std::erase_if(states_, [this, now](const auto& item) {
    const State& state = item.second;
    const bool isForgotten =
        state.unknown == 0 || now - state.closedUntil >= 2 * config_.longestDelay;
    return state.underWay == 0 && state.queue.empty() && !IsHeld(state) && isForgotten &&
           now >= state.acceptedUntil && now >= state.refusedUntil;
  });
}

}  // namespace SsoClient::Access
