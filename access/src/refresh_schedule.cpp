#include "refresh_schedule.h"

#include <utility>

namespace SsoClient::Access {

RefreshSchedule::Item& RefreshSchedule::Set(const KeyPtr& key, Instant::Steady at) {
  const auto found = items_.find(key);
  if (found == items_.end()) {
    return Add(key, at);
  }
  // The pointer that is in both containers.
  Move(found->first, found->second, at);
  return found->second;
}

RefreshSchedule::Item& RefreshSchedule::Add(const KeyPtr& key, Instant::Steady at) {
  const auto inserted = byTime_.insert({at, key}).first;
  try {
    Item& item = items_[key];
    item.at = at;
    return item;
  } catch (...) {
    byTime_.erase(inserted);
    throw;
  }
}

void RefreshSchedule::Move(const KeyPtr& key, Item& item, Instant::Steady at) noexcept {
  auto node = byTime_.extract({item.at, key});
  node.value().first = at;
  byTime_.insert(std::move(node));
  item.at = at;
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

}  // namespace SsoClient::Access
