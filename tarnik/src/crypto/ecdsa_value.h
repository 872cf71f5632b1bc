#ifndef TARNIK_CRYPTO_ECDSA_VALUE_H
#define TARNIK_CRYPTO_ECDSA_VALUE_H

#include <cstddef>
#include <vector>

namespace Tarnik::Crypto {

/// The form of RFC 3279 section 2.2.3 of an ECDSA signature that is written as XML-Signature 1.1,
/// section 6.4.3 demands: r and s as big-endian numbers of `orderLength` bytes each. Empty when
/// `value` is not of that length, or when r or s is zero.
std::vector<unsigned char> DerFromRawEcdsa(const std::vector<unsigned char>& value,
                                           std::size_t orderLength);

/// The other way. Throws `CryptoException` when `der` is no ECDSA signature, or when a number of it
/// does not fit.
std::vector<unsigned char> RawEcdsaFromDer(const std::vector<unsigned char>& der,
                                           std::size_t orderLength);

}  // namespace Tarnik::Crypto

#endif
