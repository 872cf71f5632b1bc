#include "refresh_schedule.h"

namespace SsoClient::Access {

RefreshSchedule::Item& RefreshSchedule::Set(const KeyPtr& key, Instant::Steady at) {
  const auto found = items_.try_emplace(key).first;
  // The pointer that is in both containers.
  const KeyPtr& known = found->first;
  byTime_.insert({at, known});
  Item& item = found->second;
  if (item.at != at) {
    byTime_.erase({item.at, known});
    item.at = at;
  }
  return item;
}

void RefreshSchedule::Remove(const KeyPtr& key) {
  const auto found = items_.find(key);
  if (found == items_.end()) {
    return;
  }
  byTime_.erase({found->second.at, found->first});
  items_.erase(found);
}

void RefreshSchedule::Clear() {
  byTime_.clear();
  items_.clear();
}

RefreshSchedule::Item* RefreshSchedule::Find(const KeyPtr& key) {
  const auto found = items_.find(key);
  return found == items_.end() ? nullptr : &found->second;
}

boost::optional<Instant::Steady> RefreshSchedule::Earliest() const {
  if (byTime_.empty()) {
    return boost::none;
  }
  return byTime_.begin()->first;
}

std::vector<KeyPtr> RefreshSchedule::Due(Instant::Steady now, std::size_t limit) const {
  std::vector<KeyPtr> due;
  for (const auto& [at, key] : byTime_) {
    if (at > now || due.size() == limit) {
      break;
    }
    due.push_back(key);
  }
  return due;
}

std::vector<KeyPtr> RefreshSchedule::EndOutage() {
  std::vector<KeyPtr> keys;
  for (auto& [key, item] : items_) {
    if (item.failures > 0 && item.isOutage) {
      item.failures = 0;
      item.isOutage = false;
      keys.push_back(key);
    }
  }
  return keys;
}

}  // namespace SsoClient::Access
