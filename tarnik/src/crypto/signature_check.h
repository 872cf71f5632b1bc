#ifndef TARNIK_CRYPTO_SIGNATURE_CHECK_H
#define TARNIK_CRYPTO_SIGNATURE_CHECK_H

#include <cstddef>
#include <vector>

#include "crypto/hash.h"
#include "crypto/public_key_impl.h"
#include "crypto/signature_scheme.h"

namespace Tarnik::Crypto {

/// True for an ECDSA signature in the form of RFC 3279, section 2.2.3, in DER: a sequence of two
/// positive numbers of at most `orderLength` bytes in their shortest form, and nothing else.
bool IsEcdsaDer(const std::vector<unsigned char>& signature, std::size_t orderLength) noexcept;

/// True when `signature` is one of `digest`, which was computed with `hash`. False for a signature
/// of a wrong length or form. The key must be of the scheme's type. Throws `CryptoException` when
/// the key cannot be used with `scheme` and `hash`, or OpenSSL fails.
bool IsSignatureOf(const PublicKeyImpl& key, SignatureScheme scheme, Hash hash,
                   const unsigned char* digest, const std::vector<unsigned char>& signature);

}  // namespace Tarnik::Crypto

#endif
