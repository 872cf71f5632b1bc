#ifndef SSOCLIENT_ACCESS_TESTS_SUPPORT_RECORDING_LISTENER_H
#define SSOCLIENT_ACCESS_TESTS_SUPPORT_RECORDING_LISTENER_H

#include <mutex>
#include <vector>

#include <ssoclient/access/listener.h>

namespace SsoClient::Access::Testing {

/// Keeps all records.
class RecordingListener final : public AccessListener {
 public:
  void OnAttemptBegun(const AttemptRecord& attempt) override { Add(begun_, attempt); }
  void OnAttemptEnded(const AttemptRecord& attempt) override { Add(ended_, attempt); }
  void OnRefreshFailed(const RefreshFailureRecord& refresh) override { Add(refreshes_, refresh); }
  void OnCircuit(const CircuitRecord& circuit) override { Add(circuits_, circuit); }
  void OnClock(const ClockRecord& clock) override { Add(clocks_, clock); }
  void OnDeviation(const DeviationRecord& deviation) override { Add(deviations_, deviation); }

  std::vector<AttemptRecord> Begun() const { return Copy(begun_); }
  std::vector<AttemptRecord> Ended() const { return Copy(ended_); }
  std::vector<RefreshFailureRecord> Refreshes() const { return Copy(refreshes_); }
  std::vector<CircuitRecord> Circuits() const { return Copy(circuits_); }
  std::vector<ClockRecord> Clocks() const { return Copy(clocks_); }
  std::vector<DeviationRecord> Deviations() const { return Copy(deviations_); }

 private:
  template <class Record>
  void Add(std::vector<Record>& records, const Record& record) {
    const std::lock_guard lock(mutex_);
    records.push_back(record);
  }
  template <class Record>
  std::vector<Record> Copy(const std::vector<Record>& records) const {
    const std::lock_guard lock(mutex_);
    return records;
  }

  mutable std::mutex mutex_;
  std::vector<AttemptRecord> begun_;
  std::vector<AttemptRecord> ended_;
  std::vector<RefreshFailureRecord> refreshes_;
  std::vector<CircuitRecord> circuits_;
  std::vector<ClockRecord> clocks_;
  std::vector<DeviationRecord> deviations_;
};

}  // namespace SsoClient::Access::Testing

#endif
