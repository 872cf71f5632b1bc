#include "login_gate.h"

#include <algorithm>
#include <utility>

namespace SsoClient::Access {

namespace {

constexpr std::chrono::seconds kAcceptedFor{10};

std::vector<RequestPtr> TakeAll(std::deque<RequestPtr>& queue) {
  std::vector<RequestPtr> all(queue.begin(), queue.end());
  queue.clear();
  return all;
}

}  // namespace

Failure LoginGate::RefusalOf(Tag tag, Instant::Steady now) const {
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

std::vector<RequestPtr> LoginGate::Leave(Tag tag, const RequestPtr& request, LoginVerdict verdict,
                                         const Failure& refusal, Instant::Steady now) {
  State& state = states_[tag];
  switch (verdict) {
    case LoginVerdict::kAccepted:
      state.acceptedUntil = now + kAcceptedFor;
      state.refusedUntil = Instant::Steady::min();
      break;
    case LoginVerdict::kRefused:
      state.acceptedUntil = Instant::Steady::min();
      state.refusedUntil = now + refusalMemory_;
      state.refusal = refusal;
      break;
    case LoginVerdict::kUndecided:
      return state.holder == request ? Withdraw(request) : std::vector<RequestPtr>();
  }
  if (state.holder == request) {
    state.holder = nullptr;
  }
  // Another holder is one whose turn has come just now; it finds the same verdict.
  return TakeAll(state.queue);
}

std::vector<RequestPtr> LoginGate::Withdraw(const RequestPtr& request) {
  std::vector<RequestPtr> next;
  for (auto& [tag, state] : states_) {
    std::erase(state.queue, request);
    if (state.holder != request) {
      continue;
    }
    state.holder = nullptr;
    if (!state.queue.empty()) {
      state.holder = state.queue.front();
      state.queue.pop_front();
      next.push_back(state.holder);
    }
  }
  return next;
}

void LoginGate::DropIdle(Instant::Steady now) {
  std::erase_if(states_, [now](const auto& item) {
    const State& state = item.second;
    return state.holder == nullptr && state.queue.empty() && now >= state.acceptedUntil &&
           now >= state.refusedUntil;
  });
}

}  // namespace SsoClient::Access
