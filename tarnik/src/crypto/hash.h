#ifndef TARNIK_CRYPTO_HASH_H
#define TARNIK_CRYPTO_HASH_H

#include <array>
#include <cstddef>
#include <vector>

#include "support/openssl.h"

namespace Tarnik::Crypto {

enum class Hash : unsigned char { kSha256, kSha384, kSha512 };
inline constexpr std::size_t kHashCount = 3;

/// Length of the hash in bytes.
constexpr std::size_t HashLength(Hash hash) noexcept {
  return std::array<std::size_t, kHashCount>{32, 48, 64}[static_cast<std::size_t>(hash)];
}
inline constexpr std::size_t kMaxHashLength = 64;

/// OpenSSL's implementation of the hash. It is fetched once per process, since OpenSSL's lookup by
/// name costs more than hashing a few hundred bytes. Throws `CryptoException` when OpenSSL does not
/// provide it.
const EVP_MD* FetchedHash(Hash hash);

/// The hash of `bytes`. Throws `CryptoException` when it cannot be computed.
std::vector<unsigned char> HashOf(Hash hash, const unsigned char* bytes, std::size_t length);

}  // namespace Tarnik::Crypto

#endif
