#ifndef SSOCLIENT_ACCESS_TESTS_END_TO_END_AWAITING_LISTENER_H
#define SSOCLIENT_ACCESS_TESTS_END_TO_END_AWAITING_LISTENER_H

#include <chrono>
#include <condition_variable>
#include <functional>
#include <mutex>
#include <vector>

#include <ssoclient/access/listener.h>

namespace SsoClient::Access::Testing {

/// What a listener has seen.
struct Records {
  std::vector<AttemptRecord> begun;
  std::vector<AttemptRecord> ended;
  std::vector<RefreshFailureRecord> refreshFailures;
  std::vector<CircuitRecord> circuits;
  std::vector<ClockRecord> clocks;
  std::vector<DeviationRecord> deviations;
};

/// Keeps all records, and lets tests wait for them.
class AwaitingListener final : public AccessListener {
 public:
  void OnAttemptBegun(const AttemptRecord& attempt) override { Add(&Records::begun, attempt); }
  void OnAttemptEnded(const AttemptRecord& attempt) override { Add(&Records::ended, attempt); }
  void OnRefreshFailed(const RefreshFailureRecord& refresh) override {
    Add(&Records::refreshFailures, refresh);
  }
  void OnCircuit(const CircuitRecord& circuit) override { Add(&Records::circuits, circuit); }
  void OnClock(const ClockRecord& clock) override { Add(&Records::clocks, clock); }
  void OnDeviation(const DeviationRecord& deviation) override {
    Add(&Records::deviations, deviation);
  }

  Records Seen() const {
    const std::lock_guard lock(mutex_);
    return records_;
  }
  /// Waits for records that satisfy `condition`. Returns false if there are none in a minute.
  bool Await(const std::function<bool(const Records&)>& condition) const {
    std::unique_lock lock(mutex_);
    return changed_.wait_for(lock, std::chrono::minutes(1), [&] { return condition(records_); });
  }

 private:
  template <class Record>
  void Add(std::vector<Record> Records::*kind, const Record& record) {
    const std::lock_guard lock(mutex_);
    (records_.*kind).push_back(record);
    changed_.notify_all();
  }

  mutable std::mutex mutex_;
  mutable std::condition_variable changed_;
  Records records_;
};

}  // namespace SsoClient::Access::Testing

#endif
