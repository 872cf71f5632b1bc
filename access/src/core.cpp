#include "core.h"

#include <algorithm>
#include <string>
#include <utility>

#include <ssoclient/exceptions.h>
#include <tarnik/system/thread_pool.h>

#include "config_check.h"
#include "section.h"
#include "stage.h"

namespace SsoClient::Access {

namespace {

Failure StoppedFailure() {
  return Failure::Of(Tarnik::InvalidStateException("The token source has been stopped."));
}

Failure ProcessEndFailure() {
  return Failure::Of(CommunicationException("The process is ending."));
}

Failure CancelledFailure() {
  return Failure::Of(Tarnik::CancelledException("The call was cancelled by its caller."));
}

Failure TooShortFailure(std::chrono::microseconds granted, std::chrono::seconds minimumLife) {
  const auto seconds = std::chrono::duration_cast<std::chrono::seconds>(granted);
  return Failure::Of(SsoException("The service grants " + std::to_string(seconds.count()) +
                                  " s, but the caller needs a token for " +
                                  std::to_string(minimumLife.count()) + " s."));
}

// Beside those that are never evicted, there is room for one.
std::size_t CapacityFor(const TokenSourceConfig& config) {
  return std::max(config.cache.capacity, config.keepFresh.size() + 1);
}

// The exchange under way of a request that waits for an attempt.
Tarnik::Http::ExchangeStage ExchangeStageOf(const Request& request) noexcept {
  return request.limit == nullptr ? Tarnik::Http::ExchangeStage::kNone : request.limit->Stage();
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
    CancelledFailure().Throw();
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

void Core::Wait(const TokenSpec& spec, const WaiterPtr& waiter) {
  // A callback may release the last reference before this returns.
  const auto self = shared_from_this();
  const CancellationToken& token = waiter->Context().cancellation;
  // Before the waiter joins, its function does nothing.
  waiter->cancellation = token.OnCancel([core = weak_from_this(), weak = std::weak_ptr(waiter)] {
    const auto cancelled = core.lock();
    const auto left = weak.lock();
    if (cancelled != nullptr && left != nullptr) {
      cancelled->Leave(left, Leaving::kCancelled);
    }
  });
  Joined joined = TryJoin(spec, waiter);
  if (joined.begun != nullptr) {
    RunBegun(joined.begun, waiter);
  }
  if (!joined.answer && token.IsCancelled() && Withdraw(waiter)) {
    joined.answer = Answer{nullptr, CancelledFailure()};
  }
  if (joined.answer) {
    waiter->ReceiveOrThrow(std::move(*joined.answer));
  }
}

Core::Joined Core::TryJoin(const TokenSpec& spec, const WaiterPtr& waiter) {
  try {
    Section section(*this);
    return Join(section, spec, waiter);
  } catch (...) {
    // The waiter is not known to a request.
    if (const auto timer = std::exchange(waiter->deadlineTimer, nullptr)) {
      timer->Cancel();
    }
    throw;
  }
}

// Throws if the waiter, which has begun the request, was still waiting.
void Core::RunBegun(const RequestPtr& begun, const WaiterPtr& waiter) {
  try {
    Run(begun);
  } catch (...) {
    const bool wasWaiting = Withdraw(waiter);
    FailHere(begun, Failure::Current());  // for those who have joined
    if (wasWaiting) {
      throw;
    }
  }
}

Core::Joined Core::Join(Section& section, const TokenSpec& spec, const WaiterPtr& waiter) {
  if (state_ != State::kRunning) {
    return {nullptr, Answer{nullptr, state_ == State::kStopped ? stopped_ : processEnding_}};
  }
  const SpecView view(spec);
  if (auto answer = AnswerAtOnce(view, waiter, runtime_->Now())) {
    return {nullptr, std::move(answer)};
  }
  if (waiter->Context().deadline != CallContext::Clock::time_point::max()) {
    waiter->deadlineTimer = runtime_->RunAt(
        waiter->Context().deadline, [core = weak_from_this(), weak = std::weak_ptr(waiter)] {
          const auto self = core.lock();
          const auto left = weak.lock();
          if (self != nullptr && left != nullptr) {
            self->Leave(left, Leaving::kDeadline);
          }
        });
  }
  const auto found = requests_.find(view);
  const bool isNew = found == requests_.end();
  const RequestPtr request =
      isNew ? std::make_shared<Request>(MakeKey(spec), false, endpoints_.Size()) : found->second;
  if (isNew) {
    request->waiters.insert(waiter);
    requests_.emplace(request->key, request);
    // In case that there was no memory for the timer earlier.
    ArmTimer(section);
  } else {
    request->waiters.insert(waiter);
  }
  waiter->request = request;
  waiter->hasJoined = !isNew;
  ++waiting_;
  (isNew ? counters_.misses : counters_.shared).Add();
  return {isNew ? request : nullptr, boost::none};
}

boost::optional<Answer> Core::AnswerAtOnce(const SpecView& spec, const WaiterPtr& waiter,
                                           const Instant& now) {
  const std::chrono::seconds minimumLife = waiter->Context().minimumLife;
  // Another thread may have stored a token since this one has looked.
  if (TokenCache::Hit hit = cache_.Find(spec, now, minimumLife); hit.token != nullptr) {
    return Answer{std::move(hit.token), {}};
  }
  const EntryPtr entry = cache_.Peek(spec);
  if (entry != nullptr && !entry->Life().HasEnded(now) && !entry->Life().endsWithBase &&
      !entry->Life().IsGranted(minimumLife)) {
    return Answer{nullptr, TooShortFailure(entry->Life().granted, minimumLife)};
  }
  return boost::none;
}

// True when the waiter was still waiting; it then gets no answer.
bool Core::Withdraw(const WaiterPtr& waiter) noexcept {
  Tarnik::Ref<Tarnik::System::CancellableItem> timer;
  {
    Section section(*this);
    const RequestPtr request = std::exchange(waiter->request, nullptr);
    if (request == nullptr) {
      return false;
    }
    timer = std::exchange(waiter->deadlineTimer, nullptr);
    request->waiters.erase(waiter);
    --waiting_;
    if (request->waiters.empty() && !request->isBackground) {
      Abandon(section, request, Leaving::kCancelled);
    }
  }
  if (timer != nullptr) {
    timer->Cancel();
  }
  return true;
}

void Core::Leave(const WaiterPtr& waiter, Leaving why) noexcept {
  Section section(*this);
  const RequestPtr request = std::exchange(waiter->request, nullptr);
  if (request == nullptr) {
    return;
  }
  const bool isDeadline = why == Leaving::kDeadline;
  section.GiveAnswer(waiter, {nullptr, isDeadline ? DeadlineFailure(*request, *waiter)
                                                  : Failure::Made(CancelledFailure)});
  request->waiters.erase(waiter);
  --waiting_;
  if (request->waiters.empty() && !request->isBackground) {
    Abandon(section, request, why);
  }
}

Failure Core::DeadlineFailure(const Request& request, const Waiter& waiter) const noexcept {
  return Failure::Made([&] {
    std::string text = "The deadline passed while the call was waiting for ";
    if (waiter.hasJoined) {
      text += request.isBackground ? "a request of the source, which was waiting for "
                                   : "the request of another call, which was waiting for ";
    }
    text +=
        Describe(request.stage, endpoints_.Url(request.endpoint), ExchangeStageOf(request)) + ".";
    if (request.lastFailure.IsSet()) {
      text += " The last attempt had failed: " + request.lastFailure.RecordText();
    }
    return Failure::Of(CommunicationException(text));
  });
}

// Nobody waits for the request any longer.
void Core::Abandon(Section& section, const RequestPtr& request, Leaving why) noexcept {
  if (request->limit != nullptr && why == Leaving::kDeadline) {
    endpoints_.AskLast(request->endpoint);
  }
  if (!IsVerdictNeeded(*request)) {
    Detach(section, request);
  }
}

// A password that was sent may be wrong. If the attempts were cancelled, each call could send it
// once more, so this one goes on until it is decided, or until its limit. Those who come later for
// the same token share it.
bool Core::IsVerdictNeeded(const Request& request) const noexcept {
  return request.sendsPassword && MayHaveSent(request.limit->Stage()) &&
         !gate_.IsAccepted(*request.gate, runtime_->Now().steady);
}

void Core::GiveAll(Section& section, const RequestPtr& request, const Failure& failure) noexcept {
  for (const WaiterPtr& waiter : request->waiters) {
    waiter->request = nullptr;
    section.GiveAnswer(waiter, {nullptr, failure});
  }
  waiting_ -= request->waiters.size();
  request->waiters.clear();
}

// Gives the token to those for whom it lasts long enough.
void Core::GiveUsable(Section& section, const RequestPtr& request, const CacheEntry& entry,
                      const Instant& now) noexcept {
  waiting_ -= std::erase_if(request->waiters, [&](const WaiterPtr& waiter) {
    if (!entry.Life().IsUsable(now, waiter->Context().minimumLife)) {
      return false;
    }
    waiter->request = nullptr;
    section.GiveAnswer(waiter, {entry.Token(), {}});
    return true;
  });
}

void Core::GiveTooShort(Section& section, const RequestPtr& request,
                        std::chrono::microseconds granted) noexcept {
  for (const WaiterPtr& waiter : request->waiters) {
    waiter->request = nullptr;
    section.GiveAnswer(waiter, {nullptr, Failure::Made([&] {
                                  return TooShortFailure(granted, waiter->Context().minimumLife);
                                })});
  }
  waiting_ -= request->waiters.size();
  request->waiters.clear();
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
