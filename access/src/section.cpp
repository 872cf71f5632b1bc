#include "section.h"

namespace SsoClient::Access {

void Section::Circuit(const EndpointSet::Change& change) {
  if (!change) {
    return;
  }
  CircuitRecord record = *change;
  record.source = core_.config_->name;
  ToListener([record](AccessListener& listener) { listener.OnCircuit(record); });
}

void Section::Finish() noexcept {
  if (!lock_.owns_lock()) {
    return;
  }
  lock_.unlock();
  for (auto& [waiter, answer] : answers_) {
    waiter->Receive(std::move(answer));
  }
  for (const auto& limit : limits_) {
    limit->Cancel();
  }
  for (const auto& source : sources_) {
    source.Cancel();
  }
  for (const auto& item : items_) {
    item->Cancel();
  }
  for (const auto& action : actions_) {
    action();
  }
  for (const auto& request : started_) {
    core_.StartWork(request);
  }
  for (const auto& report : reports_) {
    report(*core_.config_->listener);
  }
}

}  // namespace SsoClient::Access
