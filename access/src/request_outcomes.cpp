#include <algorithm>
#include <memory>
#include <string>
#include <utility>
#include <variant>

#include <ssoclient/exceptions.h>

#include "backoff.h"
#include "core.h"
#include "section.h"
#include "step.h"

namespace SsoClient::Access {

namespace {

using std::chrono::milliseconds;

constexpr std::chrono::seconds kYoungBase{30};
// A token ends with its base when the two ends differ by no more, since services round.
constexpr std::chrono::microseconds kSameEnd = std::chrono::seconds(2);

bool IsRefusal(FailureKind kind) noexcept {
  return kind == FailureKind::kRefusedLogin || kind == FailureKind::kExpiredPassword;
}

// Whether the endpoint has answered as a security token service.
bool IsAnswer(FailureKind kind) noexcept {
  switch (kind) {
    case FailureKind::kNone:
    case FailureKind::kBadAnswer:
    case FailureKind::kFault:
    case FailureKind::kRefusedLogin:
    case FailureKind::kExpiredPassword:
    case FailureKind::kBadToken:
      return true;
    default:
      return false;
  }
}

// Whether the service itself has made the answer: a token or a SOAP fault. A proxy, which has a
// clock of its own, answers with other texts, and may ask for a login (RFC 9110, section 15.5.2).
bool IsOfService(const AttemptOutcome& outcome) noexcept {
  constexpr int kUnauthorized = 401;
  return IsAnswer(outcome.kind) && outcome.kind != FailureKind::kBadAnswer &&
         outcome.httpStatus != kUnauthorized;
}

// Whether another operation may succeed at the endpoint.
bool MayHaveReached(FailureKind kind) noexcept {
  return kind == FailureKind::kHttpStatus || kind == FailureKind::kTimedOut ||
         kind == FailureKind::kCutOff;
}

GrantedPeriod PeriodOf(const SamlToken& token, milliseconds clockOffset) {
  return {std::chrono::microseconds(token.StartTime().GetUtcTime()),
          std::chrono::microseconds(token.ExpirationTime().GetUtcTime()), clockOffset};
}

bool EndTogether(const SamlToken& token, const SamlToken& base) {
  const auto difference = std::chrono::microseconds(token.ExpirationTime().GetUtcTime() -
                                                    base.ExpirationTime().GetUtcTime());
  return difference <= kSameEnd && difference >= -kSameEnd;
}

// An exception of the class of `last` for several endpoints.
Failure Combine(const Failure& last, const std::string& text) {
  const bool isOther = last.IsSet() && !last.Is<CommunicationException>();
  return isOther ? Failure::Of(SsoException(text)) : Failure::Of(CommunicationException(text));
}

}  // namespace

// Returns whether another attempt follows at once.
bool Core::Conclude(const RequestPtr& request, Step& step, Result result) {
  Section section(*this);
  const Instant now = runtime_->Now();
  request->limit = nullptr;
  if (request->hasEnded && AllowsFailover(result.outcome.kind)) {
    result.outcome.kind = FailureKind::kAbandoned;
  }
  NoteOutcome(section, request, step, result, now);
  request->sendsPassword = false;
  if (result.outcome.token != nullptr) {
    return Accept(section, request, step, result.outcome, now);
  }
  if (request->hasEnded) {
    return false;
  }
  if (request->IsLeft()) {
    Fail(section, request, result.failure, now);
    return false;
  }
  return AllowsFailover(result.outcome.kind)
             ? GoOnAfterFailure(section, request, step, result, now)
             : GoOnAfterDecision(section, request, step, result, now);
}

void Core::NoteOutcome(Section& section, const RequestPtr& request, Step& step, Result& result,
                       const Instant& now) noexcept {
  AttemptOutcome& outcome = result.outcome;
  NoteCircuit(section, step, result, now);
  LeaveGate(section, request, JudgeLogin(*request, result), now);
  NoteClock(section, step, outcome);
  counters_.CountAttempt(outcome.kind);
  step.record.duration =
      std::chrono::duration_cast<std::chrono::microseconds>(now.steady - step.begun);
  step.record.failure = outcome.kind;
  step.record.message = std::move(outcome.message);
  step.record.httpStatus = outcome.httpStatus;
  section.ReportEnd(step.record);
}

// The worker is free, and so is the place at the endpoint.
void Core::NoteCircuit(Section& section, const Step& step, const Result& result,
                       const Instant& now) noexcept {
  const AttemptOutcome& outcome = result.outcome;
  endpoints_.ReturnPlace(step.endpoint);
  if (IsAnswer(outcome.kind)) {
    // A service that is back, but refuses, is not preferred: the next attempt begins elsewhere.
    const bool isPreferred =
        outcome.token != nullptr || step.order == EndpointSet::Order::kPreferredFirst;
    const EndpointSet::Change change = endpoints_.OnAnswer(step.endpoint, isPreferred);
    section.Circuit(change);
    EndOutage(section, now, change.has_value());
  } else if (step.operation == AttemptOperation::kRenewal &&
             outcome.kind == FailureKind::kHttpStatus) {
    section.Circuit(endpoints_.OnUnclear(step.endpoint, result.reason, outcome.retryAfter,
                                         now.steady, runtime_->Draw()));
    WakeHopeless(section, now);
  } else if (AllowsFailover(outcome.kind)) {
    section.Circuit(endpoints_.OnFailure(step.endpoint, result.reason, outcome.retryAfter,
                                         now.steady, runtime_->Draw()));
    WakeHopeless(section, now);
  } else {
    section.Circuit(endpoints_.OnAbandoned(step.endpoint));
  }
  ServeTurns(section, now);
}

// The token to act as may be the reason, so that other specs are not refused.
bool Core::IsRefusedForSpec(const Request& request, const AttemptOutcome& outcome) noexcept {
  return outcome.kind == FailureKind::kRefusedLogin && !outcome.isAuthenticationRefused &&
         request.key->spec.actAsToken.has_value();
}

LoginOutcome Core::JudgeLogin(const Request& request, const Result& result) noexcept {
  const FailureKind kind = result.outcome.kind;
  if (kind == FailureKind::kNone) {
    return {LoginVerdict::kAccepted};
  }
  if (IsRefusal(kind)) {
    return IsRefusedForSpec(request, result.outcome)
               ? LoginOutcome{}
               : LoginOutcome{LoginVerdict::kRefused, result.refusal};
  }
  const bool isLost = request.sendsPassword && (request.IsLeft() || request.isVerdictLost);
  return isLost ? LoginOutcome{LoginVerdict::kUnknown, {}, runtime_->Draw()} : LoginOutcome{};
}

void Core::NoteClock(Section& section, const Step& step, const AttemptOutcome& outcome) noexcept {
  if (!outcome.clockOffset || !IsOfService(outcome) ||
      !endpoints_.SetClockOffset(step.endpoint, *outcome.clockOffset)) {
    return;
  }
  section.ToListener([&] {
    const ClockRecord record{config_->name, endpoints_.Url(step.endpoint), *outcome.clockOffset};
    return Section::Report([record](AccessListener& listener) { listener.OnClock(record); });
  });
}

// Returns whether another attempt follows at once.
bool Core::Accept(Section& section, const RequestPtr& request, const Step& step,
                  const AttemptOutcome& outcome, const Instant& now) {
  counters_.CountSuccess(step.operation);
  if (state_ != State::kRunning) {
    return false;
  }
  ReportDeviations(section, step, outcome);
  TokenLife life = PlanTokenLife(config_->refresh,
                                 PeriodOf(*outcome.token, endpoints_.ClockOffset(step.endpoint)),
                                 now, runtime_->Draw());
  if (life.granted <= std::chrono::microseconds(0)) {
    if (!request->hasEnded) {
      const Failure ended =
          Failure::Of(SsoException("The service issued a token that has ended already."));
      Fail(section, request, ended.WithKind(FailureKind::kBadToken), now);
    }
    return false;
  }
  life.endsWithBase = step.base != nullptr && step.operation == AttemptOperation::kExchange &&
                      EndTogether(*outcome.token, *step.base);
  refusedSpecs_.Forget(request->key->spec, step.tag);
  const EntryPtr entry = Store(section, request->key, outcome.token, life, now);
  if (request->hasEnded) {
    return false;
  }
  GiveUsable(section, request, *entry, now);
  if (life.endsWithBase && MayLengthenBase(*request)) {
    request->base = nullptr;
    return true;
  }
  GiveTooShort(section, request, life.granted);
  Detach(section, request);
  return false;
}

void Core::ReportDeviations(Section& section, const Step& step,
                            const AttemptOutcome& outcome) noexcept {
  for (const DeviationRecord& deviation : outcome.deviations) {
    counters_.deviations.Add();
    section.ToListener([&] {
      DeviationRecord record = deviation;
      record.source = config_->name;
      record.endpoint = endpoints_.Url(step.endpoint);
      return Section::Report([record](AccessListener& listener) { listener.OnDeviation(record); });
    });
  }
}

bool Core::GoOnAfterFailure(Section& section, const RequestPtr& request, const Step& step,
                            const Result& result, const Instant& now) noexcept {
  if (step.operation == AttemptOperation::kRenewal) {
    request->wasRenewalSent |= MayHaveReached(result.outcome.kind);
  }
  request->asked[step.endpoint] = true;
  request->reasons[step.endpoint] = result.reason;
  request->lastFailure = result.failure;
  if (++request->undecided < AttemptLimit(*request) &&
      endpoints_.CanAdmit(request->asked, now.steady)) {
    return true;
  }
  // Each endpoint was asked once to renew the token. A login may succeed where that fails; but
  // when none was reached, the next round tries it.
  if (step.operation == AttemptOperation::kRenewal) {
    request->mayRenew = false;
    if (request->wasRenewalSent) {
      request->undecided = 0;
      std::fill(request->asked.begin(), request->asked.end(), false);
      return true;
    }
  }
  EndRound(section, request, now);
  return false;
}

bool Core::GoOnAfterDecision(Section& section, const RequestPtr& request, Step& step,
                             const Result& result, const Instant& now) noexcept {
  if (step.operation == AttemptOperation::kRenewal) {
    request->mayRenew = false;
    return true;
  }
  const bool isExchange = step.operation == AttemptOperation::kExchange;
  if (isExchange && IsRefusal(result.outcome.kind) && ReplaceBase(request, step, now)) {
    return true;
  }
  const bool isForSpec =
      isExchange ? IsRefusal(result.outcome.kind) : IsRefusedForSpec(*request, result.outcome);
  if (isForSpec) {
    refusedSpecs_.Remember(request->key->spec, step.tag, result.refusal, now.steady);
  }
  Fail(section, request, result.failure, now);
  return false;
}

// Whether the exchange is repeated with another token. Only one that has been known for a while is
// thrown away: when its replacement is refused too, what it is exchanged for is the reason.
bool Core::ReplaceBase(const RequestPtr& request, Step& step, const Instant& now) noexcept {
  if (std::exchange(request->hasReplacedBase, true)) {
    return false;
  }
  request->base = nullptr;
  if (knownBase_ != nullptr && knownBase_->Id() != step.base->Id()) {
    return true;
  }
  if (knownBaseSince_ != Instant::Steady::min() && now.steady - knownBaseSince_ < kYoungBase) {
    return false;
  }
  knownBaseSince_ = now.steady;
  step.isBaseRefused = true;
  return true;
}

// A refresh that nobody waits for asks each endpoint once, and is repeated later.
int Core::AttemptLimit(const Request& request) const noexcept {
  const int attempts = config_->retry.attempts;
  return request.waiters.empty() ? std::min(attempts, static_cast<int>(endpoints_.Size()))
                                 : attempts;
}

void Core::EndRound(Section& section, const RequestPtr& request, const Instant& now) noexcept {
  const bool hasAsked =
      std::find(request->asked.begin(), request->asked.end(), true) != request->asked.end();
  // An endpoint may have answered the renewal that this login follows with a `Retry-After`.
  const bool isFollowUp = request->attempts > 0 && !request->waiters.empty();
  // After a pause, another request may be probing what this one has waited for.
  const bool mayWait = hasAsked || isFollowUp || request->rounds > 1;
  const auto admission = endpoints_.NextAdmission();
  if (!mayWait || !admission || request->undecided >= AttemptLimit(*request)) {
    FailUndecided(section, request, now);
    return;
  }
  // What an endpoint has asked for is in its circuit.
  const milliseconds pause =
      Backoff(config_->retry, request->rounds, milliseconds(0), runtime_->Draw());
  if (Pause(section, request, std::max(now.steady + pause, *admission))) {
    ++request->rounds;
    std::fill(request->asked.begin(), request->asked.end(), false);
    request->base = nullptr;
  }
}

// Without memory, the request ends instead.
bool Core::Pause(Section& section, const RequestPtr& request, Instant::Steady until) noexcept {
  try {
    request->pause =
        runtime_->RunAt(until, [core = weak_from_this(), weak = std::weak_ptr(request)] {
          const auto self = core.lock();
          const auto paused = weak.lock();
          if (self != nullptr && paused != nullptr) {
            self->Resume(paused);
          }
        });
  } catch (...) {
    Fail(section, request, Failure::Current(), runtime_->Now());
    return false;
  }
  request->stage = Stage::kPause;
  nextWake_ = std::min(nextWake_, request->nextWake);
  return true;
}

void Core::Resume(const RequestPtr& request) noexcept {
  Section section(*this);
  if (std::exchange(request->pause, nullptr) != nullptr && !request->hasEnded) {
    section.Start(request);
  }
}

void Core::FailUndecided(Section& section, const RequestPtr& request, const Instant& now) noexcept {
  const bool isOnly = endpoints_.Size() == 1 && request->lastFailure.IsSet();
  const Failure failure =
      isOnly ? request->lastFailure : Failure::Made([&] { return SummaryOf(*request, now); });
  Fail(section, request, failure, now);
}

// All that is known about the endpoints.
Failure Core::SummaryOf(const Request& request, const Instant& now) const {
  std::string text = "No endpoint has given a token.";
  for (EndpointSet::Index index = 0; index < endpoints_.Size(); ++index) {
    const Reason& reason = request.reasons[index];
    const bool isLeftOut = !endpoints_.CanAdmit(index, now.steady);
    if (reason.IsSet() || isLeftOut) {
      text += " " + endpoints_.Url(index) + ": " +
              (reason.IsSet() ? reason.ToString() : endpoints_.WhyLeftOut(index, now.steady));
    }
  }
  const Failure& last = request.lastFailure;
  return Combine(last, text).WithKind(last.IsSet() ? last.Kind() : FailureKind::kUnreachable);
}

void Core::Fail(Section& section, const RequestPtr& request, const Failure& failure,
                const Instant& now) noexcept {
  GiveAll(section, request, failure);
  Detach(section, request);
  ScheduleAfterFailure(section, *request, failure, now);
}

// The request ends, or is left to its thread. Nobody waits for it any more.
void Core::Detach(Section& section, const RequestPtr& request) noexcept {
  if (std::exchange(request->hasEnded, true)) {
    return;
  }
  const auto found = requests_.find(request->key);
  if (found != requests_.end() && found->second == request) {
    requests_.erase(found);
  }
  ReturnPlaces(section, request);
  // An attempt under way has the gate until it has ended.
  if (request->limit == nullptr) {
    WithdrawFromGate(section, request);
  } else {
    request->isVerdictLost = MayHaveSent(request->limit->Stage());
  }
  section.End(request);
  if (request->isBackground) {
    --backgroundRequests_;
    ArmTimer(section);
  }
}

}  // namespace SsoClient::Access
