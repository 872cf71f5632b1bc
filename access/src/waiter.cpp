#include "waiter.h"

namespace SsoClient::Access {

void BlockedCaller::Receive(Answer answer) noexcept {
  // With the lock, since the caller may destroy this object as soon as it is released.
  const std::lock_guard lock(mutex_);
  answer_ = std::move(answer);
  hasAnswer_.notify_one();
}

Answer BlockedCaller::Wait() {
  std::unique_lock lock(mutex_);
  hasAnswer_.wait(lock, [this] { return answer_.has_value(); });
  return std::move(*answer_);
}

CallbackCaller::~CallbackCaller() {
  if (isOwed_) {
    Report();
  }
}

void CallbackCaller::Receive(Answer answer) noexcept {
  answer_ = std::move(answer);
  isOwed_ = true;
  activity_->Begin();
  try {
    Schedule();
  } catch (...) {
    Report();
  }
}

void CallbackCaller::ReceiveOrThrow(Answer answer) {
  answer_ = std::move(answer);
  activity_->Begin();
  try {
    isOwed_ = true;
    Schedule();
  } catch (...) {
    isOwed_ = false;
    activity_->End();
    throw;
  }
}

void CallbackCaller::Schedule() {
  runtime_->Run([self = shared_from_this()] { self->Report(); });
}

void CallbackCaller::Report() noexcept {
  isOwed_ = false;
  {
    const Activity::OwnThread scope(*activity_);
    callback_(answer_);
    callback_ = nullptr;
    answer_ = {};
  }
  activity_->End();
}

}  // namespace SsoClient::Access
