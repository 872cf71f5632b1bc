#ifndef SSOCLIENT_ACCESS_GATE_CHECKED_TOKENS_H
#define SSOCLIENT_ACCESS_GATE_CHECKED_TOKENS_H

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <list>
#include <memory>
#include <mutex>
#include <string_view>
#include <unordered_map>
#include <vector>

#include <ssoclient/access/token_gate.h>
#include <tarnik/crypto/digest.h>

#include "gate/verdict_facts.h"

namespace SsoClient::Access {

/// The memory of a remembered token with this text, as it is counted. The nodes and attributes of
/// its document are counted by their marks, since the presenter may add some of a few bytes to any
/// token: comments, and elements in the KeyInfo of its signature, which is not signed.
std::size_t MemoryOf(std::string_view text) noexcept;

/// The tokens that a gate has accepted, by the SHA-256 of their texts. Thread-safe: the tokens are
/// in a few shards, each with a lock that is held for a look-up. What is removed is destroyed
/// without a lock.
class CheckedTokens {
 public:
  using Key = Tarnik::Crypto::Sha256Digest;
  using Token = std::shared_ptr<const CheckedToken>;

  explicit CheckedTokens(const GateCacheConfig& config);

  /// False when nothing is ever kept.
  bool IsUsed() const noexcept { return !shards_.empty(); }
  /// The token that was checked with this version of the trust; null without one. Tokens that were
  /// checked with another version are removed.
  Token Find(const Key& key, std::uint64_t version);
  /// Adds a token of `bytes` bytes, or replaces the one with its key. Tokens that were not found
  /// for the longest make room. One that is larger than a shard is not kept.
  void Insert(const Key& key, std::uint64_t version, Token token, std::size_t bytes);
  /// Removes `token` if it is still the one with this key.
  void Remove(const Key& key, const CheckedToken& token);

  /// Sets the members of `metrics` that are counted here.
  void AddTo(GateMetrics& metrics) const;

 private:
  struct Entry {
    Key key;
    Token token;
    std::size_t bytes;
  };
  using Entries = std::list<Entry>;
  // Only accepted tokens are kept. Their presenters can choose digests, by adding comments and
  // white space until one fits, but what is in a full bucket slows only the look-ups there.
  struct KeyHash {
    std::size_t operator()(const Key& key) const noexcept {
      std::size_t hash = 0;
      std::memcpy(&hash, key.data(), sizeof(hash));
      return hash;
    }
  };
  struct alignas(64) Shard {
    mutable std::mutex mutex;
    std::uint64_t version = 0;  // of all entries
    Entries entries;            // the one that was used last is first
    std::unordered_map<Key, Entries::iterator, KeyHash> places;
    std::size_t mostEntries = 0;
    std::size_t mostBytes = 0;
    std::size_t bytes = 0;
    std::uint64_t evictions = 0;

    // With the lock. What is removed is moved to `removed`.
    void Adopt(std::uint64_t newVersion, Entries& removed);
    void Take(Entries::iterator entry, Entries& removed);
    void MakeRoom(std::size_t needed, Entries& removed);
  };

  Shard& ShardOf(const Key& key) noexcept;

  std::vector<Shard> shards_;
};

}  // namespace SsoClient::Access

#endif
