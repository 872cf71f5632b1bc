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
#include "refused_specs.h"
#include "request.h"
#include "runtime.h"
#include "secret.h"
#include "token_cache.h"
#include "turn_queue.h"
#include "waiter.h"

namespace SsoClient::Access {

class Section;
struct Result;
struct Step;

/// A token source in one process. One lock protects its state; it is held only for short
/// computations, never over an exchange or a function of the user. What follows from a change of
/// the state (answers, work, reports) happens after the lock has been released: see `Section`.
///
/// A request goes through steps on a worker thread: `Begin` chooses the operation, the login's
/// function gives the secret, `Admit` chooses the endpoint, the attempt is made, and `Conclude`
/// stores the token, ends the request, or goes on. A request that has to wait (for the gate of the
/// login, a base token, a pause, or its turn when too much is under way) leaves the worker, and is
/// run again when it can go on.
///
/// When memory runs out, a request ends with that failure; what is `noexcept` here needs none.
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
  /// As `GetTokenAsync`, with the kind of a failure. The callback is not empty.
  void GetAnswerAsync(const TokenSpec& spec, const CallContext& context, AnswerCallback callback);
  void Invalidate(const SamlToken& token);
  TokenSourceMetrics Metrics() const;
  bool Stop(std::chrono::milliseconds wait);
  /// Whether this thread is in a function of the login, the listener or a callback.
  bool IsRunningHere() const noexcept { return activity_->IsRunningHere(); }
  /// Ends all calls, since the process ends. Does not wait.
  void EndProcess() noexcept;
  /// Waits until no function of the user is running, at most until `time`.
  void WaitUntil(Instant::Steady time) noexcept;

 private:
  friend class Section;

  enum class State { kRunning, kStopped, kProcessEnding };
  enum class Leaving { kDeadline, kCancelled };
  /// What becomes of a waiter: it has an answer at once, or waits for a request.
  struct Joined {
    RequestPtr begun;  ///< the request if it is new and must be run
    boost::optional<Answer> answer;
  };

  // calls: core.cpp
  void RequireRunning() const;
  void CheckContext(const CallContext& context, const Instant& now) const;
  TokenCache::Hit FindHit(const TokenSpec& spec, const CallContext& context);
  void RefreshLate(const TokenSpec& spec) noexcept;
  void EndAll(State state, const Failure& failure) noexcept;

  // callers that wait: callers.cpp
  void Wait(const TokenSpec& spec, const WaiterPtr& waiter);
  Joined TryJoin(const TokenSpec& spec, const WaiterPtr& waiter);
  Joined Join(Section& section, const TokenSpec& spec, const WaiterPtr& waiter);
  void RunBegun(const RequestPtr& begun, const WaiterPtr& waiter);
  boost::optional<Answer> AnswerAtOnce(const SpecView& spec, const WaiterPtr& waiter,
                                       const Instant& now);
  bool Withdraw(const WaiterPtr& waiter) noexcept;
  void Leave(const WaiterPtr& waiter, Leaving why) noexcept;
  Failure DeadlineFailure(const Request& request, const Waiter& waiter) const noexcept;
  void Abandon(Section& section, const RequestPtr& request, Leaving why) noexcept;
  bool IsVerdictNeeded(const Request& request) const noexcept;
  void GiveAll(Section& section, const RequestPtr& request, const Failure& failure) noexcept;
  void GiveUsable(Section& section, const RequestPtr& request, const CacheEntry& entry,
                  const Instant& now) noexcept;
  void GiveTooShort(Section& section, const RequestPtr& request,
                    std::chrono::microseconds granted) noexcept;

  // steps of requests: request_steps.cpp
  void Run(const RequestPtr& request);
  void FailHere(const RequestPtr& request, const Failure& failure) noexcept;
  void FailUnlessEnded(Section& section, const RequestPtr& request,
                       const Failure& failure) noexcept;
  void Work(const RequestPtr& request) noexcept;
  bool RunStep(const RequestPtr& request);
  bool Begin(const RequestPtr& request, Step& step);
  bool IsRenewable(const SamlToken& token) const;
  std::chrono::seconds BaseLife(const Request& request) const noexcept;
  bool MayLengthenBase(const Request& request) const noexcept;
  void RequestBase(const RequestPtr& request);
  void ReceiveBase(const RequestPtr& request, const Answer& answer) noexcept;
  void NoteBase(Section& section, const std::shared_ptr<const SamlToken>& token) noexcept;
  bool RunLogin(const RequestPtr& request, Step& step);
  void FailLogin(const RequestPtr& request, Step& step, const Failure& failure);
  bool RunAttempt(const RequestPtr& request, Step& step, const std::string& secret);
  void ReportBegin(const AttemptRecord& record) const noexcept;
  bool HasUsableToken(const Request& request, const Instant& now);
  bool Admit(const RequestPtr& request, Step& step);
  bool MayLogIn(Section& section, const RequestPtr& request, const Step& step, const Instant& now);
  Failure RememberedRefusal(const Request& request, const Step& step, const Instant& now) const;
  void LeaveGate(Section& section, const RequestPtr& request, const LoginOutcome& outcome,
                 const Instant& now) noexcept;
  void WithdrawFromGate(Section& section, const RequestPtr& request) noexcept;
  Result Perform(const Step& step, const Request& request, const std::string& secret) noexcept;
  Failure ToRemember(const Failure& failure, const std::string& secret) const noexcept;
  void InvalidateBase(const Step& step) noexcept;

