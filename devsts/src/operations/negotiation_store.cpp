#include "operations/negotiation_store.h"

#include <algorithm>
#include <utility>

#include "operations/secrets.h"
#include "soap/fault.h"

namespace DevSts {

NegotiationStore::Turn::Turn(NegotiationStore& store, std::string context, std::uint64_t serial,
                             std::string cookie, std::unique_ptr<PendingIssue> pending)
    : store_(&store),
      context_(std::move(context)),
      serial_(serial),
      cookie_(std::move(cookie)),
      pending_(std::move(pending)) {}

NegotiationStore::Turn::Turn(Turn&& other) noexcept
    : store_(std::exchange(other.store_, nullptr)),
      context_(std::move(other.context_)),
      serial_(other.serial_),
      cookie_(std::move(other.cookie_)),
      pending_(std::move(other.pending_)) {}

NegotiationStore::Turn::~Turn() {
  if (store_ != nullptr) {
    store_->End(context_, serial_);
  }
}

void NegotiationStore::Turn::Keep(const std::string& context) {
  const std::lock_guard lock(store_->mutex_);
  const auto found = store_->entries_.find(context_);
  if (found == store_->entries_.end() || found->second.serial != serial_) {
    return;  // forgotten in the meantime
  }
  found->second.pending = std::move(pending_);
  if (context != context_) {
    auto node = store_->entries_.extract(found);
    node.key() = context;
    store_->entries_.insert(std::move(node));
  }
  store_ = nullptr;
}

NegotiationStore::Turn NegotiationStore::Begin(const std::string& context, PendingIssue pending) {
  auto owned = std::make_unique<PendingIssue>(std::move(pending));
  std::string cookie = MakeId();
  const std::lock_guard lock(mutex_);
  ForgetOld();
  if (entries_.count(context) != 0) {
    ThrowInvalidRequest("The Context is in use: " + context);
  }
  if (entries_.size() >= limit_) {
    ForgetOldest();
  }
  entries_[context] = {++lastSerial_, cookie, Clock::now(), nullptr};
  return {*this, context, lastSerial_, std::move(cookie), std::move(owned)};
}

NegotiationStore::Turn NegotiationStore::Resume(const std::string& context,
                                                const std::string& cookie) {
  const std::lock_guard lock(mutex_);
  ForgetOld();
  const auto found = entries_.find(context);
  if (found == entries_.end()) {
    ThrowInvalidRequest("No negotiation is under way in the Context " + context);
  }
  Entry& entry = found->second;
  if (!IsSameSecret(cookie, entry.cookie)) {
    ThrowInvalidRequest("The request does not have the cookie of its negotiation");
  }
  if (entry.pending == nullptr) {
    ThrowInvalidRequest("The negotiation is busy with another leg");
  }
  return {*this, context, entry.serial, entry.cookie, std::move(entry.pending)};
}

std::size_t NegotiationStore::Size() const {
  const std::lock_guard lock(mutex_);
  return entries_.size();
}

void NegotiationStore::ForgetOld() {
  const Clock::time_point now = Clock::now();
  std::erase_if(entries_, [&](const auto& entry) { return now - entry.second.begun >= maxAge_; });
}

void NegotiationStore::ForgetOldest() {
  const auto oldest = std::min_element(
      entries_.begin(), entries_.end(),
      [](const auto& left, const auto& right) { return left.second.serial < right.second.serial; });
  if (oldest != entries_.end()) {
    entries_.erase(oldest);
  }
}

void NegotiationStore::End(const std::string& context, std::uint64_t serial) {
  const std::lock_guard lock(mutex_);
  const auto found = entries_.find(context);
  if (found != entries_.end() && found->second.serial == serial) {
    entries_.erase(found);
  }
}

}  // namespace DevSts
