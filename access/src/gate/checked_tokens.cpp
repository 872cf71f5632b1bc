#include "gate/checked_tokens.h"

#include <algorithm>
#include <utility>

namespace SsoClient::Access {

namespace {

constexpr std::size_t kMostShards = 16;
// A shard is not smaller, so that digests fill shards of a small cache evenly enough and large
// tokens find room in them.
constexpr std::size_t kFewestEntries = 64;
constexpr std::size_t kFewestBytes = std::size_t{2} * 1024 * 1024;

std::size_t CountShards(const GateCacheConfig& config) noexcept {
  if (config.tokens == 0 || config.bytes == 0) {
    return 0;
  }
  const std::size_t most = std::min(config.tokens / kFewestEntries, config.bytes / kFewestBytes);
  return std::clamp<std::size_t>(most, 1, kMostShards);
}

// The part of `total` for the shard with this index; the parts have this sum.
std::size_t Part(std::size_t total, std::size_t index, std::size_t count) noexcept {
  return total / count + (index < total % count ? 1 : 0);
}

}  // namespace

std::size_t MemoryOf(std::string_view text) noexcept {
  std::size_t bytes = 1024 + 3 * text.size();
  char previous = '<';
  for (const char current : text) {
    const bool beginsText = previous == '>' && current != '<';
    bytes += current == '<' ? 72 : current == '=' ? 32 : 0;
    bytes += beginsText ? 56 : 0;
    previous = current;
  }
  return bytes;
}

CheckedTokens::CheckedTokens(const GateCacheConfig& config) : shards_(CountShards(config)) {
  for (std::size_t i = 0; i < shards_.size(); ++i) {
    shards_[i].mostEntries = Part(config.tokens, i, shards_.size());
    shards_[i].mostBytes = Part(config.bytes, i, shards_.size());
  }
}

CheckedTokens::Shard& CheckedTokens::ShardOf(const Key& key) noexcept {
  // A byte that is not part of the hash.
  return shards_[key.back() % shards_.size()];
}

void CheckedTokens::Shard::Adopt(std::uint64_t newVersion, Entries& removed) {
  if (version == newVersion) {
    return;
  }
  version = newVersion;
  bytes = 0;
  places.clear();
  removed.splice(removed.end(), entries);
}

void CheckedTokens::Shard::Take(Entries::iterator entry, Entries& removed) {
  bytes -= entry->bytes;
  places.erase(entry->key);
  removed.splice(removed.end(), entries, entry);
}

void CheckedTokens::Shard::MakeRoom(std::size_t needed, Entries& removed) {
  while (!entries.empty() && (entries.size() >= mostEntries || bytes > mostBytes - needed)) {
    Take(std::prev(entries.end()), removed);
    ++evictions;
  }
}

CheckedTokens::Token CheckedTokens::Find(const Key& key, std::uint64_t version) {
  Entries removed;
  Shard& shard = ShardOf(key);
  const std::lock_guard lock(shard.mutex);
  shard.Adopt(version, removed);
  const auto place = shard.places.find(key);
  if (place == shard.places.end()) {
    return nullptr;
  }
  shard.entries.splice(shard.entries.begin(), shard.entries, place->second);
  return place->second->token;
}

void CheckedTokens::Insert(const Key& key, std::uint64_t version, Token token, std::size_t bytes) {
  Entries removed;
  Entries added;
  added.push_back({key, std::move(token), bytes});
  Shard& shard = ShardOf(key);
  const std::lock_guard lock(shard.mutex);
  shard.Adopt(version, removed);
  if (bytes > shard.mostBytes) {
    return;
  }
  const auto [place, isNew] = shard.places.try_emplace(key, added.begin());
  if (!isNew) {
    shard.bytes -= place->second->bytes;
    removed.splice(removed.end(), shard.entries, place->second);
    place->second = added.begin();
  }
  shard.MakeRoom(bytes, removed);
  shard.bytes += bytes;
  shard.entries.splice(shard.entries.begin(), added);
}

void CheckedTokens::Remove(const Key& key, const CheckedToken& token) {
  Entries removed;
  Shard& shard = ShardOf(key);
  const std::lock_guard lock(shard.mutex);
  const auto place = shard.places.find(key);
  if (place != shard.places.end() && place->second->token.get() == &token) {
    shard.Take(place->second, removed);
  }
}

void CheckedTokens::AddTo(GateMetrics& metrics) const {
  for (const Shard& shard : shards_) {
    const std::lock_guard lock(shard.mutex);
    metrics.evictions += shard.evictions;
    metrics.cachedTokens += shard.entries.size();
    metrics.cachedBytes += shard.bytes;
  }
}

}  // namespace SsoClient::Access
