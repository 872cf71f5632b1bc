#ifndef TARNIK_CRYPTO_ECDSA_VALUE_H
#define TARNIK_CRYPTO_ECDSA_VALUE_H

#include <cstddef>
#include <vector>

namespace Tarnik::Crypto {

/// Converts an ECDSA signature from the form of XML Signature 1.1, section 6.4.3 (r and s as
/// big-endian numbers of `orderLength` bytes each) to the form of RFC 3279, section 2.2.3. Both
/// halves may be shorter than `orderLength` by the same number of bytes: some signers omit leading
/// zeros that both numbers have. Empty when `value` is longer or of odd length, and when r or s is
/// zero.
std::vector<unsigned char> DerFromRawEcdsa(const std::vector<unsigned char>& value,
                                           std::size_t orderLength);

/// Converts in the other direction. Throws `CryptoException` when `der` is not an ECDSA signature,
/// or when r or s does not fit into `orderLength` bytes.
std::vector<unsigned char> RawEcdsaFromDer(const std::vector<unsigned char>& der,
                                           std::size_t orderLength);

}  // namespace Tarnik::Crypto

#endif
