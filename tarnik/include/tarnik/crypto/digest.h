#ifndef TARNIK_CRYPTO_DIGEST_H
#define TARNIK_CRYPTO_DIGEST_H

#include <array>
#include <cstddef>
#include <string_view>

#include <tarnik/export.h>

namespace Tarnik::Crypto {

/// A SHA-256 digest (FIPS 180-4, section 6.2).
using Sha256Digest = std::array<unsigned char, 32>;

/// The SHA-256 digest of `bytes`. Safe from many threads. Throws `CryptoException` when OpenSSL
/// does not provide SHA-256, or memory runs out: OpenSSL may allocate some bytes for each digest,
/// and nothing else is allocated once a few digests were computed.
TARNIK_EXPORT Sha256Digest Sha256(std::string_view bytes);

/// True when the `length` bytes at `a` and at `b` are equal. The time depends only on `length`, so
/// that it does not show where secret or unpredictable values differ. The pointers may be null when
/// `length` is 0. `operator==` of digests takes a time that depends on their bytes.
TARNIK_EXPORT bool IsEqualInConstantTime(const void* a, const void* b, std::size_t length) noexcept;

}  // namespace Tarnik::Crypto

#endif
