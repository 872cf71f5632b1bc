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

GrantedPeriod PeriodOf(const SamlToken& token, milliseconds clockOffset) {
  return {std::chrono::microseconds(token.StartTime().GetUtcTime()),
          std::chrono::microseconds(token.ExpirationTime().GetUtcTime()), clockOffset};
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
  if (result.outcome.token != nullptr) {
    Accept(section, request, step, result.outcome, now);
    return false;
  }
  if (request->hasEnded) {
    return false;
  }
  return AllowsFailover(result.outcome.kind)
             ? GoOnAfterFailure(section, request, step, result, now)
             : GoOnAfterDecision(section, request, step, result, now);
}

void Core::NoteOutcome(Section& section, const RequestPtr& request, Step& step, Result& result,
                       const Instant& now) noexcept {
  AttemptOutcome& outcome = result.outcome;
  NoteCircuit(section, request, step, result, now);
  LeaveGate(section, request, VerdictOf(outcome.kind), result.refusal, now);
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
void Core::NoteCircuit(Section& section, const RequestPtr& request, const Step& step,
                       const Result& result, const Instant& now) noexcept {
  const AttemptOutcome& outcome = result.outcome;
  endpoints_.ReturnPlace(step.endpoint);
  if (IsAnswer(outcome.kind)) {
    // A service that is back, but refuses, is not preferred: the next attempt begins elsewhere.
    const bool isPreferred =
        outcome.token != nullptr || step.order == EndpointSet::Order::kPreferredFirst;
    const EndpointSet::Change change = endpoints_.OnAnswer(step.endpoint, isPreferred);
    section.Circuit(change);
    if (change) {
      EndOutage(section, now);
    }
  } else if (AllowsFailover(outcome.kind)) {
    section.Circuit(endpoints_.OnFailure(step.endpoint, result.reason, outcome.retryAfter,
                                         now.steady, runtime_->Draw()));
    WakeHopeless(section, now);
  } else {
    section.Circuit(endpoints_.OnAbandoned(step.endpoint, request->hasWaitedInVain));
  }
  ServeTurns(section, now);
}

LoginVerdict Core::VerdictOf(FailureKind kind) const noexcept {
  if (kind == FailureKind::kNone) {
    return LoginVerdict::kAccepted;
  }
  return IsRefusal(kind) ? LoginVerdict::kRefused : LoginVerdict::kUndecided;
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

void Core::Accept(Section& section, const RequestPtr& request, const Step& step,
                  const AttemptOutcome& outcome, const Instant& now) {
  counters_.CountSuccess(step.operation);
  if (state_ != State::kRunning) {
    return;
  }
  ReportDeviations(section, step, outcome);
  const TokenLife life = PlanTokenLife(
      config_->refresh, PeriodOf(*outcome.token, endpoints_.ClockOffset(step.endpoint)), now,
      runtime_->Draw());
  if (life.granted <= std::chrono::microseconds(0)) {
    if (!request->hasEnded) {
      const Failure ended =
          Failure::Of(SsoException("The service issued a token that has ended already."));
      Fail(section, request, ended.WithKind(FailureKind::kBadToken), now);
    }
    return;
  }
  refusedExchanges_.erase(request->key);
  const EntryPtr entry = Store(section, request->key, outcome.token, life, now);
  if (!request->hasEnded) {
    GiveAll(section, request, *entry, now);
    Detach(section, request);
  }
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
  request->asked[step.endpoint] = true;
  request->reasons[step.endpoint] = result.reason;
  request->lastFailure = result.failure;
  request->retryAfter = result.outcome.retryAfter;
  if (++request->undecided < AttemptLimit(*request) &&
      endpoints_.CanAdmit(request->asked, now.steady)) {
    return true;
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
  if (step.operation == AttemptOperation::kExchange && IsRefusal(result.outcome.kind)) {
    step.isBaseRefused = true;
    if (!std::exchange(request->hasReplacedBase, true)) {
      request->base = nullptr;
      return true;
    }
    RememberRefusedExchange(request->key, result.failure, now);
  }
  Fail(section, request, result.failure, now);
  return false;
}

// Without memory, it is asked for once more.
void Core::RememberRefusedExchange(const KeyPtr& key, const Failure& failure,
                                   const Instant& now) noexcept {
  std::erase_if(refusedExchanges_,
                [&now](const auto& item) { return now.steady >= item.second.until; });
  try {
    refusedExchanges_[key] = {failure, now.steady + config_->retry.refusalMemory};
  } catch (const std::bad_alloc&) {
  }
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
  const auto admission = endpoints_.ClosedAdmission();
  if (!hasAsked || !admission || request->undecided >= AttemptLimit(*request)) {
    FailUndecided(section, request, now);
    return;
  }
  const milliseconds pause =
      Backoff(config_->retry, request->rounds, request->retryAfter, runtime_->Draw());
  Pause(section, request, std::max(now.steady + pause, *admission));
}

void Core::Pause(Section& section, const RequestPtr& request, Instant::Steady until) noexcept {
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
    return;
  }
  ++request->rounds;
  std::fill(request->asked.begin(), request->asked.end(), false);
  request->base = nullptr;
  request->stage = Stage::kPause;
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
  }
  section.End(request);
  if (request->isBackground) {
    --backgroundRequests_;
    ArmTimer(section);
  }
}

}  // namespace SsoClient::Access
