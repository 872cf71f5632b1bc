#include "wire/misbehavior_plan.h"

#include <algorithm>
#include <utility>

namespace DevSts {
namespace {

bool ConcernsConnections(const Misbehavior& misbehavior) {
  return misbehavior.stall == Stall::BeforeTlsHandshake ||
         misbehavior.stall == Stall::BeforeRequest;
}

}  // namespace

void MisbehaviorPlan::Set(Misbehavior misbehavior) {
  const std::lock_guard lock(mutex_);
  standing_ = std::move(misbehavior);
}

void MisbehaviorPlan::Clear() {
  const std::lock_guard lock(mutex_);
  standing_.reset();
  next_.clear();
}

void MisbehaviorPlan::Next(Misbehavior misbehavior, std::size_t count) {
  if (count == 0) {
    return;
  }
  const std::lock_guard lock(mutex_);
  next_.push_back({std::move(misbehavior), count});
}

Stall MisbehaviorPlan::TakeForConnection() {
  const std::optional<Misbehavior> taken = Take(true);
  return taken ? taken->stall : Stall::None;
}

Misbehavior MisbehaviorPlan::TakeForRequest() {
  return Take(false).value_or(Misbehavior());
}

std::optional<Misbehavior> MisbehaviorPlan::Take(bool forConnection) {
  const std::lock_guard lock(mutex_);
  const auto entry = std::find_if(next_.begin(), next_.end(), [&](const Entry& candidate) {
    return ConcernsConnections(candidate.misbehavior) == forConnection;
  });
  if (entry != next_.end()) {
    Misbehavior taken = entry->misbehavior;
    if (--entry->left == 0) {
      next_.erase(entry);
    }
    return taken;
  }
  if (standing_ && ConcernsConnections(*standing_) == forConnection) {
    return standing_;
  }
  return std::nullopt;
}

}  // namespace DevSts
