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

GrantedPeriod PeriodOf(const SamlToken& token, milliseconds clockOffset) {
  return {std::chrono::microseconds(token.StartTime().GetUtcTime()),
          std::chrono::microseconds(token.ExpirationTime().GetUtcTime()), clockOffset};
}

std::string Reason(const AttemptOutcome& outcome) {
  return std::string(NameOf(outcome.kind)) + ": " + outcome.message;
}

// An exception of the class of `last` for several endpoints.
Failure Combine(const Failure& last, const std::string& text) {
  const bool isOther = last.IsSet() && last.Kind() != FailureKind::kUnreachable;
  return isOther ? Failure::Of(SsoException(text)) : Failure::Of(CommunicationException(text));
}

}  // namespace

// Returns whether another attempt follows at once.
bool Core::Conclude(const RequestPtr& request, Step& step, AttemptOutcome outcome) {
  Section section(*this);
  const Instant now = runtime_->Now();
  request->limit = nullptr;
  if (request->hasEnded && AllowsFailover(outcome.kind)) {
    outcome.kind = FailureKind::kAbandoned;
  }
  NoteOutcome(section, request, step, outcome, now);
  if (outcome.token != nullptr) {
    Accept(section, request, step, outcome, now);
    return false;
  }
  if (request->hasEnded) {
    return false;
  }
  return AllowsFailover(outcome.kind) ? GoOnAfterFailure(section, request, step, outcome, now)
                                      : GoOnAfterDecision(section, request, step, outcome, now);
}

void Core::NoteOutcome(Section& section, const RequestPtr& request, const Step& step,
                       const AttemptOutcome& outcome, const Instant& now) {
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
    section.Circuit(endpoints_.OnFailure(step.endpoint, Reason(outcome), outcome.retryAfter,
                                         now.steady, runtime_->Draw()));
  } else {
    section.Circuit(endpoints_.OnAbandoned(step.endpoint, request->hasWaitedInVain));
  }
  const Failure refusal = IsRefusal(outcome.kind) ? Failure(outcome.failure) : Failure();
  LeaveGate(section, request, VerdictOf(outcome.kind), refusal, now);
  NoteClock(section, step, outcome);
  counters_.CountAttempt(outcome.kind);
  AttemptRecord record = step.record;
  record.duration = std::chrono::duration_cast<std::chrono::microseconds>(now.steady - step.begun);
  record.failure = outcome.kind;
  record.message = outcome.message;
  record.httpStatus = outcome.httpStatus;
  section.ToListener([record](AccessListener& listener) { listener.OnAttemptEnded(record); });
}

LoginVerdict Core::VerdictOf(FailureKind kind) const noexcept {
  if (kind == FailureKind::kNone) {
    return LoginVerdict::kAccepted;
  }
  return IsRefusal(kind) ? LoginVerdict::kRefused : LoginVerdict::kUndecided;
}

void Core::NoteClock(Section& section, const Step& step, const AttemptOutcome& outcome) {
  if (!outcome.clockOffset || !endpoints_.SetClockOffset(step.endpoint, *outcome.clockOffset)) {
    return;
  }
  const ClockRecord record{config_->name, endpoints_.Url(step.endpoint), *outcome.clockOffset};
  section.ToListener([record](AccessListener& listener) { listener.OnClock(record); });
}

