#include "core.h"

#include <algorithm>
#include <utility>

#include <ssoclient/exceptions.h>
#include <tarnik/system/thread_pool.h>

#include "config_check.h"
#include "section.h"

namespace SsoClient::Access {

namespace {

Failure StoppedFailure() {
  return Failure::Of(Tarnik::InvalidStateException("The token source has been stopped."));
}

Failure ProcessEndFailure() {
  return Failure::Of(CommunicationException("The process is ending."));
}

// Beside those that are never evicted, there is room for one.
std::size_t CapacityFor(const TokenSourceConfig& config) {
  return std::max(config.cache.capacity, config.keepFresh.size() + 1);
}

}  // namespace

std::shared_ptr<Core> Core::Create(Parts parts) {
  auto core = std::make_shared<Core>(std::move(parts));
  core->KeepFresh();
  return core;
}

Core::Core(Parts parts)
    : config_(std::move(parts.config)),
      runtime_(std::move(parts.runtime)),
      activity_(std::make_shared<Activity>()),
      stopped_(StoppedFailure()),
      processEnding_(ProcessEndFailure()),
      refused_(Failure::Of(InvalidCredentialsException("The service has refused the login."))),
      expired_(Failure::Of(PasswordExpiredException("The password has expired."))),
      cache_(CapacityFor(*config_)),
      endpoints_(config_->retry, std::move(parts.clients)),
      gate_(config_->retry, std::holds_alternative<PasswordLogin>(config_->login)),
      refusedSpecs_(config_->cache.capacity, config_->retry.refusalMemory) {}

Core::~Core() = default;

void Core::RequireRunning() const {
  switch (state_.load(std::memory_order_acquire)) {
    case State::kRunning:
      return;
    case State::kStopped:
      stopped_.Throw();
    case State::kProcessEnding:
      processEnding_.Throw();
  }
}

void Core::CheckContext(const CallContext& context, const Instant& now) const {
  if (context.cancellation.IsCancelled()) {
    Failure::Cancelled().Throw();
  }
  if (context.deadline <= now.steady) {
    throw Tarnik::InvalidArgumentException("The deadline of the call is in the past.");
  }
  if (context.minimumLife < std::chrono::seconds(0)) {
    throw Tarnik::InvalidArgumentException("The minimum life of the token is negative.");
  }
}

TokenCache::Hit Core::FindHit(const TokenSpec& spec, const CallContext& context) {
  RequireRunning();
  const Instant now = runtime_->Now();
  CheckContext(context, now);
  CheckSpec(spec, config_->login);
  TokenCache::Hit hit = cache_.Find(SpecView(spec), now, context.minimumLife);
  if (hit.token == nullptr) {
    CheckTexts(spec);
  } else if (hit.wantsRefresh) {
    RefreshLate(spec);
  }
  return hit;
}

std::shared_ptr<const SamlToken> Core::GetToken(const TokenSpec& spec, const CallContext& context) {
  if (TokenCache::Hit hit = FindHit(spec, context); hit.token != nullptr) {
    return std::move(hit.token);
  }
  const auto caller = std::make_shared<BlockedCaller>(context);
  Wait(spec, caller);
  Answer answer = caller->Wait();
  if (answer.failure.IsSet()) {
    answer.failure.Throw();
  }
  return std::move(answer.token);
}

std::shared_ptr<const SamlToken> Core::TryGetToken(const TokenSpec& spec) {
  return FindHit(spec, {}).token;
}

void Core::GetTokenAsync(const TokenSpec& spec, const CallContext& context,
                         TokenSource::TokenCallback callback) {
  if (!callback) {
    throw Tarnik::InvalidArgumentException("The callback is empty.");
  }
  GetAnswerAsync(spec, context, [callback = std::move(callback)](const Answer& answer) {
    const auto failure = answer.failure.IsSet() ? answer.failure.ForCallback() : nullptr;
    callback(answer.token, failure.get());
  });
}

void Core::GetAnswerAsync(const TokenSpec& spec, const CallContext& context,
                          AnswerCallback callback) {
  const auto caller =
      std::make_shared<CallbackCaller>(context, std::move(callback), runtime_, activity_);
  Answer answer;
  try {
    answer.token = FindHit(spec, context).token;
  } catch (const Tarnik::Exception& refusal) {
    answer.failure = Failure::Copy(refusal);
  }
  if (answer.token != nullptr || answer.failure.IsSet()) {
    caller->ReceiveOrThrow(std::move(answer));
    return;
  }
  Wait(spec, caller);
}

void Core::RefreshLate(const TokenSpec& spec) noexcept {
  try {
    Section section(*this);
    const EntryPtr entry = cache_.Peek(SpecView(spec));
    if (state_ == State::kRunning && entry != nullptr) {
      schedule_.Set(entry->Key(), runtime_->Now().steady);
      ArmTimer(section);
    }
  } catch (...) {
    // The token is valid, and is refreshed by a later call when it has ended.
  }
}

void Core::Invalidate(const SamlToken& token) {
  const auto self = shared_from_this();  // as in `Wait`
  Section section(*this);
  EntryPtr refused;
  cache_.ForEach([&](const EntryPtr& entry) {
    if (entry->Token().get() == &token ||
        (entry->Token()->Id() == token.Id() && entry->Token()->Xml() == token.Xml())) {
      refused = entry;
    }
  });
  if (refused == nullptr) {
    return;
  }
  section.Keep(refused);
  cache_.Remove(SpecView(*refused->Key()));
  if (IsPinned(refused->Key())) {
    // The pause between background requests is for those that nobody has asked for.
    schedule_.Set(refused->Key(), runtime_->Now().steady).notBefore = Instant::Steady::min();
    ArmTimer(section);
  } else {
    schedule_.Remove(refused->Key());
  }
}

TokenSourceMetrics Core::Metrics() const {
  TokenSourceMetrics metrics;
  counters_.CopyTo(metrics);
  metrics.hits = cache_.Hits();
  const std::lock_guard lock(mutex_);
  metrics.keys = cache_.Size();
  metrics.callersWaiting = waiting_;
  cache_.ForEach([&metrics](const EntryPtr& entry) {
    const Tarnik::System::DateTime end = entry->Token()->ExpirationTime();
    if (!metrics.earliestExpiration || end < *metrics.earliestExpiration) {
      metrics.earliestExpiration = end;
    }
  });
  return metrics;
}

bool Core::Stop(std::chrono::milliseconds wait) {
  const auto self = shared_from_this();  // as in `Wait`
  EndAll(State::kStopped, stopped_);
  // The pool runs nothing more then.
  const bool isPoolStopped = Tarnik::System::IsProcessEnding();
  return activity_->WaitUntilIdle(isPoolStopped ? std::chrono::milliseconds(0) : wait);
}

void Core::EndProcess() noexcept {
  EndAll(State::kProcessEnding, processEnding_);
}

void Core::WaitUntil(Instant::Steady time) noexcept {
  try {
    const auto left = time - std::chrono::steady_clock::now();
    activity_->WaitUntilIdle(std::chrono::ceil<std::chrono::milliseconds>(left));
  } catch (...) {
    // The pool ends what is under way.
  }
}

void Core::EndAll(State state, const Failure& failure) noexcept {
  Section section(*this);
  if (state_ != State::kRunning) {
    return;
  }
  state_.store(state, std::memory_order_release);
  while (!requests_.empty()) {
    const RequestPtr request = requests_.begin()->second;
    GiveAll(section, request, failure);
    Detach(section, request);
  }
  schedule_.Clear();
  section.Cancel(std::exchange(timer_, nullptr));
  cache_.ForEach([&section](const EntryPtr& entry) { section.Keep(entry); });
  cache_.Clear();
  section.Keep(std::exchange(knownBase_, nullptr));
}

}  // namespace SsoClient::Access
