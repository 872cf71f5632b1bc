#include <atomic>
#include <condition_variable>
#include <map>
#include <mutex>
#include <thread>
#include <utility>

#include <ssoclient/access/call_context.h>
#include <tarnik/core/exception.h>

namespace SsoClient::Access {

class CancellationState {
 public:
  using Id = std::uint64_t;

  bool IsCancelled() const noexcept { return isCancelled_.load(std::memory_order_acquire); }

  /// False if the state is cancelled, and `action` must run now.
  bool Add(std::function<void()>& action, Id& id) {
    const std::lock_guard lock(mutex_);
    if (IsCancelled()) {
      return false;
    }
    id = ++lastId_;
    actions_.emplace(id, std::move(action));
    return true;
  }

  void Remove(Id id) {
    Actions::node_type removed;  // destroyed without the lock
    std::unique_lock lock(mutex_);
    removed = actions_.extract(id);
    if (canceller_ != std::this_thread::get_id()) {
      actionHasRun_.wait(lock, [this, id] { return running_ != id; });
    }
  }

  void Cancel() noexcept {
    std::unique_lock lock(mutex_);
    if (isCancelled_.exchange(true, std::memory_order_acq_rel)) {
      return;
    }
    canceller_ = std::this_thread::get_id();
    while (!actions_.empty()) {
      auto action = actions_.extract(actions_.begin());
      running_ = action.key();
      lock.unlock();
      action.mapped()();
      action = {};
      lock.lock();
      running_ = 0;
      actionHasRun_.notify_all();
    }
    canceller_ = {};
  }

 private:
  using Actions = std::map<Id, std::function<void()>>;

  std::atomic<bool> isCancelled_{false};
  std::mutex mutex_;
  std::condition_variable actionHasRun_;
  Actions actions_;
  Id lastId_ = 0;
  Id running_ = 0;
  std::thread::id canceller_;
};

CancellationRegistration::CancellationRegistration(std::shared_ptr<CancellationState> state,
                                                   std::uint64_t id) noexcept
    : state_(std::move(state)), id_(id) {}

CancellationRegistration::CancellationRegistration(CancellationRegistration&& other) noexcept
    : state_(std::move(other.state_)), id_(other.id_) {}

CancellationRegistration& CancellationRegistration::operator=(
    CancellationRegistration&& other) noexcept {
  CancellationRegistration removed(std::move(*this));
  state_ = std::move(other.state_);
  id_ = other.id_;
  return *this;
}

CancellationRegistration::~CancellationRegistration() {
  if (state_ != nullptr) {
    state_->Remove(id_);
  }
}

CancellationToken::CancellationToken(std::shared_ptr<CancellationState> state) noexcept
    : state_(std::move(state)) {}

bool CancellationToken::IsCancelled() const noexcept {
  return state_ != nullptr && state_->IsCancelled();
}

CancellationRegistration CancellationToken::OnCancel(std::function<void()> action) const {
  if (!action) {
    throw Tarnik::InvalidArgumentException("The function to run on cancellation is empty.");
  }
  if (state_ == nullptr) {
    return {};
  }
  std::uint64_t id = 0;
  if (state_->Add(action, id)) {
    return {state_, id};
  }
  action();
  return {};
}

CancellationSource::CancellationSource() : token_(std::make_shared<CancellationState>()) {}

void CancellationSource::Cancel() const noexcept {
  token_.state_->Cancel();
}

}  // namespace SsoClient::Access