  // turns: request_turns.cpp
  bool EnterFunction(const RequestPtr& request);
  void ReturnFunction(Section& section) noexcept;
  EndpointSet::Order OrderFor(const Request& request, const Instant& now) noexcept;
  bool TakePlace(Section& section, const RequestPtr& request, const Instant& now);
  void ReturnPlaces(Section& section, const RequestPtr& request) noexcept;
  void ReturnPlace(Section& section, const RequestPtr& request) noexcept;
  void ServeTurns(Section& section, const Instant& now) noexcept;
  void WakeHopeless(Section& section, const Instant& now) noexcept;

  // outcomes: request_outcomes.cpp
  bool Conclude(const RequestPtr& request, Step& step, Result result);
  void NoteOutcome(Section& section, const RequestPtr& request, Step& step, Result& result,
                   const Instant& now) noexcept;
  void NoteCircuit(Section& section, const Step& step, const Result& result,
                   const Instant& now) noexcept;
  void NoteClock(Section& section, const Step& step, const AttemptOutcome& outcome) noexcept;
  LoginOutcome JudgeLogin(const Request& request, const Result& result) noexcept;
  static bool IsRefusedForSpec(const Request& request, const AttemptOutcome& outcome) noexcept;
  bool Accept(Section& section, const RequestPtr& request, const Step& step,
              const AttemptOutcome& outcome, const Instant& now);
  void ReportDeviations(Section& section, const Step& step, const AttemptOutcome& outcome) noexcept;
  bool GoOnAfterFailure(Section& section, const RequestPtr& request, const Step& step,
                        const Result& result, const Instant& now) noexcept;
  bool GoOnAfterDecision(Section& section, const RequestPtr& request, Step& step,
                         const Result& result, const Instant& now) noexcept;
  bool ReplaceBase(const RequestPtr& request, Step& step, const Instant& now) noexcept;
  int AttemptLimit(const Request& request) const noexcept;
  void EndRound(Section& section, const RequestPtr& request, const Instant& now) noexcept;
  bool Pause(Section& section, const RequestPtr& request, Instant::Steady until) noexcept;
  void Resume(const RequestPtr& request) noexcept;
  void FailUndecided(Section& section, const RequestPtr& request, const Instant& now) noexcept;
  Failure SummaryOf(const Request& request, const Instant& now) const;
  void Fail(Section& section, const RequestPtr& request, const Failure& failure,
            const Instant& now) noexcept;
  void Detach(Section& section, const RequestPtr& request) noexcept;

  // refreshes: refreshes.cpp
  void KeepFresh();
  void RunDue() noexcept;
  void LookAtDue(Section& section, const Instant& now);
  void LookAt(Section& section, const KeyPtr& key, const Instant& now);
  void RefreshInBackground(Section& section, const KeyPtr& key);
  EntryPtr Store(Section& section, const KeyPtr& key, const std::shared_ptr<const SamlToken>& token,
                 const TokenLife& life, const Instant& now);
  EntryPtr KeepLonger(Section& section, const EntryPtr& entry, const Instant& now);
  void ScheduleAfterFailure(Section& section, const Request& request, const Failure& failure,
                            const Instant& now) noexcept;
  void EndOutage(Section& section, const Instant& now, bool isOver) noexcept;
  void ArmTimer(Section& section, Instant::Steady earliest = Instant::Steady::min()) noexcept;
  bool IsPinned(const KeyPtr& key) noexcept;

  // Destroyed last.
  const std::shared_ptr<const TokenSourceConfig> config_;
  const std::shared_ptr<Runtime> runtime_;
  const std::shared_ptr<Activity> activity_;
  const SecretTagger tagger_;
  const Failure stopped_;
  const Failure processEnding_;
  // What is remembered of a refusal without memory for a copy.
  const Failure refused_;
  const Failure expired_;
  std::atomic<State> state_{State::kRunning};
  TokenCache cache_;
  Counters counters_;
  std::atomic<std::uint64_t> lastAttemptId_{0};

  mutable std::mutex mutex_;
  EndpointSet endpoints_;
  TurnQueue turns_;
  LoginGate gate_;
  TurnQueue turnsOfFunction_;
  int functionsUnderWay_ = 0;
  RefusedSpecs refusedSpecs_;
  /// The last token to exchange, and since when it is known, or when it was last replaced.
  std::shared_ptr<const SamlToken> knownBase_;
  Instant::Steady knownBaseSince_ = Instant::Steady::min();
  std::unordered_map<KeyPtr, RequestPtr, KeyHash, KeyEqual> requests_;
  std::size_t waiting_ = 0;
  RefreshSchedule schedule_;
  /// From when on an answer ends pauses and postponements; the least of all that wait.
  Instant::Steady nextWake_ = Instant::Steady::max();
  std::size_t backgroundRequests_ = 0;
  Tarnik::Ref<Tarnik::System::CancellableItem> timer_;
  Instant::Steady timerAt_ = Instant::Steady::max();
};

}  // namespace SsoClient::Access

#endif
