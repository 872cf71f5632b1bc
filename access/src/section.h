#ifndef SSOCLIENT_ACCESS_SECTION_H
#define SSOCLIENT_ACCESS_SECTION_H

#include <functional>
#include <memory>
#include <mutex>
#include <new>
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

  void GiveAnswer(const WaiterPtr& waiter, Answer answer) noexcept;
  void Start(const RequestPtr& request) noexcept;
  void Start(const std::vector<RequestPtr>& requests) noexcept {
    for (const RequestPtr& request : requests) {
      Start(request);
    }
  }
  void Cancel(Tarnik::Ref<Tarnik::System::CancellableItem> item) noexcept {
    AddUnlessNull(items_, std::move(item));
  }
  void Cancel(Tarnik::Ref<Tarnik::Http::CallLimit> limit) noexcept {
    AddUnlessNull(limits_, std::move(limit));
  }
  /// Called outside of the lock.
  void Do(std::function<void()> action) noexcept { AddUnlessNull(actions_, std::move(action)); }
  /// `report` is called if there is a listener.
  void ToListener(Report report) noexcept {
    if (core_.config_->listener != nullptr) {
      AddUnlessNull(reports_, std::move(report));
    }
  }
  void Circuit(const EndpointSet::Change& change);
  /// Destroyed outside of the lock.
  void Keep(std::shared_ptr<const void> object) noexcept {
    AddUnlessNull(kept_, std::move(object));
  }

  void Finish() noexcept;

 private:
  // Without memory, nothing is added: what is not cancelled ends by itself, later. Answers and
  // starts, which must not be lost, need none.
  template <class Element>
  static void AddUnlessNull(std::vector<Element>& elements, Element element) noexcept {
    if (!element) {
      return;
    }
    try {
      elements.push_back(std::move(element));
    } catch (const std::bad_alloc&) {
    }
  }

  Core& core_;
  std::vector<std::shared_ptr<const void>> kept_;
  WaiterPtr firstAnswered_;
  Waiter* lastAnswered_ = nullptr;
  RequestPtr firstStarted_;
  Request* lastStarted_ = nullptr;
  std::vector<Tarnik::Ref<Tarnik::System::CancellableItem>> items_;
  std::vector<Tarnik::Ref<Tarnik::Http::CallLimit>> limits_;
  std::vector<Report> reports_;
  std::vector<std::function<void()>> actions_;
  std::unique_lock<std::mutex> lock_;
};

}  // namespace SsoClient::Access

#endif
