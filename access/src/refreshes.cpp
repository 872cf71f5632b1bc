#include <algorithm>
#include <memory>
#include <utility>

#include "backoff.h"
#include "core.h"
#include "section.h"

namespace SsoClient::Access {

namespace {

using std::chrono::milliseconds;

// Refreshes must not take the threads that callers need.
constexpr std::size_t kMaxBackgroundRequests = 8;
// Each is then due later, or is no longer due; the timer fires again for the rest.
constexpr std::size_t kKeysAtOnce = 64;
// Between looks at a key, and between the background requests of one.
constexpr std::chrono::seconds kNextLook{1};
constexpr std::chrono::minutes kLookAfterEnd{10};
// As often as in an outage at most, when a service answers some requests and not others.
constexpr std::chrono::seconds kBetweenWakes{30};

// When the act-as token of a spec ends, nothing may be requested with it any more.
bool HasActAsEnded(const TokenSpec& spec, const Instant& now) {
  const auto wall =
      std::chrono::duration_cast<std::chrono::microseconds>(now.wall.time_since_epoch());
  return spec.actAsToken && (*spec.actAsToken)->ExpirationTime().GetUtcTime() <= wall.count();
}

Tarnik::System::DateTime ToDateTime(Instant::Wall time) {
  const auto sinceEpoch =
      std::chrono::duration_cast<std::chrono::microseconds>(time.time_since_epoch());
  return Tarnik::System::DateTimeFromUtc(sinceEpoch.count(), false);
}

}  // namespace

void Core::KeepFresh() {
  Section section(*this);
  const Instant now = runtime_->Now();
  for (const TokenSpec& spec : config_->keepFresh) {
    schedule_.Set(MakeKey(spec), now.steady).isPinned = true;
  }
  ArmTimer(section);
}

// The timer has fired.
void Core::RunDue() noexcept {
  Section section(*this);
  timer_ = nullptr;
  timerAt_ = Instant::Steady::max();
  if (state_ != State::kRunning) {
    return;
  }
  const Instant now = runtime_->Now();
  try {
    LookAtDue(section, now);
    ArmTimer(section);
  } catch (const std::exception&) {
    // No memory. What is left is due a little later.
    ArmTimer(section, now.steady + kNextLook);
  }
}

void Core::LookAtDue(Section& section, const Instant& now) {
  for (const KeyPtr& key : schedule_.Due(now.steady, kKeysAtOnce)) {
    if (backgroundRequests_ == kMaxBackgroundRequests) {
      break;
    }
    LookAt(section, key, now);
  }
}

void Core::LookAt(Section& section, const KeyPtr& key, const Instant& now) {
  const bool isPinned = IsPinned(key);
  EntryPtr entry = cache_.Peek(SpecView(*key));
  if (entry != nullptr && entry->Life().HasEnded(now)) {
    cache_.Remove(SpecView(*key));
    section.Keep(std::exchange(entry, nullptr));
  }
  const bool hasActAsEnded = HasActAsEnded(key->spec, now);
  if (entry == nullptr && !isPinned) {
    schedule_.Remove(key);
    return;
  }
  if (entry == nullptr && hasActAsEnded) {
    // The clock may be set back.
    schedule_.Set(key, now.steady + kLookAfterEnd);
    return;
  }
  if (requests_.find(key) != requests_.end()) {
    schedule_.Set(key, now.steady + kNextLook);
    return;
  }
  if (hasActAsEnded || (!isPinned && !entry->IsAsked())) {
    schedule_.Set(key, entry->Life().end.steady);
    return;
  }
  RefreshSchedule::Item& item = *schedule_.Find(key);
  if (now.steady < item.notBefore) {
    schedule_.Set(key, item.notBefore);
    return;
  }
  RefreshInBackground(section, key);
  item.notBefore = now.steady + kNextLook;
  // The end of the request sets another time, unless there is no memory for a timer then.
  Instant::Steady next = now.steady + config_->retry.longestDelay + kNextLook;
  if (entry != nullptr) {
    next = std::min(next, std::max(entry->Life().end.steady, now.steady + kNextLook));
  }
  schedule_.Set(key, next);
}

void Core::RefreshInBackground(Section& section, const KeyPtr& key) {
  const auto request = std::make_shared<Request>(key, true, endpoints_.Size());
  requests_.emplace(key, request);
  ++backgroundRequests_;
  section.Start(request);
}

EntryPtr Core::Store(Section& section, const KeyPtr& key,
                     const std::shared_ptr<const SamlToken>& token, const TokenLife& life,
                     const Instant& now) {
  const EntryPtr old = cache_.Peek(SpecView(*key));
  if (old != nullptr && old->Life().IsUsable(now, std::chrono::seconds(0)) &&
      life.end.steady < old->Life().end.steady) {
    return KeepLonger(section, old, now);
  }
  section.Keep(old);
  auto entry = std::make_shared<CacheEntry>(key, token, life, now);
  // First, since a time for a token that is not in the cache does no harm.
  RefreshSchedule::Item& item = schedule_.Set(key, life.refreshAt);
  const EntryPtr evicted =
      cache_.Insert(entry, [this](const KeyPtr& other) { return IsPinned(other); });
  item.failures = 0;
  item.isOutage = false;
  if (evicted != nullptr) {
    section.Keep(evicted);
    counters_.evictions.Add();
    schedule_.Remove(evicted->Key());
  }
  ArmTimer(section);
  return entry;
}

// The answer to a request that was abandoned may be older than the token in the cache, and a
// service may grant less than before. The next refresh is in the middle of what is left.
EntryPtr Core::KeepLonger(Section& section, const EntryPtr& entry, const Instant& now) {
  const auto left = entry->Life().end.steady - now.steady;
  RefreshSchedule::Item& item = schedule_.Set(entry->Key(), now.steady + left / 2);
  item.failures = 0;
  item.isOutage = false;
  ArmTimer(section);
  return entry;
}

void Core::ScheduleAfterFailure(Section& section, const Request& request, const Failure& failure,
                                const Instant& now) noexcept {
  RefreshSchedule::Item* item = schedule_.Find(request.key);
  if (item == nullptr || !request.isBackground) {
    return;
  }
  counters_.refreshFailures.Add();
  ++item->failures;
  item->isOutage = AllowsFailover(failure.Kind());
  Instant::Steady next =
      now.steady + Backoff(config_->retry, item->failures, milliseconds(0), runtime_->Draw());
  if (item->isOutage) {
    next = std::max(next, endpoints_.EarliestAdmission());
    nextWake_ = std::min(nextWake_, item->nextWake);
  }
  const EntryPtr entry = cache_.Peek(SpecView(*request.key));
  if (entry != nullptr) {
    next = std::min(next, std::max(entry->Life().end.steady, now.steady));
  }
  next = std::max(next, item->notBefore);
  schedule_.Set(request.key, next);
  ArmTimer(section);
  section.ToListener([&] {
    RefreshFailureRecord record;
    record.source = config_->name;
    record.failure = failure.Kind();
    record.message = failure.RecordText();
    if (entry != nullptr) {
      record.usableUntil = ToDateTime(entry->Life().usableUntil.wall);
    }
    record.nextAttempt = std::chrono::ceil<milliseconds>(next - now.steady);
    return Section::Report(
        [record](AccessListener& listener) { listener.OnRefreshFailed(record); });
  });
}

// An endpoint has answered. What waits for that goes on, spread a little. An outage that has opened
// circuits `isOver` when one closes. Without that, others may still be failing, so that nothing is
// woken again soon.
void Core::EndOutage(Section& section, const Instant& now, bool isOver) noexcept {
  if (!isOver && now.steady < nextWake_) {
    return;
  }
  nextWake_ = Instant::Steady::max();
  const auto isWoken = [&](Instant::Steady& nextWake) {
    if (!isOver && now.steady < nextWake) {
      nextWake_ = std::min(nextWake_, nextWake);
      return false;
    }
    nextWake = now.steady + kBetweenWakes;
    return true;
  };
  for (const auto& [key, request] : requests_) {
    if (request->pause != nullptr && isWoken(request->nextWake)) {
      section.Cancel(std::exchange(request->pause, nullptr));
      section.Start(request);
    }
  }
  schedule_.ForEachInOutage([&](const KeyPtr& key, RefreshSchedule::Item& item) {
    if (!isWoken(item.nextWake)) {
      return;
    }
    item.isOutage = false;
    item.failures = isOver ? 0 : item.failures;
    const auto spread = std::chrono::duration_cast<milliseconds>(
        runtime_->Draw() * std::chrono::duration<double, std::milli>(config_->retry.firstDelay));
    schedule_.Set(key, std::min(item.at, now.steady + spread));
  });
  ArmTimer(section);
}

// The timer fires when the first key is due, but not before `earliest`.
void Core::ArmTimer(Section& section, Instant::Steady earliest) noexcept {
  const auto first = schedule_.Earliest();
  // The end of a background request arms the timer.
  if (!first || state_ != State::kRunning || backgroundRequests_ >= kMaxBackgroundRequests) {
    return;
  }
  const Instant::Steady at = std::max(*first, earliest);
  if (timer_ != nullptr && timerAt_ <= at) {
    return;
  }
  try {
    auto timer = runtime_->RunAt(at, [core = weak_from_this()] {
      if (const auto self = core.lock()) {
        self->RunDue();
      }
    });
    section.Cancel(std::exchange(timer_, std::move(timer)));
    timerAt_ = at;
  } catch (...) {
    // The timer stays as it is. The next change of the schedule, or the next request, tries again.
  }
}

bool Core::IsPinned(const KeyPtr& key) noexcept {
  const RefreshSchedule::Item* item = schedule_.Find(key);
  return item != nullptr && item->isPinned;
}

}  // namespace SsoClient::Access
