#include "activity.h"

#include <algorithm>

#include "instant.h"

namespace SsoClient::Access {

namespace {

thread_local const Activity::OwnThread* innermost = nullptr;

}  // namespace

Activity::OwnThread::OwnThread(const Activity& activity) noexcept
    : activity_(activity), outer_(innermost) {
  innermost = this;
}

Activity::OwnThread::~OwnThread() {
  innermost = outer_;
}

int Activity::CountOnThisThread() const noexcept {
  int count = 0;
  for (const OwnThread* scope = innermost; scope != nullptr; scope = scope->outer_) {
    count += &scope->activity_ == this ? 1 : 0;
  }
  return count;
}

void Activity::Begin() noexcept {
  const std::lock_guard lock(mutex_);
  ++count_;
}

void Activity::End() noexcept {
  // With the lock, since the one that waits may destroy this object as soon as it is released.
  const std::lock_guard lock(mutex_);
  --count_;
  ended_.notify_all();
}

bool Activity::WaitUntilIdle(std::chrono::milliseconds limit) {
  const int own = CountOnThisThread();
  std::unique_lock lock(mutex_);
  const auto wait =
      std::clamp<std::chrono::milliseconds>(limit, std::chrono::milliseconds(0), kLongestDuration);
  return ended_.wait_for(lock, wait, [this, own] { return count_ <= own; });
}

}  // namespace SsoClient::Access
