#include "section.h"

#include <utility>

namespace SsoClient::Access {

void Section::Circuit(const EndpointSet::Change& change) {
  if (!change) {
    return;
  }
  CircuitRecord record = *change;
  record.source = core_.config_->name;
  ToListener([record](AccessListener& listener) { listener.OnCircuit(record); });
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

void Section::Finish() noexcept {
  if (!lock_.owns_lock()) {
    return;
  }
  lock_.unlock();
  while (firstAnswered_ != nullptr) {
    const WaiterPtr waiter = std::exchange(firstAnswered_, nullptr);
    firstAnswered_ = std::exchange(waiter->nextAnswered, nullptr);
    waiter->Receive(std::move(waiter->dueAnswer));
  }
  for (const auto& limit : limits_) {
    limit->Cancel();
  }
  for (const auto& item : items_) {
    item->Cancel();
  }
  for (const auto& action : actions_) {
    action();
  }
  while (firstStarted_ != nullptr) {
    const RequestPtr request = std::exchange(firstStarted_, nullptr);
    firstStarted_ = std::exchange(request->nextStarted, nullptr);
    core_.StartWork(request);
  }
  for (const auto& report : reports_) {
    report(*core_.config_->listener);
  }
}

}  // namespace SsoClient::Access
