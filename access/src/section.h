#ifndef SSOCLIENT_ACCESS_SECTION_H
#define SSOCLIENT_ACCESS_SECTION_H

#include <functional>
#include <memory>
#include <mutex>
#include <utility>
#include <vector>

#include "core.h"

namespace SsoClient::Access {

/// Holds the lock of a core. What is to happen outside of the lock is noted here, and happens when
/// the section ends: first the answers, since callers wait for them.
class Section {
 public:
  using Report = std::function<void(AccessListener&)>;

  explicit Section(Core& core) : core_(core), lock_(core.mutex_) {}
  ~Section() { Finish(); }
  Section(const Section&) = delete;
  Section& operator=(const Section&) = delete;

  void GiveAnswer(WaiterPtr waiter, Answer answer) {
    answers_.emplace_back(std::move(waiter), std::move(answer));
  }
  void Start(const RequestPtr& request) { started_.push_back(request); }
  void Start(const std::vector<RequestPtr>& requests) {
    started_.insert(started_.end(), requests.begin(), requests.end());
  }
  void Cancel(Tarnik::Ref<Tarnik::System::CancellableItem> item) {
    if (item != nullptr) {
      items_.push_back(std::move(item));
    }
  }
  void Cancel(Tarnik::Ref<Tarnik::Http::CallLimit> limit) {
    if (limit != nullptr) {
      limits_.push_back(std::move(limit));
    }
  }
  void Cancel(const CancellationSource& source) { sources_.push_back(source); }
  /// `report` is called if there is a listener.
  void ToListener(Report report) {
    if (core_.config_->listener != nullptr) {
      reports_.push_back(std::move(report));
    }
  }
  void Circuit(const EndpointSet::Change& change);
  /// Called outside of the lock.
  void Do(std::function<void()> action) { actions_.push_back(std::move(action)); }
  /// Destroyed outside of the lock.
  void Keep(std::shared_ptr<const void> object) { kept_.push_back(std::move(object)); }

  void Finish() noexcept;

 private:
  Core& core_;
  std::vector<std::shared_ptr<const void>> kept_;
  std::vector<std::pair<WaiterPtr, Answer>> answers_;
  std::vector<RequestPtr> started_;
  std::vector<Tarnik::Ref<Tarnik::System::CancellableItem>> items_;
  std::vector<Tarnik::Ref<Tarnik::Http::CallLimit>> limits_;
  std::vector<CancellationSource> sources_;
  std::vector<Report> reports_;
  std::vector<std::function<void()>> actions_;
  std::unique_lock<std::mutex> lock_;
};

}  // namespace SsoClient::Access

#endif
