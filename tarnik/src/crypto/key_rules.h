#ifndef TARNIK_CRYPTO_KEY_RULES_H
#define TARNIK_CRYPTO_KEY_RULES_H

#include "crypto/public_key_impl.h"
#include "crypto/signature_scheme.h"

namespace Tarnik::Crypto {

/// NIST SP 800-131A: shorter RSA keys are disallowed.
inline constexpr int kMinRsaBits = 2048;

/// True for a key of the scheme's type.
bool IsOfType(const PublicKeyImpl& key, SignatureScheme scheme) noexcept;
/// For a key of the scheme's type: true for an RSA key of at least `kMinRsaBits` and an EC key on
/// P-256, P-384 or P-521.
bool IsStrong(const PublicKeyImpl& key, SignatureScheme scheme) noexcept;
/// True for a key of the scheme's type that is strong.
bool IsUsableKey(const PublicKeyImpl& key, SignatureScheme scheme) noexcept;

/// "an RSA key", "an RSA-PSS key", "an EC key" or "neither an RSA nor an EC key".
const char* KeyTypeText(KeyAlgorithm algorithm) noexcept;
/// The types of keys for the scheme: "an RSA key", "an RSA or RSA-PSS key" or "an EC key".
const char* NeededKeyText(SignatureScheme scheme) noexcept;

}  // namespace Tarnik::Crypto

#endif
