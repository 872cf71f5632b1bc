#ifndef TARNIK_CRYPTO_PUBLIC_KEY_INFO_H
#define TARNIK_CRYPTO_PUBLIC_KEY_INFO_H

#include <cstddef>
#include <string>
#include <string_view>
#include <vector>

#include "crypto/public_key_impl.h"

// SubjectPublicKeyInfo (RFC 5280, section 4.1.2.7) in DER, made from the numbers of a key. Keys are
// compared by these bytes, so that the key of a message need not be decoded.
namespace Tarnik::Crypto {

/// An RSA key (RFC 3279, section 2.3.1). The numbers are in big-endian order and may have leading
/// zeros. Empty when one of them is 0.
std::vector<unsigned char> RsaPublicKeyInfo(std::string_view modulus, std::string_view exponent);

/// An EC key on the curve with the dotted object identifier `curve` (RFC 5480, section 2). `point`
/// is in uncompressed form. Empty for any other form and for what is not an object identifier.
std::vector<unsigned char> EcPublicKeyInfo(std::string_view curve, std::string_view point);

/// True if `length` shows that a certificate contains `key` in the form of the functions above: it
/// is an RSA key, or an EC key with neither a compressed point nor the parameters of its curve.
bool IsUsualPublicKeyInfo(const PublicKeyImpl& key, std::size_t length) noexcept;
/// The form that the functions above make of `key`, whatever form its certificate contains: with
/// the algorithm rsaEncryption for RSA-PSS keys too, and with uncompressed points. Empty for keys
/// of other kinds and curves.
std::vector<unsigned char> UsualPublicKeyInfo(const PublicKeyImpl& key);

}  // namespace Tarnik::Crypto

#endif
