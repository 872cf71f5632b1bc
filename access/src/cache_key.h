#ifndef SSOCLIENT_ACCESS_CACHE_KEY_H
#define SSOCLIENT_ACCESS_CACHE_KEY_H

#include <cstddef>
#include <memory>

#include <ssoclient/token_spec.h>

namespace SsoClient::Access {

/// A hash of every field of `spec`; of the act-as token, its id. It differs from process to
/// process, and who does not know the key of the process finds no specs with equal hashes. Does not
/// allocate.
std::size_t HashOf(const TokenSpec& spec) noexcept;

/// True when both ask for the same token. Act-as tokens are equal when their texts are.
bool AreEqual(const TokenSpec& a, const TokenSpec& b) noexcept;

/// What a token is cached under.
struct CacheKey {
  TokenSpec spec;
  std::size_t hash;
};
using KeyPtr = std::shared_ptr<const CacheKey>;

KeyPtr MakeKey(const TokenSpec& spec);

/// A spec with its hash, to look up a key without copying the spec.
struct SpecView {
  explicit SpecView(const TokenSpec& s) noexcept : spec(s), hash(HashOf(s)) {}
  explicit SpecView(const CacheKey& key) noexcept : spec(key.spec), hash(key.hash) {}

  const TokenSpec& spec;
  std::size_t hash;
};

/// For containers of `KeyPtr` in which a `SpecView` is looked up.
struct KeyHash {
  using is_transparent = void;
  std::size_t operator()(const KeyPtr& key) const noexcept { return key->hash; }
  std::size_t operator()(const SpecView& view) const noexcept { return view.hash; }
};
struct KeyEqual {
  using is_transparent = void;
  bool operator()(const KeyPtr& a, const KeyPtr& b) const noexcept {
    return a == b || AreEqual(a->spec, b->spec);
  }
  bool operator()(const SpecView& a, const KeyPtr& b) const noexcept {
    return a.hash == b->hash && AreEqual(a.spec, b->spec);
  }
  bool operator()(const KeyPtr& a, const SpecView& b) const noexcept { return (*this)(b, a); }
};

}  // namespace SsoClient::Access

#endif
