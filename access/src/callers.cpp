#include <string>
#include <utility>

#include <ssoclient/exceptions.h>

#include "core.h"
#include "section.h"
#include "stage.h"

namespace SsoClient::Access {

namespace {

Failure TooShortFailure(std::chrono::microseconds granted, std::chrono::seconds minimumLife) {
  const auto seconds = std::chrono::duration_cast<std::chrono::seconds>(granted);
  return Failure::Of(SsoException("The service grants " + std::to_string(seconds.count()) +
                                  " s, but the caller needs a token for " +
                                  std::to_string(minimumLife.count()) + " s."));
}

// The exchange under way of a request that waits for an attempt.
Tarnik::Http::ExchangeStage ExchangeStageOf(const Request& request) noexcept {
  return request.limit == nullptr ? Tarnik::Http::ExchangeStage::kNone : request.limit->Stage();
}

}  // namespace

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
    joined.answer = Answer{nullptr, Failure::Cancelled()};
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
                                                  : Failure::Made(&Failure::Cancelled)});
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

}  // namespace SsoClient::Access
