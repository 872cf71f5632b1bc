#ifndef DEVSTS_OPERATIONS_TOKEN_STORE_H
#define DEVSTS_OPERATIONS_TOKEN_STORE_H

#include <cstddef>
#include <deque>
#include <map>
#include <mutex>
#include <optional>
#include <string>

#include "soap/assertion_writer.h"

namespace DevSts {

struct IssuedToken {
  TokenContent content;
  bool revoked = false;
};

// The most recently issued tokens, by ID. Thread-safe.
class TokenStore {
 public:
  explicit TokenStore(std::size_t limit) : limit_(limit) {}

  void Remember(const std::string& id, TokenContent content);
  // Returns false if there is no token with this ID.
  bool Revoke(const std::string& id);
  std::optional<IssuedToken> Find(const std::string& id) const;

 private:
  const std::size_t limit_;
  mutable std::mutex mutex_;
  std::map<std::string, IssuedToken> tokens_;
  std::deque<std::string> order_;
};

}  // namespace DevSts

#endif
