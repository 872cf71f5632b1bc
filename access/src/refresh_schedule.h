#ifndef SSOCLIENT_ACCESS_REFRESH_SCHEDULE_H
#define SSOCLIENT_ACCESS_REFRESH_SCHEDULE_H

#include <set>
#include <unordered_map>
#include <utility>
#include <vector>

#include <boost/optional.hpp>

#include "cache_key.h"
#include "instant.h"

namespace SsoClient::Access {

/// When each key is looked at next: to refresh its token, to try that again, or to drop the token.
/// Not thread-safe.
class RefreshSchedule {
 public:
  struct Item {
    int failures = 0;       ///< consecutive ones of refreshes
    bool isOutage = false;  ///< no endpoint has decided the last one
    bool isPinned = false;  ///< refreshed although nobody asks
    Instant::Steady at = Instant::Steady::max();
    /// When the next background request may begin.
    Instant::Steady notBefore = Instant::Steady::min();
    /// From then on the answer of an endpoint moves the key forward.
    Instant::Steady nextWake = Instant::Steady::min();
  };

  /// Adds the key if it is not there, and moves it to `at`. The reference is valid until the key is
  /// removed. Only to add a key needs memory; without it, nothing changes.
  Item& Set(const KeyPtr& key, Instant::Steady at);
  void Remove(const KeyPtr& key);
  void Clear();
  /// Null if the key is not there.
  Item* Find(const KeyPtr& key);
  /// The earliest time; not set when there is no key.
  boost::optional<Instant::Steady> Earliest() const;
  /// The keys whose time has come, at most `limit`, the earliest first.
  std::vector<KeyPtr> Due(Instant::Steady now, std::size_t limit) const;
  /// Visits the keys whose last refresh has failed in an outage. `visit` may move its key.
  template <class Visit>
  void ForEachInOutage(const Visit& visit) {
    for (auto& [key, item] : items_) {
      if (item.isOutage) {
        visit(key, item);
      }
    }
  }

 private:
  Item& Add(const KeyPtr& key, Instant::Steady at);
  void Move(const KeyPtr& key, Item& item, Instant::Steady at) noexcept;

  struct Earlier {
    bool operator()(const std::pair<Instant::Steady, KeyPtr>& a,
                    const std::pair<Instant::Steady, KeyPtr>& b) const noexcept {
      return a.first != b.first ? a.first < b.first : a.second < b.second;
    }
  };

  std::unordered_map<KeyPtr, Item, KeyHash, KeyEqual> items_;
  std::set<std::pair<Instant::Steady, KeyPtr>, Earlier> byTime_;
};

}  // namespace SsoClient::Access

#endif
