#include <atomic>
#include <condition_variable>
#include <map>
#include <memory>
#include <mutex>
#include <thread>
#include <utility>

#include <ssoclient/access/call_context.h>
#include <tarnik/core/exception.h>

#include "process_hooks.h"

namespace SsoClient::Access {

/// The functions that are registered in one process.
class CancellationActions {
 public:
  using Id = std::uint64_t;

  explicit CancellationActions(const CancellationActions* ofParent)
      : generation_(ForkGeneration()), ofParent_(ofParent) {}

  bool AreOfThisProcess() const noexcept { return generation_ == ForkGeneration(); }

  /// False if `isCancelled`, and `action` must run now.
  bool Add(std::function<void()>& action, Id id, const std::atomic<bool>& isCancelled) {
    const std::lock_guard lock(mutex_);
    if (isCancelled) {
      return false;
    }
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

  void RunAll() noexcept {
    std::unique_lock lock(mutex_);
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

  const std::uint64_t generation_;
  /// Unused, so that leak checkers find it.
  [[maybe_unused]] const CancellationActions* const ofParent_;
  std::mutex mutex_;
  std::condition_variable actionHasRun_;
  Actions actions_;
  Id running_ = 0;
  std::thread::id canceller_;
};

/// What the copies of a source and its tokens share. The functions that a parent process has
/// registered are never touched in a forked child, where a thread that does not exist may hold
/// their lock, and where they would work on the calls of the parent.
class CancellationState {
 public:
  using Id = CancellationActions::Id;

  CancellationState() : actions_(new CancellationActions(nullptr)) {}
  ~CancellationState() {
    if (const CancellationActions* const own = Own()) {
      delete own;
    }
  }
  CancellationState(const CancellationState&) = delete;
  CancellationState& operator=(const CancellationState&) = delete;

  bool IsCancelled() const noexcept { return isCancelled_.load(std::memory_order_acquire); }

  /// False if the state is cancelled, and `action` must run now.
  bool Add(std::function<void()>& action, Id& id) {
    id = ++lastId_;
    return OwnOrNew().Add(action, id, isCancelled_);
  }

  void Remove(Id id) {
    if (CancellationActions* const own = Own()) {
      own->Remove(id);
    }
  }

  // In a child without functions, one that is being registered sees the flag: the functions are
  // published before it is read, and it is set before they are looked for.
  void Cancel() noexcept {
    if (isCancelled_.exchange(true)) {
      return;
    }
    if (CancellationActions* const own = Own()) {
      own->RunAll();
    }
  }

 private:
  /// Null in a child that has registered nothing.
  CancellationActions* Own() const noexcept {
    CancellationActions* const known = actions_.load();
    return known->AreOfThisProcess() ? known : nullptr;
  }

  CancellationActions& OwnOrNew() {
    CancellationActions* known = actions_.load();
    if (known->AreOfThisProcess()) {
      return *known;
    }
    auto made = std::make_unique<CancellationActions>(known);
    return actions_.compare_exchange_strong(known, made.get()) ? *made.release() : *known;
  }

  std::atomic<bool> isCancelled_{false};
  std::atomic<CancellationActions*> actions_;
  /// Goes on in a child, so that what a parent has registered there removes nothing.
  std::atomic<Id> lastId_{0};
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
  // A function that it runs may destroy this object.
  const auto state = token_.state_;
  state->Cancel();
}

}  // namespace SsoClient::Access
