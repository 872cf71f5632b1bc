#include "operations/token_store.h"

#include <utility>

namespace DevSts {

void TokenStore::Remember(const std::string& id, TokenContent content) {
  const std::lock_guard lock(mutex_);
  if (!tokens_.insert_or_assign(id, IssuedToken{std::move(content)}).second) {
    return;
  }
  order_.push_back(id);
  if (order_.size() > limit_) {
    tokens_.erase(order_.front());
    order_.pop_front();
  }
}

bool TokenStore::Revoke(const std::string& id) {
  const std::lock_guard lock(mutex_);
  const auto found = tokens_.find(id);
  if (found == tokens_.end()) {
    return false;
  }
  found->second.revoked = true;
  return true;
}

std::optional<IssuedToken> TokenStore::Find(const std::string& id) const {
  const std::lock_guard lock(mutex_);
  const auto found = tokens_.find(id);
  return found != tokens_.end() ? std::optional(found->second) : std::nullopt;
}

}  // namespace DevSts
