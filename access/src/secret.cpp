#include "secret.h"

#include <bit>
#include <random>

namespace SsoClient::Access {

namespace {

struct SipState {
  std::uint64_t v0, v1, v2, v3;

  void Round() noexcept {
    v0 += v1;
    v1 = std::rotl(v1, 13) ^ v0;
    v0 = std::rotl(v0, 32);
    v2 += v3;
    v3 = std::rotl(v3, 16) ^ v2;
    v0 += v3;
    v3 = std::rotl(v3, 21) ^ v0;
    v2 += v1;
    v1 = std::rotl(v1, 17) ^ v2;
    v2 = std::rotl(v2, 32);
  }

  void Absorb(std::uint64_t word) noexcept {
    v3 ^= word;
    Round();
    Round();
    v0 ^= word;
  }
};

// At most eight bytes, the first one lowest.
std::uint64_t WordOf(std::string_view bytes) noexcept {
  std::uint64_t word = 0;
  for (std::size_t i = 0; i < bytes.size(); ++i) {
    word |= std::uint64_t{static_cast<unsigned char>(bytes[i])} << (8 * i);
  }
  return word;
}

SecretTagger::Key RandomKey() {
  std::random_device random;
  const auto word = [&random] { return (std::uint64_t{random()} << 32) | random(); };
  return {word(), word()};
}

}  // namespace

SecretTagger::SecretTagger() : key_(RandomKey()) {}

SecretTagger::Tag SecretTagger::TagOf(std::string_view secret) const noexcept {
  constexpr std::size_t kWord = 8;
  SipState state{key_[0] ^ 0x736f6d6570736575U, key_[1] ^ 0x646f72616e646f6dU,
                 key_[0] ^ 0x6c7967656e657261U, key_[1] ^ 0x7465646279746573U};
  const std::uint64_t length = secret.size();
  for (; secret.size() >= kWord; secret.remove_prefix(kWord)) {
    state.Absorb(WordOf(secret.substr(0, kWord)));
  }
  state.Absorb(WordOf(secret) | (length << 56));
  state.v2 ^= 0xff;
  for (int round = 0; round < 4; ++round) {
    state.Round();
  }
  return state.v0 ^ state.v1 ^ state.v2 ^ state.v3;
}

}  // namespace SsoClient::Access
