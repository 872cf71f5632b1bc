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
/// the section ends: first the answers, since callers wait for them. What must not be lost needs no
/// memory: answers, ends and starts of requests, and the record of an attempt.
class Section {
 public:
  using Report = std::function<void(AccessListener&)>;

  explicit Section(Core& core) : core_(core), lock_(core.mutex_) {}
  ~Section() { Finish(); }
  Section(const Section&) = delete;
  Section& operator=(const Section&) = delete;

  /// The waiter's timer is cancelled as well.
  void GiveAnswer(const WaiterPtr& waiter, Answer answer) noexcept;
  void Start(const RequestPtr& request) noexcept;
  /// Cancels what is under way for a request that has ended.
  void End(const RequestPtr& request) noexcept;
  /// Without memory, the item is not cancelled, and fires in its time.
  void Cancel(Tarnik::Ref<Tarnik::System::CancellableItem> item) noexcept {
    AddUnlessNull(items_, std::move(item));
  }
  /// The attempt has ended. The record must live longer than the section.
  void ReportEnd(const AttemptRecord& record) noexcept { ended_ = &record; }
  /// The result of `make` is called if there is a listener. Without memory, it is not.
  template <class Make>
  void ToListener(const Make& make) noexcept {
    if (core_.config_->listener == nullptr) {
      return;
    }
    try {
      reports_.push_back(make());
    } catch (const std::bad_alloc&) {
      // Nothing that a caller needs.
    }
  }
  void Circuit(const EndpointSet::Change& change) noexcept;
  /// Destroyed outside of the lock.
  void Keep(std::shared_ptr<const void> object) noexcept {
    AddUnlessNull(kept_, std::move(object));
  }

  void Finish() noexcept;

  /// Calls a function of the listener. What it throws is ignored.
  template <class Call>
  static void Notify(AccessListener& listener, const Call& call) noexcept {
    try {
      call(listener);
    } catch (...) {
      // The source works without its listener.
    }
  }

 private:
  template <class Element>
  static void AddUnlessNull(std::vector<Element>& elements, Element element) noexcept {
    if (!element) {
      return;
    }
    try {
      elements.push_back(std::move(element));
    } catch (const std::bad_alloc&) {
      // What is not cancelled ends by itself, later.
    }
  }

  void AnswerAll() noexcept;
  void CancelEnded() noexcept;
  void RunOrFail(const RequestPtr& request) noexcept;
  void ReportAll() noexcept;

  Core& core_;
  std::vector<std::shared_ptr<const void>> kept_;
  WaiterPtr firstAnswered_;
  Waiter* lastAnswered_ = nullptr;
  RequestPtr firstStarted_;
  Request* lastStarted_ = nullptr;
  RequestPtr firstEnded_;
  Request* lastEnded_ = nullptr;
  std::vector<Tarnik::Ref<Tarnik::System::CancellableItem>> items_;
  const AttemptRecord* ended_ = nullptr;
  std::vector<Report> reports_;
  std::unique_lock<std::mutex> lock_;
};

}  // namespace SsoClient::Access

#endif
