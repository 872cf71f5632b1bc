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
  RunStarted();
  ReportAll();
}

void Section::AnswerAll() noexcept {
  while (firstAnswered_ != nullptr) {
    const WaiterPtr waiter = std::exchange(firstAnswered_, nullptr);
    firstAnswered_ = std::exchange(waiter->nextAnswered, nullptr);
    const auto timer = std::exchange(waiter->deadlineTimer, nullptr);
    waiter->Receive(std::move(waiter->dueAnswer));
    CancelUnlessNull(timer);
  }
}

void Section::CancelEnded() noexcept {
  const bool hasBase = std::holds_alternative<TokenLogin>(core_.config_->login);
  while (firstEnded_ != nullptr) {
    const RequestPtr request = std::exchange(firstEnded_, nullptr);
    firstEnded_ = std::exchange(request->nextEnded, nullptr);
    CancelUnlessNull(std::exchange(request->endedLimit, nullptr));
    CancelUnlessNull(std::exchange(request->endedPause, nullptr));
    if (hasBase) {
      request->cancellation.Cancel();
    }
  }
  for (const auto& item : items_) {
    CancelUnlessNull(item);
  }
}

void Section::RunStarted() noexcept {
  while (firstStarted_ != nullptr) {
    const RequestPtr request = std::exchange(firstStarted_, nullptr);
    firstStarted_ = std::exchange(request->nextStarted, nullptr);
    core_.StartWork(request);
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
