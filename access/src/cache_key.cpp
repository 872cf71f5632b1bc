#include "cache_key.h"

#include <chrono>
#include <cstdint>
#include <exception>
#include <functional>
#include <string_view>

#include <ssoclient/saml_token.h>

#include "secret.h"

namespace SsoClient::Access {

namespace {

// Random, so that whoever chooses an audience or an advice cannot choose its hash.
SecretTagger MakeTagger() noexcept {
  try {
    return SecretTagger();
  } catch (const std::exception&) {
    // No random numbers: the next best that nobody outside knows.
    const auto now = std::chrono::steady_clock::now().time_since_epoch().count();
    return SecretTagger({static_cast<std::uint64_t>(now), std::hash<const void*>()(&now)});
  }
}

// Made when the library is loaded: a child that was forked while another thread made it would wait
// for that thread.
const SecretTagger keyTagger = MakeTagger();

std::uint64_t TagOf(std::string_view text) noexcept {
  return keyTagger.TagOf(text);
}

class Hasher {
 public:
  void Add(std::size_t value) noexcept {
    // 2^64 divided by the golden ratio spreads neighbouring values.
    state_ ^= value + 0x9e3779b97f4a7c15U + (state_ << 6) + (state_ >> 2);
  }
  void Add(std::string_view text) noexcept { Add(std::size_t{TagOf(text)}); }
  std::size_t Result() const noexcept { return state_; }

 private:
  std::size_t state_ = 0;
};

void AddAdvice(Hasher& hasher, const std::vector<Advice>& advice) noexcept {
  for (const Advice& block : advice) {
    hasher.Add(block.source);
    for (const AdviceAttribute& attribute : block.attributes) {
      hasher.Add(attribute.name);
      hasher.Add(attribute.values.size());
      for (const std::string& value : attribute.values) {
        hasher.Add(value);
      }
    }
  }
}

bool AreEqual(const AdviceAttribute& a, const AdviceAttribute& b) noexcept {
  return a.name == b.name && a.values == b.values;
}

bool AreEqual(const Advice& a, const Advice& b) noexcept {
  if (a.source != b.source || a.attributes.size() != b.attributes.size()) {
    return false;
  }
  for (std::size_t i = 0; i < a.attributes.size(); ++i) {
    if (!AreEqual(a.attributes[i], b.attributes[i])) {
      return false;
    }
  }
  return true;
}

bool AreEqual(const std::vector<Advice>& a, const std::vector<Advice>& b) noexcept {
  if (a.size() != b.size()) {
    return false;
  }
  for (std::size_t i = 0; i < a.size(); ++i) {
    if (!AreEqual(a[i], b[i])) {
      return false;
    }
  }
  return true;
}

const SamlToken* ActAsToken(const TokenSpec& spec) noexcept {
  return spec.actAsToken ? spec.actAsToken->get() : nullptr;
}

bool AreEqual(const SamlToken* a, const SamlToken* b) noexcept {
  if (a == b) {
    return true;
  }
  return a != nullptr && b != nullptr && a->Xml() == b->Xml();
}

// All values but the default mean the same.
bool IsBearer(const TokenSpec& spec) noexcept {
  return spec.confirmation != CONFIRMATION_DEFAULT;
}

std::size_t Flags(const TokenSpec& spec) noexcept {
  return (spec.delegable ? 1U : 0U) | (spec.renewable ? 2U : 0U) | (IsBearer(spec) ? 4U : 0U);
}

}  // namespace

std::size_t HashOf(const TokenSpec& spec) noexcept {
  Hasher hasher;
  hasher.Add(static_cast<std::size_t>(spec.tokenLifetimeSec));
  hasher.Add(Flags(spec));
  hasher.Add(spec.audienceRestriction.size());
  for (const std::string& audience : spec.audienceRestriction) {
    hasher.Add(audience);
  }
  AddAdvice(hasher, spec.advice);
  if (spec.delegateTo) {
    hasher.Add(*spec.delegateTo);
  }
  if (const SamlToken* actAs = ActAsToken(spec)) {
    hasher.Add(actAs->Id());
  }
  return hasher.Result();
}

bool AreEqual(const TokenSpec& a, const TokenSpec& b) noexcept {
  return a.tokenLifetimeSec == b.tokenLifetimeSec && Flags(a) == Flags(b) &&
         a.audienceRestriction == b.audienceRestriction && a.delegateTo == b.delegateTo &&
         AreEqual(a.advice, b.advice) && AreEqual(ActAsToken(a), ActAsToken(b));
}

KeyPtr MakeKey(const TokenSpec& spec) {
  return std::make_shared<const CacheKey>(CacheKey{spec, HashOf(spec)});
}

}  // namespace SsoClient::Access
