#ifndef SSOCLIENT_ACCESS_LOGIN_GATE_H
#define SSOCLIENT_ACCESS_LOGIN_GATE_H

#include <array>
#include <chrono>
#include <cstddef>
#include <deque>
#include <map>
#include <memory>
#include <utility>

#include <ssoclient/access/token_source.h>

#include "failure.h"
#include "instant.h"
#include "secret.h"

namespace SsoClient::Access {

struct Request;
using RequestPtr = std::shared_ptr<Request>;

enum class LoginVerdict {
  kAccepted,
  kRefused,
  kUndecided,
  kUnknown,  ///< it was sent, but nobody waited until the service had decided
};

/// What came of a login.
struct LoginOutcome {
  LoginVerdict verdict = LoginVerdict::kUndecided;
  Failure refusal{};  ///< set for `kRefused`
  double draw = 0;    ///< for `kUnknown`: random, at least 0 and below 1
};

/// Protects the account: until a login with a secret has been accepted, only one request at a time
/// has the gate of that secret; the others queue. A secret counts as accepted for some seconds, in
/// which two passwords, or any number of other logins, are under way: a password that was changed
/// at the service is refused twice at most. A refused secret is remembered, by its tag, and nobody
/// has its gate; the same is true for a growing pause after a login whose verdict is unknown.
/// Requests are only compared here. Only `Enter` needs memory. Not thread-safe.
class LoginGate {
 public:
  using Tag = SecretTagger::Tag;
  /// Logins with one accepted password at once. Services count failures before they lock an
  /// account, usually three or five, and other programs of the account count as well.
  static constexpr std::size_t kPasswordsAtOnce = 2;

  /// `areBounded` is true for passwords.
  LoginGate(const RetryConfig& config, bool areBounded)
      : config_(config), areBounded_(areBounded) {}

  /// The refusal that is remembered for the secret; not set without one.
  Failure RefusalOf(Tag tag, Instant::Steady now) const noexcept;
  /// When a login with the secret may begin, as far as unknown verdicts matter.
  Instant::Steady ClosedUntil(Tag tag) const noexcept;
  /// True for some seconds after a login with the secret was accepted.
  bool IsAccepted(Tag tag, Instant::Steady now) const noexcept;
  /// True when the request may log in with the secret; it calls `Begin` when it does. Otherwise it
  /// is queued, and is passed to `start` by a later call when its turn has come: it then has the
  /// gate until it calls `Leave` or `Withdraw`.
  bool Enter(Tag tag, const RequestPtr& request, Instant::Steady now);
  /// A login begins, after `Enter` and without another call in between. `Leave` ends it.
  void Begin(Tag tag) noexcept;
  /// Reports what came of the login. `start` is called with each request whose turn it is.
  template <class Start>
  void Leave(Tag tag, const RequestPtr& request, const LoginOutcome& outcome, Instant::Steady now,
             const Start& start) noexcept {
    State* const state = End(tag, outcome, now);
    if (state == nullptr) {
      return;
    }
    Release(*state, request);
    if (now < state->refusedUntil || now < state->closedUntil) {
      StartAll(*state, start);
    } else {
      PassOn(*state, now, start);
    }
  }
  /// Removes a request that is queued, or has the gate without using it. As `Leave`.
  template <class Start>
  void Withdraw(const RequestPtr& request, Instant::Steady now, const Start& start) noexcept {
    for (auto& [tag, state] : states_) {
      std::erase(state.queue, request);
      if (Release(state, request)) {
        PassOn(state, now, start);
      }
    }
  }

 private:
  struct State {
    Instant::Steady acceptedUntil = Instant::Steady::min();
    Instant::Steady refusedUntil = Instant::Steady::min();
    Failure refusal;
    Instant::Steady closedUntil = Instant::Steady::min();
    int unknown = 0;   ///< consecutive verdicts
    int underWay = 0;  ///< logins that have begun
    std::array<RequestPtr, kPasswordsAtOnce> holders;
    std::deque<RequestPtr> queue;
  };

  /// Whether everybody may log in.
  bool IsOpen(const State& state, Instant::Steady now) const noexcept {
    return !areBounded_ && now < state.acceptedUntil;
  }
  /// A free place among the holders; null without one.
  static RequestPtr* FreePlace(State& state, Instant::Steady now) noexcept;
  static bool IsHeld(const State& state) noexcept;
  static bool IsHolder(const State& state, const RequestPtr& request) noexcept;
  static bool Release(State& state, const RequestPtr& request) noexcept;
  static RequestPtr TakeFirst(State& state) noexcept;
  template <class Start>
  static void StartAll(State& state, const Start& start) noexcept {
    while (!state.queue.empty()) {
      start(TakeFirst(state));
    }
  }
  template <class Start>
  void PassOn(State& state, Instant::Steady now, const Start& start) const noexcept {
    if (IsOpen(state, now)) {
      StartAll(state, start);
      return;
    }
    while (!state.queue.empty()) {
      RequestPtr* const place = FreePlace(state, now);
      if (place == nullptr) {
        return;
      }
      *place = TakeFirst(state);
      start(*place);
    }
  }
  State* End(Tag tag, const LoginOutcome& outcome, Instant::Steady now) noexcept;
  void Close(State& state, double draw, Instant::Steady now) const noexcept;
  void DropIdle(Instant::Steady now);

  const RetryConfig config_;
  const bool areBounded_;
  std::map<Tag, State> states_;
};

}  // namespace SsoClient::Access

#endif
