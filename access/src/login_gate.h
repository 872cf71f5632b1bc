#ifndef SSOCLIENT_ACCESS_LOGIN_GATE_H
#define SSOCLIENT_ACCESS_LOGIN_GATE_H

#include <chrono>
#include <deque>
#include <map>
#include <memory>
#include <utility>

#include "failure.h"
#include "instant.h"
#include "secret.h"

namespace SsoClient::Access {

struct Request;
using RequestPtr = std::shared_ptr<Request>;

enum class LoginVerdict { kAccepted, kRefused, kUndecided };

/// Protects the account: until a login with a secret has been accepted, only one request at a time
/// has the gate of that secret; the others queue. A secret counts as accepted for some seconds, so
/// that a burst of logins runs in parallel but a password that was changed at the service is
/// refused once. A refused secret is remembered, by its tag, and nobody has its gate. Requests are
/// only compared here. Only `Enter` needs memory. Not thread-safe.
class LoginGate {
 public:
  using Tag = SecretTagger::Tag;

  explicit LoginGate(std::chrono::seconds refusalMemory) : refusalMemory_(refusalMemory) {}

  /// The refusal that is remembered for the secret; not set without one.
  Failure RefusalOf(Tag tag, Instant::Steady now) const noexcept;
  /// True when the request may log in with the secret; it calls `Begin` when it does. Otherwise it
  /// is queued, and is passed to `start` by a later call when its turn has come: it then has the
  /// gate until it calls `Leave` or `Withdraw`.
  bool Enter(Tag tag, const RequestPtr& request, Instant::Steady now);
  /// A login begins, after `Enter` and without another call in between. `Leave` ends it.
  void Begin(Tag tag) noexcept;
  /// Reports what came of the login. `refusal` is set for `kRefused`. `start` is called with each
  /// request whose turn it is.
  template <class Start>
  void Leave(Tag tag, const RequestPtr& request, LoginVerdict verdict, const Failure& refusal,
             Instant::Steady now, const Start& start) noexcept {
    State* const state = End(tag, verdict, refusal, now);
    if (state == nullptr) {
      return;
    }
    if (verdict == LoginVerdict::kUndecided) {
      if (state->holder == request) {
        PassOn(*state, start);
      }
      return;
    }
    if (state->holder == request) {
      state->holder = nullptr;
    }
    // Another holder is one whose turn has come just now; it finds the same verdict.
    for (const RequestPtr& queued : state->queue) {
      start(queued);
    }
    state->queue.clear();
  }
  /// Removes a request that is queued, or has the gate without using it. As `Leave`.
  template <class Start>
  void Withdraw(const RequestPtr& request, const Start& start) noexcept {
    for (auto& [tag, state] : states_) {
      std::erase(state.queue, request);
      if (state.holder == request) {
        PassOn(state, start);
      }
    }
  }

 private:
  struct State {
    Instant::Steady acceptedUntil = Instant::Steady::min();
    Instant::Steady refusedUntil = Instant::Steady::min();
    Failure refusal;
    int underWay = 0;  ///< logins that have begun
    RequestPtr holder;
    std::deque<RequestPtr> queue;
  };

  template <class Start>
  static void PassOn(State& state, const Start& start) noexcept {
    state.holder = nullptr;
    if (!state.queue.empty()) {
      state.holder = std::move(state.queue.front());
      state.queue.pop_front();
      start(state.holder);
    }
  }
  State* End(Tag tag, LoginVerdict verdict, const Failure& refusal, Instant::Steady now) noexcept;
  void DropIdle(Instant::Steady now);

  const std::chrono::seconds refusalMemory_;
  std::map<Tag, State> states_;
};

}  // namespace SsoClient::Access

#endif
