#ifndef SSOCLIENT_ACCESS_REQUEST_H
#define SSOCLIENT_ACCESS_REQUEST_H

#include <chrono>
#include <memory>
#include <optional>
#include <unordered_set>
#include <vector>

#include <ssoclient/access/call_context.h>
#include <tarnik/http/bounded_user_agent.h>

#include "cache_key.h"
#include "endpoint_set.h"
#include "failure.h"
#include "login_gate.h"
#include "stage.h"
#include "turn_queue.h"
#include "waiter.h"

namespace SsoClient::Access {

/// The only request for the token of a key, and those who wait for it. Under the lock of the core.
struct Request {
  explicit Request(KeyPtr k, bool isInBackground, std::size_t endpoints)
      : key(std::move(k)), isBackground(isInBackground), asked(endpoints), reasons(endpoints) {}

  /// True for a request whose attempt goes on only to learn whether the password is accepted.
  bool IsLeft() const noexcept { return !hasEnded && !isBackground && waiters.empty(); }

  const KeyPtr key;
  /// Goes on although nobody waits.
  const bool isBackground;
  std::unordered_set<WaiterPtr> waiters;
  /// What it is doing, for the message of a deadline, and the endpoint of the last attempt.
  Stage stage = Stage::kWorker;
  EndpointSet::Index endpoint = 0;
  /// It has ended, or nobody waits for it: the thread that works for it drops what it has.
  bool hasEnded = false;
  /// The attempt under way is a login with a password.
  bool sendsPassword = false;
  /// It was cancelled when the password may have been sent.
  bool isVerdictLost = false;

  bool mayRenew = true;
  /// An endpoint that did not decide a renewal may decide a login.
  bool wasRenewalSent = false;
  /// The first token to exchange has been refused.
  bool hasReplacedBase = false;
  /// There is no token to exchange that is valid for `baseLife`.
  bool takesAnyBase = false;
  /// The tag of the secret whose gate it has or waits for.
  std::optional<LoginGate::Tag> gate;
  /// The token to exchange for `TokenLogin`, and how long the last one asked for had to be valid.
  std::shared_ptr<const SamlToken> base;
  std::chrono::seconds baseLife{0};
  /// Ends the request for `base`.
  CancellationSource cancellation;

  /// Its place in the queues for the attempts and for the login's function.
  TurnQueue::Ticket turn;
  TurnQueue::Ticket turnOfFunction;
  /// A place at an endpoint that is kept for it until its next attempt begins.
  std::optional<EndpointSet::Index> place;
  /// The order in which that endpoint was chosen.
  EndpointSet::Order order = EndpointSet::Order::kPreferredFirst;
  /// The same for the login's function.
  bool hasPlaceOfFunction = false;

  int attempts = 0;
  int undecided = 0;  ///< attempts that no service has decided
  int rounds = 1;
  EndpointSet::Asked asked;
  std::vector<Reason> reasons;  ///< the last failure of each endpoint in this request
  Failure lastFailure;
  /// The limit of the attempt under way; null between attempts.
  Tarnik::Ref<Tarnik::Http::CallLimit> limit;
  /// The pause before the next round; null otherwise.
  Tarnik::Ref<Tarnik::System::CancellableItem> pause;
  /// From then on the answer of an endpoint ends the pause.
  Instant::Steady nextWake = Instant::Steady::min();
  /// The next one in the list of a section that is about to run this one.
  std::shared_ptr<Request> nextStarted;
  /// The same for one that has ended, and what is then cancelled.
  std::shared_ptr<Request> nextEnded;
  Tarnik::Ref<Tarnik::Http::CallLimit> endedLimit;
  Tarnik::Ref<Tarnik::System::CancellableItem> endedPause;
};

}  // namespace SsoClient::Access

#endif
