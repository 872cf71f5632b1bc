#include "token_cache.h"

#include <utility>

namespace SsoClient::Access {

namespace {

// The count of a replica is in a cache line of its own.
struct alignas(64) Holder {
  std::shared_ptr<const SamlToken> token;
};

std::shared_ptr<const SamlToken> MakeReplica(const std::shared_ptr<const SamlToken>& token) {
  const auto holder = std::make_shared<Holder>(Holder{token});
  return {holder, token.get()};
}

std::size_t OwnSlot() noexcept {
  static std::atomic<std::size_t> next{0};
  thread_local const std::size_t own =
      next.fetch_add(1, std::memory_order_relaxed) % CacheEntry::kReplicas;
  return own;
}

std::int64_t SecondsOf(const Instant& now) noexcept {
  return std::chrono::duration_cast<std::chrono::seconds>(now.steady.time_since_epoch()).count();
}

}  // namespace

CacheEntry::CacheEntry(KeyPtr key, std::shared_ptr<const SamlToken> token, const TokenLife& life,
                       const Instant& now)
    : key_(std::move(key)), token_(std::move(token)), life_(life), lastUse_(SecondsOf(now)) {
  for (auto& replica : replicas_) {
    replica = MakeReplica(token_);
  }
}

bool CacheEntry::MarkUsed(const Instant& now) noexcept {
  const std::int64_t seconds = SecondsOf(now);
  if (LastUse() != seconds) {
    lastUse_.store(seconds, std::memory_order_relaxed);
  }
  if (IsAsked()) {
    return false;
  }
  return !isAsked_.exchange(true, std::memory_order_relaxed);
}

class TokenCache::AllSlots {
 public:
  explicit AllSlots(TokenCache& cache) : cache_(cache) {
    for (Slot& slot : cache_.slots_) {
      slot.mutex.lock();
    }
  }
  ~AllSlots() {
    for (Slot& slot : cache_.slots_) {
      slot.mutex.unlock();
    }
  }
  AllSlots(const AllSlots&) = delete;
  AllSlots& operator=(const AllSlots&) = delete;

 private:
  TokenCache& cache_;
};

TokenCache::Hit TokenCache::Find(const SpecView& spec, const Instant& now,
                                 std::chrono::seconds minimumLife) noexcept {
  const std::size_t own = OwnSlot();
  Slot& slot = slots_[own];
  const std::lock_guard lock(slot.mutex);
  const auto found = entries_.find(spec);
  if (found == entries_.end() || !found->second->Life().IsUsable(now, minimumLife)) {
    return {};
  }
  CacheEntry& entry = *found->second;
  ++slot.hits;
  const bool isFirst = entry.MarkUsed(now);
  return {entry.Replica(own), isFirst && entry.Life().IsDue(now)};
}

std::uint64_t TokenCache::Hits() const {
  std::uint64_t hits = 0;
  for (const Slot& slot : slots_) {
    const std::lock_guard lock(slot.mutex);
    hits += slot.hits;
  }
  return hits;
}

EntryPtr TokenCache::Peek(const SpecView& spec) const {
  const auto found = entries_.find(spec);
  return found == entries_.end() ? nullptr : found->second;
}

void TokenCache::Remove(const SpecView& spec) {
  Entries::node_type removed;  // destroyed without the locks
  const AllSlots lock(*this);
  if (const auto found = entries_.find(spec); found != entries_.end()) {
    removed = entries_.extract(found);
  }
}

void TokenCache::Clear() {
  Entries removed;
  const AllSlots lock(*this);
  removed.swap(entries_);
}

void TokenCache::Store(EntryPtr entry) {
  const KeyPtr key = entry->Key();
  const AllSlots lock(*this);
  // The old entry, if there is one, is destroyed after the locks are released.
  entries_[key].swap(entry);
}

}  // namespace SsoClient::Access
