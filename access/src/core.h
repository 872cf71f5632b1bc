#ifndef SSOCLIENT_ACCESS_CORE_H
#define SSOCLIENT_ACCESS_CORE_H

#include <atomic>
#include <chrono>
#include <cstdint>
#include <memory>
#include <mutex>
#include <unordered_map>
#include <vector>

#include <ssoclient/access/token_source.h>

#include "activity.h"
#include "attempt.h"
#include "counters.h"
#include "endpoint_set.h"
#include "login_gate.h"
#include "refresh_schedule.h"
#include "request.h"
#include "runtime.h"
#include "secret.h"
#include "token_cache.h"
#include "waiter.h"

namespace SsoClient::Access {

class Section;
struct Step;

/// A token source in one process. One lock protects its state; it is held only for short
/// computations, never over an exchange or a function of the user. What follows from a change of
/// the state (answers, work, reports) happens after the lock has been released: see `Section`.
///
/// A request goes through steps on a worker thread: `Begin` chooses the operation, the login's
/// function gives the secret, `Admit` chooses the endpoint, the attempt is made, and `Conclude`
/// stores the token, ends the request, or goes on. A request that has to wait (for the gate of the
/// login, a base token or a pause) leaves the worker, and is run again when it can go on.
class Core : public std::enable_shared_from_this<Core> {
 public:
  struct Parts {
    std::shared_ptr<const TokenSourceConfig> config;
    std::shared_ptr<Runtime> runtime;
    std::vector<std::unique_ptr<EndpointClient>> clients;
  };

  /// Requests the tokens of `TokenSourceConfig::keepFresh`.
  static std::shared_ptr<Core> Create(Parts parts);
  explicit Core(Parts parts);
  ~Core();
  Core(const Core&) = delete;
  Core& operator=(const Core&) = delete;

  // As those of `TokenSource`.
  std::shared_ptr<const SamlToken> GetToken(const TokenSpec& spec, const CallContext& context);
  std::shared_ptr<const SamlToken> TryGetToken(const TokenSpec& spec);
  void GetTokenAsync(const TokenSpec& spec, const CallContext& context,
                     TokenSource::TokenCallback callback);
  void Invalidate(const SamlToken& token);
  TokenSourceMetrics Metrics() const;
  bool Stop(std::chrono::milliseconds wait);
  /// Whether this thread is in a function of the login, the listener or a callback.
  bool IsRunningHere() const noexcept { return activity_->IsRunningHere(); }
  /// Ends all calls, since the process ends. Waits a moment for the callbacks.
  void EndProcess() noexcept;

 private:
  friend class Section;

  enum class State { kRunning, kStopped, kProcessEnding };
  enum class Leaving { kDeadline, kCancelled };

  // calls: core.cpp
  void RequireRunning() const;
  void CheckContext(const CallContext& context, const Instant& now) const;
  TokenCache::Hit FindHit(const TokenSpec& spec, const CallContext& context);
  void RefreshLate(const TokenSpec& spec) noexcept;
  void Wait(const TokenSpec& spec, const WaiterPtr& waiter);
  RequestPtr Join(Section& section, const TokenSpec& spec, const WaiterPtr& waiter);
  boost::optional<Answer> AnswerAtOnce(const SpecView& spec, const WaiterPtr& waiter,
                                       const Instant& now);
  bool Withdraw(const WaiterPtr& waiter) noexcept;
  void Leave(const WaiterPtr& waiter, Leaving why) noexcept;
  void Abandon(Section& section, const RequestPtr& request, bool hasWaitedInVain);
  void GiveAll(Section& section, const RequestPtr& request, const Failure& failure);
  void GiveAll(Section& section, const RequestPtr& request, const CacheEntry& entry,
               const Instant& now);
  void EndAll(State state, const Failure& failure);

