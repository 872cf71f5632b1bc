#include "section.h"

#include <utility>
#include <variant>

namespace SsoClient::Access {

namespace {

// What cannot be cancelled for want of memory ends by itself, later.
template <class Item>
void CancelUnlessNull(const Tarnik::Ref<Item>& item) noexcept {
  if (item == nullptr) {
    return;
  }
  try {
    item->Cancel();
  } catch (const std::bad_alloc&) {
  }
}

// Takes the first element of a list through the objects themselves; `next` is that of the element.
template <class Object>
std::shared_ptr<Object> TakeFirst(std::shared_ptr<Object>& first, Object*& last,
                                  std::shared_ptr<Object>& next) noexcept {
  std::shared_ptr<Object> taken = std::move(first);
  first = std::exchange(next, nullptr);
  if (first == nullptr) {
    last = nullptr;
  }
  return taken;
}

}  // namespace

void Section::Circuit(const EndpointSet::Change& change) noexcept {
  if (!change) {
    return;
  }
  ToListener([&] {
    const CircuitRecord record{core_.config_->name, core_.endpoints_.Url(change->endpoint),
                               change->state, change->retryAfter};
    return Report([record](AccessListener& listener) { listener.OnCircuit(record); });
  });
}

void Section::GiveAnswer(const WaiterPtr& waiter, Answer answer) noexcept {
  waiter->dueAnswer = std::move(answer);
  (lastAnswered_ == nullptr ? firstAnswered_ : lastAnswered_->nextAnswered) = waiter;
  lastAnswered_ = waiter.get();
}

void Section::Start(const RequestPtr& request) noexcept {
  (lastStarted_ == nullptr ? firstStarted_ : lastStarted_->nextStarted) = request;
  lastStarted_ = request.get();
}

void Section::End(const RequestPtr& request) noexcept {
  request->endedLimit = request->limit;
  request->endedPause = std::exchange(request->pause, nullptr);
  (lastEnded_ == nullptr ? firstEnded_ : lastEnded_->nextEnded) = request;
  lastEnded_ = request.get();
}

void Section::Finish() noexcept {
  if (!lock_.owns_lock()) {
    return;
  }
  lock_.unlock();
  AnswerAll();
  CancelEnded();
  while (firstStarted_ != nullptr) {
    RunOrFail(TakeFirst(firstStarted_, lastStarted_, firstStarted_->nextStarted));
  }
  ReportAll();
}

void Section::AnswerAll() noexcept {
  while (firstAnswered_ != nullptr) {
    const WaiterPtr waiter = TakeFirst(firstAnswered_, lastAnswered_, firstAnswered_->nextAnswered);
    const auto timer = std::exchange(waiter->deadlineTimer, nullptr);
    waiter->Receive(std::move(waiter->dueAnswer));
    CancelUnlessNull(timer);
  }
}

void Section::CancelEnded() noexcept {
  const bool hasBase = std::holds_alternative<TokenLogin>(core_.config_->login);
  while (firstEnded_ != nullptr) {
    const RequestPtr request = TakeFirst(firstEnded_, lastEnded_, firstEnded_->nextEnded);
    CancelUnlessNull(std::exchange(request->endedLimit, nullptr));
    CancelUnlessNull(std::exchange(request->endedPause, nullptr));
    if (hasBase) {
      request->cancellation.Cancel();
    }
  }
  for (const auto& item : std::exchange(items_, {})) {
    CancelUnlessNull(item);
  }
}

// The end of a request may start the next one, which fails in the same way: all of them do so here,
// one after the other, whatever their number.
void Section::RunOrFail(const RequestPtr& request) noexcept {
  try {
    core_.Run(request);
  } catch (...) {
    lock_.lock();
    core_.FailUnlessEnded(*this, request, Failure::Current());
    lock_.unlock();
    AnswerAll();
    CancelEnded();
  }
}

void Section::ReportAll() noexcept {
  if (ended_ != nullptr && core_.config_->listener != nullptr) {
    Notify(*core_.config_->listener,
           [this](AccessListener& listener) { listener.OnAttemptEnded(*ended_); });
  }
  for (const auto& report : reports_) {
    Notify(*core_.config_->listener, report);
  }
}

}  // namespace SsoClient::Access
