#ifndef SSOCLIENT_ACCESS_REFUSED_SPECS_H
#define SSOCLIENT_ACCESS_REFUSED_SPECS_H

#include <chrono>
#include <cstddef>
#include <list>
#include <string>
#include <unordered_map>

#include <ssoclient/token_spec.h>

#include "failure.h"
#include "instant.h"
#include "secret.h"

namespace SsoClient::Access {

/// Refusals that count for one spec only, since the token to exchange or to act as may be the
/// reason. Keeps a hash of the spec instead of its text, and at most `capacity` refusals: the
/// oldest are forgotten first. Each operation takes the same time whatever their number. Not
/// thread-safe.
class RefusedSpecs {
 public:
  using Tag = SecretTagger::Tag;

  RefusedSpecs(std::size_t capacity, std::chrono::seconds memory)
      : capacity_(capacity), memory_(memory) {}

  /// The refusal that is remembered for `spec` with a secret; not set without one. Throws
  /// `std::bad_alloc`.
  Failure Find(const TokenSpec& spec, Tag secret, Instant::Steady now) const;
  /// Without memory, it is not remembered, and the next request is sent.
  void Remember(const TokenSpec& spec, Tag secret, const Failure& refusal,
                Instant::Steady now) noexcept;
  void Forget(const TokenSpec& spec, Tag secret) noexcept;
  std::size_t Size() const noexcept { return byTag_.size(); }

 private:
  struct Item {
    Tag tag;
    Failure refusal;
    Instant::Steady until;
  };
  using Items = std::list<Item>;

  Tag TagOf(const TokenSpec& spec, Tag secret) const;
  void Drop(Items::iterator item) noexcept;

  const std::size_t capacity_;
  const std::chrono::seconds memory_;
  const SecretTagger tagger_;
  Items items_;  ///< the oldest first
  std::unordered_map<Tag, Items::iterator> byTag_;
};

}  // namespace SsoClient::Access

#endif
