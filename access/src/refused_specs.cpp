#include "refused_specs.h"

#include <new>
#include <string_view>

#include <ssoclient/saml_token.h>

namespace SsoClient::Access {

namespace {

// A text that differs for specs that differ. Cleansed, since it may have the text of a token.
class Identity {
 public:
  void Add(std::string_view text) {
    Add(text.size());
    text_.text += text;
  }
  void Add(std::size_t number) { text_.text += std::to_string(number) + ':'; }
  void Add(const std::vector<Advice>& advice) {
    Add(advice.size());
    for (const Advice& block : advice) {
      Add(block.source);
      Add(block.attributes.size());
      for (const AdviceAttribute& attribute : block.attributes) {
        Add(attribute.name);
        AddAll(attribute.values);
      }
    }
  }
  template <class Texts>
  void AddAll(const Texts& texts) {
    Add(texts.size());
    for (const std::string& text : texts) {
      Add(text);
    }
  }
  std::string_view Text() const noexcept { return text_.text; }

 private:
  Secret text_;
};

std::size_t FlagsOf(const TokenSpec& spec) noexcept {
  return (spec.delegable ? 1U : 0U) | (spec.renewable ? 2U : 0U) |
         (spec.confirmation != CONFIRMATION_DEFAULT ? 4U : 0U) | (spec.delegateTo ? 8U : 0U) |
         (spec.actAsToken ? 16U : 0U);
}

}  // namespace

Failure RefusedSpecs::Find(const TokenSpec& spec, Tag secret, Instant::Steady now) const {
  if (items_.empty()) {
    return {};
  }
  const auto found = byTag_.find(TagOf(spec, secret));
  const bool isKnown = found != byTag_.end() && now < found->second->until;
  return isKnown ? found->second->refusal : Failure();
}

void RefusedSpecs::Remember(const TokenSpec& spec, Tag secret, const Failure& refusal,
                            Instant::Steady now) noexcept {
  Forget(spec, secret);
  while (!items_.empty() && (items_.size() >= capacity_ || now >= items_.front().until)) {
    Drop(items_.begin());
  }
  try {
    items_.push_back({TagOf(spec, secret), refusal, now + memory_});
  } catch (const std::bad_alloc&) {
    return;
  }
  try {
    byTag_.emplace(items_.back().tag, std::prev(items_.end()));
  } catch (const std::bad_alloc&) {
    items_.pop_back();
  }
}

void RefusedSpecs::Forget(const TokenSpec& spec, Tag secret) noexcept {
  if (items_.empty()) {
    return;
  }
  try {
    if (const auto found = byTag_.find(TagOf(spec, secret)); found != byTag_.end()) {
      Drop(found->second);
    }
  } catch (const std::bad_alloc&) {
    // It is forgotten in its time.
  }
}

void RefusedSpecs::Drop(Items::iterator item) noexcept {
  byTag_.erase(item->tag);
  items_.erase(item);
}

RefusedSpecs::Tag RefusedSpecs::TagOf(const TokenSpec& spec, Tag secret) const {
  Identity identity;
  identity.Add(static_cast<std::size_t>(secret));
  identity.Add(static_cast<std::size_t>(spec.tokenLifetimeSec));
  identity.Add(FlagsOf(spec));
  identity.AddAll(spec.audienceRestriction);
  identity.Add(spec.advice);
  if (spec.delegateTo) {
    identity.Add(*spec.delegateTo);
  }
  if (spec.actAsToken) {
    identity.Add((*spec.actAsToken)->Xml());
  }
  return tagger_.TagOf(identity.Text());
}

}  // namespace SsoClient::Access
