#include <optional>
#include <utility>

#include "core.h"
#include "section.h"

namespace SsoClient::Access {

// As many calls of the login's function may run as attempts. False when the request has to wait.
bool Core::EnterFunction(const RequestPtr& request) {
  const bool hasPlace = std::exchange(request->hasPlaceOfFunction, false);
  if (!hasPlace && functionsUnderWay_ >= config_->retry.attemptsAtOnce) {
    turnsOfFunction_.Add(request->turnOfFunction, request);
    request->stage = Stage::kTurnOfFunction;
    return false;
  }
  functionsUnderWay_ += hasPlace ? 0 : 1;
  request->stage = Stage::kFunction;
  return true;
}

// Passes a place among the calls of the login's function to the first that waits for one.
void Core::ReturnFunction(Section& section) noexcept {
  bool isPassedOn = false;
  turnsOfFunction_.ForEach([&](const RequestPtr& request) {
    if (isPassedOn) {
      return TurnQueue::Decision::kStop;
    }
    isPassedOn = true;
    request->turnOfFunction.reset();
    request->hasPlaceOfFunction = true;
    section.Start(request);
    return TurnQueue::Decision::kTake;
  });
  functionsUnderWay_ -= isPassedOn ? 0 : 1;
}

// A refresh returns to the first endpoint when a failure there does no harm: it is the first
// attempt to refresh the token, nobody waits, and the token outlasts it.
EndpointSet::Order Core::OrderFor(const Request& request, const Instant& now) noexcept {
  const RefreshSchedule::Item* item = schedule_.Find(request.key);
  const EntryPtr entry = cache_.Peek(SpecView(*request.key));
  const bool isHarmless =
      request.isBackground && request.undecided == 0 && request.waiters.empty() &&
      entry != nullptr && item != nullptr && item->failures == 0 &&
      entry->Life().usableUntil.steady - now.steady > config_->retry.attemptTimeout;
  return isHarmless ? EndpointSet::Order::kAsListed : EndpointSet::Order::kPreferredFirst;
}

// Makes sure that the request has a place at an endpoint that it may ask. False when it has to
// wait, or its round has ended.
bool Core::TakePlace(Section& section, const RequestPtr& request, const Instant& now) {
  if (request->place &&
      (request->asked[*request->place] || !endpoints_.CanAdmit(*request->place, now.steady))) {
    ReturnPlace(section, request);
  }
  if (!request->place) {
    // Those that came first, if an endpoint has become usable by the passing of time.
    ServeTurns(section, now);
    request->order = OrderFor(*request, now);
    request->place = endpoints_.TakePlace(request->asked, now.steady, request->order);
  }
  if (request->place) {
    return true;
  }
  if (endpoints_.CanAdmit(request->asked, now.steady)) {
    turns_.Add(request->turn, request);
    request->stage = Stage::kTurn;
    return false;
  }
  WithdrawFromGate(section, request);
  EndRound(section, request, now);
  return false;
}

// All that is kept for a request that has ended.
void Core::ReturnPlaces(Section& section, const RequestPtr& request) noexcept {
  turns_.Remove(request->turn);
  turnsOfFunction_.Remove(request->turnOfFunction);
  ReturnPlace(section, request);
  if (std::exchange(request->hasPlaceOfFunction, false)) {
    ReturnFunction(section);
  }
}

void Core::ReturnPlace(Section& section, const RequestPtr& request) noexcept {
  if (request->place) {
    endpoints_.ReturnPlace(*std::exchange(request->place, std::nullopt));
    ServeTurns(section, runtime_->Now());
  }
}

// Gives the free places to those that wait, first come first served. They keep them until their
// attempts begin, so that nobody overtakes them.
void Core::ServeTurns(Section& section, const Instant& now) noexcept {
  turns_.ForEach([&](const RequestPtr& request) {
    if (!endpoints_.HasPlace(now.steady)) {
      return TurnQueue::Decision::kStop;
    }
    request->order = OrderFor(*request, now);
    request->place = endpoints_.TakePlace(request->asked, now.steady, request->order);
    if (!request->place) {
      return TurnQueue::Decision::kKeep;
    }
    request->turn.reset();
    section.Start(request);
    return TurnQueue::Decision::kTake;
  });
}

// Runs those that wait for endpoints that are now left out, so that they fail or pause.
void Core::WakeHopeless(Section& section, const Instant& now) noexcept {
  turns_.ForEach([&](const RequestPtr& request) {
    if (endpoints_.CanAdmit(request->asked, now.steady)) {
      return TurnQueue::Decision::kKeep;
    }
    request->turn.reset();
    section.Start(request);
    return TurnQueue::Decision::kTake;
  });
}

}  // namespace SsoClient::Access
