#ifndef SSOCLIENT_ACCESS_LOGIN_GATE_H
#define SSOCLIENT_ACCESS_LOGIN_GATE_H

#include <chrono>
#include <deque>
#include <map>
#include <memory>
#include <vector>

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
/// only compared here. Not thread-safe.
class LoginGate {
 public:
  using Tag = SecretTagger::Tag;

  explicit LoginGate(std::chrono::seconds refusalMemory) : refusalMemory_(refusalMemory) {}

  /// The refusal that is remembered for the secret; not set without one.
  Failure RefusalOf(Tag tag, Instant::Steady now) const;
  /// True when the request may log in with the secret; it must then call `Leave`. Otherwise it is
  /// queued, and is returned by a later call when its turn has come: it then has the gate until it
  /// calls `Leave` or `Withdraw`.
  bool Enter(Tag tag, const RequestPtr& request, Instant::Steady now);
  /// Reports what came of the login. `refusal` is set for `kRefused`. Returns whose turn it is.
  std::vector<RequestPtr> Leave(Tag tag, const RequestPtr& request, LoginVerdict verdict,
                                const Failure& refusal, Instant::Steady now);
  /// Removes a request that is queued, or has the gate without using it. Returns whose turn it is.
  std::vector<RequestPtr> Withdraw(const RequestPtr& request);

 private:
  struct State {
    Instant::Steady acceptedUntil = Instant::Steady::min();
    Instant::Steady refusedUntil = Instant::Steady::min();
    Failure refusal;
    RequestPtr holder;
    std::deque<RequestPtr> queue;
  };

  void DropIdle(Instant::Steady now);

  const std::chrono::seconds refusalMemory_;
  std::map<Tag, State> states_;
};

}  // namespace SsoClient::Access

#endif
