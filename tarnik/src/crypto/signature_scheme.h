#ifndef TARNIK_CRYPTO_SIGNATURE_SCHEME_H
#define TARNIK_CRYPTO_SIGNATURE_SCHEME_H

#include <cstddef>

namespace Tarnik::Crypto {

/// A signature algorithm without its hash.
enum class SignatureScheme : unsigned char { kRsaPkcs1, kRsaPss, kEcdsa };
inline constexpr std::size_t kSignatureSchemeCount = 3;

}  // namespace Tarnik::Crypto

#endif