void Core::Accept(Section& section, const RequestPtr& request, const Step& step,
                  const AttemptOutcome& outcome, const Instant& now) {
  counters_.CountSuccess(step.operation);
  if (state_ != State::kRunning) {
    return;
  }
  for (DeviationRecord deviation : outcome.deviations) {
    counters_.deviations.Add();
    deviation.source = config_->name;
    deviation.endpoint = endpoints_.Url(step.endpoint);
    section.ToListener([deviation](AccessListener& listener) { listener.OnDeviation(deviation); });
  }
  const TokenLife life = PlanTokenLife(
      config_->refresh, PeriodOf(*outcome.token, endpoints_.ClockOffset(step.endpoint)), now,
      runtime_->Draw());
  if (life.granted <= std::chrono::microseconds(0)) {
    if (!request->hasEnded) {
      const SsoException ended("The service issued a token that has ended already.");
      Fail(section, request, Failure::Copy(ended), FailureKind::kBadToken, now);
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

bool Core::GoOnAfterFailure(Section& section, const RequestPtr& request, const Step& step,
                            const AttemptOutcome& outcome, const Instant& now) {
  request->asked[step.endpoint] = true;
  request->reasons[step.endpoint] = Reason(outcome);
  request->lastFailure = Failure(outcome.failure);
  request->lastKind = outcome.kind;
  request->retryAfter = outcome.retryAfter;
  if (++request->undecided < AttemptLimit(*request) &&
      endpoints_.CanAdmit(request->asked, now.steady)) {
    return true;
  }
  EndRound(section, request, now);
  return false;
}

bool Core::GoOnAfterDecision(Section& section, const RequestPtr& request, const Step& step,
                             const AttemptOutcome& outcome, const Instant& now) {
  if (step.operation == AttemptOperation::kRenewal) {
    request->mayRenew = false;
    return true;
  }
  if (step.operation == AttemptOperation::kExchange && IsRefusal(outcome.kind)) {
    const auto& source = std::get<TokenLogin>(config_->login).source;
    section.Do([source, base = step.base] { source->Invalidate(*base); });
    if (!std::exchange(request->hasReplacedBase, true)) {
      request->base = nullptr;
      return true;
    }
    std::erase_if(refusedExchanges_,
                  [&now](const auto& item) { return now.steady >= item.second.until; });
    refusedExchanges_[request->key] = {Failure(outcome.failure),
                                       now.steady + config_->retry.refusalMemory};
  }
  Fail(section, request, Failure(outcome.failure), outcome.kind, now);
  return false;
}

// A refresh that nobody waits for asks each endpoint once, and is repeated later.
int Core::AttemptLimit(const Request& request) const {
  const int attempts = config_->retry.attempts;
  return request.waiters.empty() ? std::min(attempts, static_cast<int>(endpoints_.Size()))
                                 : attempts;
}

void Core::EndRound(Section& section, const RequestPtr& request, const Instant& now) {
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

void Core::Pause(Section& section, const RequestPtr& request, Instant::Steady until) {
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
    Fail(section, request, Failure::Current(), FailureKind::kLocal, runtime_->Now());
    return;
  }
  ++request->rounds;
  request->asked.assign(endpoints_.Size(), false);
  request->base = nullptr;
  request->stage = "the next attempt";
}

void Core::Resume(const RequestPtr& request) noexcept {
  Section section(*this);
  if (std::exchange(request->pause, nullptr) != nullptr && !request->hasEnded) {
    section.Start(request);
  }
}

void Core::FailUndecided(Section& section, const RequestPtr& request, const Instant& now) {
  const FailureKind kind =
      request->lastFailure.IsSet() ? request->lastKind : FailureKind::kUnreachable;
  if (endpoints_.Size() == 1 && request->lastFailure.IsSet()) {
    Fail(section, request, request->lastFailure, kind, now);
    return;
  }
  std::string text = "No endpoint has given a token.";
  for (EndpointSet::Index index = 0; index < endpoints_.Size(); ++index) {
    const std::string& reason = request->reasons[index];
    const bool isLeftOut = !endpoints_.CanAdmit(index, now.steady);
    if (!reason.empty() || isLeftOut) {
      text += " " + endpoints_.Url(index) + ": " +
              (reason.empty() ? endpoints_.WhyLeftOut(index, now.steady) : reason);
    }
  }
  Fail(section, request, Combine(request->lastFailure, text), kind, now);
}

void Core::Fail(Section& section, const RequestPtr& request, const Failure& failure,
                FailureKind kind, const Instant& now) {
  GiveAll(section, request, failure);
  Detach(section, request);
  ScheduleAfterFailure(section, *request, failure, kind, now);
}

// The request ends, or is left to its thread. Nobody waits for it any more.
void Core::Detach(Section& section, const RequestPtr& request) {
  if (std::exchange(request->hasEnded, true)) {
    return;
  }
  const auto found = requests_.find(request->key);
  if (found != requests_.end() && found->second == request) {
    requests_.erase(found);
  }
  // An attempt under way has the gate until it has ended.
  if (request->limit == nullptr) {
    section.Start(gate_.Withdraw(request));
    request->gate.reset();
  }
  section.Cancel(request->limit);
  section.Cancel(std::exchange(request->pause, nullptr));
  if (std::holds_alternative<TokenLogin>(config_->login)) {
    section.Do([request] { request->cancellation.Cancel(); });
  }
  if (request->isBackground) {
    --backgroundRequests_;
    ArmTimer(section);
  }
}

}  // namespace SsoClient::Access
