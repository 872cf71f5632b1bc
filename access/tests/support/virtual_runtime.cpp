#include "support/virtual_runtime.h"

#include <utility>

#include <tarnik/core/exception.h>

namespace SsoClient::Access::Testing {

class VirtualRuntime::Timers {
 public:
  using Key = std::pair<Instant::Steady, std::uint64_t>;

  Key Add(Instant::Steady time, std::function<void()> action) {
    const std::lock_guard lock(mutex_);
    const Key key{time, ++last_};
    actions_.emplace(key, std::move(action));
    return key;
  }
  bool Remove(const Key& key) {
    std::map<Key, std::function<void()>>::node_type removed;
    const std::lock_guard lock(mutex_);
    removed = actions_.extract(key);
    return !removed.empty();
  }
  /// Takes the first timer if it is due at `until`; the time when it fires is returned in `time`.
  std::function<void()> Take(Instant::Steady until, Instant::Steady& time) {
    const std::lock_guard lock(mutex_);
    if (actions_.empty() || actions_.begin()->first.first > until) {
      return nullptr;
    }
    auto first = actions_.extract(actions_.begin());
    time = first.key().first;
    return std::move(first.mapped());
  }
  std::size_t Size() const {
    const std::lock_guard lock(mutex_);
    return actions_.size();
  }

 private:
  mutable std::mutex mutex_;
  std::map<Key, std::function<void()>> actions_;
  std::uint64_t last_ = 0;
};

VirtualRuntime::VirtualRuntime()
    : now_{Instant::Steady(std::chrono::hours(1000)),
           Instant::Wall(std::chrono::hours(24 * 365 * 60))},
      timers_(std::make_shared<Timers>()) {}

VirtualRuntime::~VirtualRuntime() = default;

Instant VirtualRuntime::Now() const {
  const std::lock_guard lock(mutex_);
  return now_;
}

double VirtualRuntime::Draw() {
  const std::lock_guard lock(mutex_);
  return draw_ ? draw_() : 0.5;
}

void VirtualRuntime::Run(std::function<void()> work) {
  const std::lock_guard lock(mutex_);
  if (refusesWork_) {
    throw Tarnik::ResourceException("No thread.");
  }
  work_.push_back(std::move(work));
  hasWork_.notify_all();
}

Tarnik::Ref<Tarnik::System::CancellableItem> VirtualRuntime::RunAt(Instant::Steady time,
                                                                   std::function<void()> action) {
  const auto key = timers_->Add(time, std::move(action));
  try {
    return Tarnik::System::CreateCancellableItem(
        [timers = timers_, key] { return timers->Remove(key); });
  } catch (...) {
    timers_->Remove(key);
    throw;
  }
}

bool VirtualRuntime::FireNext(Instant::Steady until) {
  Instant::Steady time;
  const auto action = timers_->Take(until, time);
  if (!action) {
    return false;
  }
  {
    const std::lock_guard lock(mutex_);
    if (time > now_.steady) {
      now_.wall += time - now_.steady;
      now_.steady = time;
    }
  }
  action();
  return true;
}

bool VirtualRuntime::RunNext() {
  std::function<void()> work;
  {
    const std::lock_guard lock(mutex_);
    if (work_.empty()) {
      return false;
    }
    work = std::move(work_.front());
    work_.pop_front();
  }
  work();
  return true;
}

void VirtualRuntime::PassUntil(Instant::Steady until, bool runsWork) {
  while ((runsWork && RunNext()) || FireNext(until)) {
  }
  const std::lock_guard lock(mutex_);
  if (until > now_.steady) {
    now_.wall += until - now_.steady;
    now_.steady = until;
  }
}

void VirtualRuntime::Settle() {
  PassUntil(Now().steady, true);
}

void VirtualRuntime::Advance(std::chrono::milliseconds duration) {
  PassUntil(Now().steady + duration, true);
}

void VirtualRuntime::Pass(std::chrono::milliseconds duration) {
  PassUntil(Now().steady + duration, false);
}

void VirtualRuntime::MoveWallClock(std::chrono::milliseconds duration) {
  const std::lock_guard lock(mutex_);
  now_.wall += duration;
}

void VirtualRuntime::RunUntil(const std::function<bool()>& isDone) {
  while (!isDone()) {
    {
      std::unique_lock lock(mutex_);
      hasWork_.wait(lock, [this] { return !work_.empty(); });
    }
    RunNext();
  }
}

void VirtualRuntime::SetDraw(std::function<double()> draw) {
  const std::lock_guard lock(mutex_);
  draw_ = std::move(draw);
}

void VirtualRuntime::RefuseWork(bool isRefused) {
  const std::lock_guard lock(mutex_);
  refusesWork_ = isRefused;
}

void VirtualRuntime::DropWork() {
  std::deque<std::function<void()>> dropped;
  const std::lock_guard lock(mutex_);
  dropped.swap(work_);
}

std::size_t VirtualRuntime::TimersArmed() const {
  return timers_->Size();
}

std::size_t VirtualRuntime::WorkQueued() const {
  const std::lock_guard lock(mutex_);
  return work_.size();
}

}  // namespace SsoClient::Access::Testing
