#include "http/idle_connections.h"

#include <algorithm>
#include <mutex>
#include <optional>
#include <utility>

#include <tarnik/system/thread_pool.h>

#include "support/object_lock.h"

namespace Tarnik::Http {

IdleConnections::~IdleConnections() {
  for (const Entry& entry : entries_) {
    Discard(entry);
  }
}

void IdleConnections::Discard(const Entry& entry) noexcept {
  entry.expiry->Cancel();
  entry.connection->Close();
}

std::vector<IdleConnections::Entry> IdleConnections::ForgetParent() {
  if (!mark_.IsFromParent()) {
    return {};
  }
  mark_ = ForkMark();
  return std::exchange(entries_, {});
}

Ref<Connection> IdleConnections::Take(const Endpoint& endpoint) {
  while (true) {
    std::vector<Entry> ofParent;
    std::optional<Entry> entry;
    {
      const std::lock_guard guard(ObjectLock(this));
      ofParent = ForgetParent();
      const auto last = std::find_if(entries_.rbegin(), entries_.rend(),
                                     [&](const Entry& each) { return each.endpoint == endpoint; });
      if (last == entries_.rend()) {
        return nullptr;
      }
      entry = std::move(*last);
      entries_.erase(std::next(last).base());
    }
    entry->expiry->Cancel();
    if (entry->connection->Claim()) {
      return entry->connection;
    }
    entry->connection->Close();
  }
}

void IdleConnections::Put(const Endpoint& endpoint, Ref<Connection> connection) {
  const std::uint64_t id = NextId();
  const auto drop = [weak = weak_from_this(), id] {
    if (const auto self = weak.lock()) {
      self->Drop(id);
    }
  };
  // Watched before it can be taken: `Claim` takes an unwatched connection for a lost one.
  connection->Watch(drop);
  Entry entry{id, endpoint, std::move(connection),
              System::GetThreadPool()->RunAfter(kMaxIdleMicroseconds, drop)};
  std::optional<Entry> surplus;
  std::vector<Entry> ofParent;
  {
    const std::lock_guard guard(ObjectLock(this));
    ofParent = ForgetParent();
    if (const auto old = FindSurplus(endpoint); old != entries_.end()) {
      surplus = std::move(*old);
      entries_.erase(old);
    }
    entries_.push_back(std::move(entry));
  }
  if (surplus) {
    Discard(*surplus);
  }
}

std::uint64_t IdleConnections::NextId() {
  const std::lock_guard guard(ObjectLock(this));
  return ++lastId_;
}

std::vector<IdleConnections::Entry>::iterator IdleConnections::FindSurplus(
    const Endpoint& endpoint) {
  const auto isSame = [&](const Entry& entry) { return entry.endpoint == endpoint; };
  const auto count = std::count_if(entries_.begin(), entries_.end(), isSame);
  if (static_cast<std::size_t>(count) >= kMaxIdlePerEndpoint) {
    return std::find_if(entries_.begin(), entries_.end(), isSame);
  }
  return entries_.size() >= kMaxIdle ? entries_.begin() : entries_.end();
}

void IdleConnections::Drop(std::uint64_t id) {
  std::optional<Entry> entry;
  {
    const std::lock_guard guard(ObjectLock(this));
    const auto found = std::find_if(entries_.begin(), entries_.end(),
                                    [&](const Entry& each) { return each.id == id; });
    if (found == entries_.end()) {
      return;
    }
    entry = std::move(*found);
    entries_.erase(found);
  }
  Discard(*entry);
}

}  // namespace Tarnik::Http
