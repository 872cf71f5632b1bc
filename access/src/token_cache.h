#ifndef SSOCLIENT_ACCESS_TOKEN_CACHE_H
#define SSOCLIENT_ACCESS_TOKEN_CACHE_H

#include <array>
#include <atomic>
#include <chrono>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <mutex>
#include <unordered_map>
#include <vector>

#include <ssoclient/saml_token.h>

#include "cache_key.h"
#include "token_life.h"

namespace SsoClient::Access {

/// One token in the cache. Everything but the two marks is constant.
class CacheEntry {
 public:
  static constexpr std::size_t kReplicas = 8;

  CacheEntry(KeyPtr key, std::shared_ptr<const SamlToken> token, const TokenLife& life,
             const Instant& now);

  const KeyPtr& Key() const noexcept { return key_; }
  const std::shared_ptr<const SamlToken>& Token() const noexcept { return token_; }
  const TokenLife& Life() const noexcept { return life_; }
  /// A reference to the token whose count only the threads with this index change.
  const std::shared_ptr<const SamlToken>& Replica(std::size_t index) const noexcept {
    return replicas_[index];
  }

  /// True when a caller has asked for the token since it was received.
  bool IsAsked() const noexcept { return isAsked_.load(std::memory_order_relaxed); }
  std::int64_t LastUse() const noexcept { return lastUse_.load(std::memory_order_relaxed); }
  /// Notes that a caller has asked for the token; true for the first one.
  bool MarkUsed(const Instant& now) noexcept;

 private:
  const KeyPtr key_;
  const std::shared_ptr<const SamlToken> token_;
  const TokenLife life_;
  std::array<std::shared_ptr<const SamlToken>, kReplicas> replicas_;
  std::atomic<bool> isAsked_{false};
  std::atomic<std::int64_t> lastUse_;  // seconds on the steady clock
};
using EntryPtr = std::shared_ptr<CacheEntry>;

/// The tokens of a source. Readers on different threads share no cache line that either writes:
/// each thread uses one of a few locks, all of which a writer takes, and one of the token's
/// replicas.
class TokenCache {
 public:
  explicit TokenCache(std::size_t capacity) : capacity_(capacity) {}

  struct Hit {
    std::shared_ptr<const SamlToken> token;  ///< null for a miss
    /// Nobody had asked for the token before its refresh was due, so that it was left out.
    bool wantsRefresh = false;
  };
  /// Looks up a token that is usable for `minimumLife`. Thread-safe; does not allocate.
  Hit Find(const SpecView& spec, const Instant& now, std::chrono::seconds minimumLife) noexcept;
  /// The number of successful look-ups. Thread-safe.
  std::uint64_t Hits() const;

  // Writers exclude each other by the lock of the source. With it, they read without these locks.

  /// The entry of a key, usable or not; null without one.
  EntryPtr Peek(const SpecView& spec) const;
  /// Adds an entry, or replaces the one with its key. Returns what had to make room, which is never
  /// an entry with a key that `isKept` accepts: if all are, the cache grows.
  template <class IsKept>
  EntryPtr Insert(EntryPtr entry, const IsKept& isKept) {
    EntryPtr evicted;
    if (entries_.size() >= capacity_ && Peek(SpecView(*entry->Key())) == nullptr) {
      evicted = LeastUsed(isKept);
      if (evicted != nullptr) {
        Remove(SpecView(*evicted->Key()));
      }
    }
    Store(std::move(entry));
    return evicted;
  }
  void Remove(const SpecView& spec);
  void Clear();
  std::size_t Size() const noexcept { return entries_.size(); }
  template <class Visit>
  void ForEach(const Visit& visit) const {
    for (const auto& [key, entry] : entries_) {
      visit(entry);
    }
  }

 private:
  using Entries = std::unordered_map<KeyPtr, EntryPtr, KeyHash, KeyEqual>;

  struct alignas(64) Slot {
    mutable std::mutex mutex;
    std::uint64_t hits = 0;
  };
  class AllSlots;

  /// Null when all are kept.
  template <class IsKept>
  EntryPtr LeastUsed(const IsKept& isKept) const {
    EntryPtr found;
    for (const auto& [key, entry] : entries_) {
      const bool isBetter = found == nullptr || entry->LastUse() < found->LastUse();
      if (isBetter && !isKept(key)) {
        found = entry;
      }
    }
    return found;
  }
  void Store(EntryPtr entry);

  // First, since they are aligned to cache lines.
  std::array<Slot, CacheEntry::kReplicas> slots_;
  const std::size_t capacity_;
  Entries entries_;
};

}  // namespace SsoClient::Access

#endif
