#ifndef SSOCLIENT_ACCESS_SECRET_H
#define SSOCLIENT_ACCESS_SECRET_H

#include <array>
#include <cstdint>
#include <string>
#include <string_view>

#include <tarnik/text/string_util.h>

namespace SsoClient::Access {

/// A password, which is cleansed from memory when it is destroyed. An aggregate, so that the text
/// that a function returns is constructed in it and not copied.
struct Secret {
  std::string text{};

  ~Secret() { Tarnik::StringUtil::Cleanse(text); }
};

/// Recognises a secret, or another text, without keeping it: SipHash-2-4 with a random key. With
/// its 64 bits, the secret cannot be found again even by who knows the key, except among a few
/// guesses.
class SecretTagger {
 public:
  using Key = std::array<std::uint64_t, 2>;
  using Tag = std::uint64_t;

  SecretTagger();
  explicit SecretTagger(const Key& key) : key_(key) {}

  Tag TagOf(std::string_view secret) const noexcept;

 private:
  const Key key_;
};

}  // namespace SsoClient::Access

#endif
