#include "wire/observation.h"

#include <stdexcept>

namespace DevSts {

void Observation::Count(const std::function<void(Counters&)>& change) {
  {
    const std::lock_guard lock(mutex_);
    change(counters_);
  }
  changed_.notify_all();
}

void Observation::Add(const ReceivedRequest& request,
                      const std::function<void(Counters&)>& change) {
  {
    const std::lock_guard lock(mutex_);
    requests_.push_back(request);
    if (requests_.size() > requestLimit_) {
      requests_.pop_front();
    }
    change(counters_);
  }
  changed_.notify_all();
}

std::vector<ReceivedRequest> Observation::Requests() const {
  const std::lock_guard lock(mutex_);
  return {requests_.begin(), requests_.end()};
}

ReceivedRequest Observation::LastRequest() const {
  const std::lock_guard lock(mutex_);
  if (requests_.empty()) {
    throw std::out_of_range("no request was received");
  }
  return requests_.back();
}

void Observation::ClearRequests() {
  const std::lock_guard lock(mutex_);
  requests_.clear();
}

Counters Observation::GetCounters() const {
  const std::lock_guard lock(mutex_);
  return counters_;
}

bool Observation::WaitUntil(const std::function<bool(const Counters&)>& condition,
                            std::chrono::milliseconds timeout) const {
  std::unique_lock lock(mutex_);
  return changed_.wait_for(lock, timeout, [&] { return condition(counters_); });
}

}  // namespace DevSts