  // steps of requests: request_steps.cpp
  void StartWork(const RequestPtr& request) noexcept;
  void Run(const RequestPtr& request);
  void FailHere(const RequestPtr& request, const Failure& failure) noexcept;
  void Work(const RequestPtr& request) noexcept;
  bool RunStep(const RequestPtr& request);
  bool Begin(const RequestPtr& request, Step& step);
  bool IsRenewable(const SamlToken& token) const;
  void RequestBase(const RequestPtr& request);
  void ReceiveBase(const RequestPtr& request, const std::shared_ptr<const SamlToken>& token,
                   const Tarnik::Exception* failure);
  bool RunLogin(const RequestPtr& request, Step& step);
  bool RunAttempt(const RequestPtr& request, Step& step, const std::string& secret);
  bool Admit(const RequestPtr& request, Step& step);
  bool MayLogIn(Section& section, const RequestPtr& request, const Step& step, const Instant& now);
  Failure RememberedRefusal(const RequestPtr& request, const Step& step, const Instant& now);
  void LeaveGate(Section& section, const RequestPtr& request, LoginVerdict verdict,
                 const Failure& refusal, const Instant& now);
  AttemptOutcome Perform(const Step& step, const Request& request, const std::string& secret);

  // outcomes: request_outcomes.cpp
  bool Conclude(const RequestPtr& request, Step& step, AttemptOutcome outcome);
  void NoteOutcome(Section& section, const RequestPtr& request, const Step& step,
                   const AttemptOutcome& outcome, const Instant& now);
  void NoteClock(Section& section, const Step& step, const AttemptOutcome& outcome);
  LoginVerdict VerdictOf(FailureKind kind) const noexcept;
  void Accept(Section& section, const RequestPtr& request, const Step& step,
              const AttemptOutcome& outcome, const Instant& now);
  bool GoOnAfterFailure(Section& section, const RequestPtr& request, const Step& step,
                        const AttemptOutcome& outcome, const Instant& now);
  bool GoOnAfterDecision(Section& section, const RequestPtr& request, const Step& step,
                         const AttemptOutcome& outcome, const Instant& now);
  int AttemptLimit(const Request& request) const;
  void EndRound(Section& section, const RequestPtr& request, const Instant& now);
  void Pause(Section& section, const RequestPtr& request, Instant::Steady until);
  void Resume(const RequestPtr& request) noexcept;
  void FailUndecided(Section& section, const RequestPtr& request, const Instant& now);
  void Fail(Section& section, const RequestPtr& request, const Failure& failure, FailureKind kind,
            const Instant& now);
  void Detach(Section& section, const RequestPtr& request);

  // refreshes: refreshes.cpp
  void KeepFresh();
  void RunDue() noexcept;
  void LookAt(Section& section, const KeyPtr& key, const Instant& now);
  void RefreshInBackground(Section& section, const KeyPtr& key);
  EntryPtr Store(Section& section, const KeyPtr& key, const std::shared_ptr<const SamlToken>& token,
                 const TokenLife& life, const Instant& now);
  void ScheduleAfterFailure(Section& section, const Request& request, const Failure& failure,
                            FailureKind kind, const Instant& now);
  void EndOutage(Section& section, const Instant& now);
  void ArmTimer(Section& section);
  bool IsPinned(const KeyPtr& key);

  // Destroyed last.
  const std::shared_ptr<const TokenSourceConfig> config_;
  const std::shared_ptr<Runtime> runtime_;
  const std::shared_ptr<Activity> activity_;
  const SecretTagger tagger_;
  std::atomic<State> state_{State::kRunning};
  TokenCache cache_;
  Counters counters_;
  std::atomic<std::uint64_t> lastAttemptId_{0};

  mutable std::mutex mutex_;
  EndpointSet endpoints_;
  LoginGate gate_;
  struct Refusal {
    Failure failure;
    Instant::Steady until;
  };
  std::unordered_map<KeyPtr, Refusal, KeyHash, KeyEqual> refusedExchanges_;
  std::unordered_map<KeyPtr, RequestPtr, KeyHash, KeyEqual> requests_;
  std::size_t waiting_ = 0;
  RefreshSchedule schedule_;
  std::size_t backgroundRequests_ = 0;
  Tarnik::Ref<Tarnik::System::CancellableItem> timer_;
  Instant::Steady timerAt_ = Instant::Steady::max();
};

}  // namespace SsoClient::Access

#endif
