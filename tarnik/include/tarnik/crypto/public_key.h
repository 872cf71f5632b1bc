#ifndef TARNIK_CRYPTO_PUBLIC_KEY_H
#define TARNIK_CRYPTO_PUBLIC_KEY_H

#include <tarnik/core/object.h>
#include <tarnik/core/ref.h>

namespace Tarnik::Crypto {

/// The kind of a key.
enum class KeyAlgorithm {
  kRsa,     ///< RSA
  kRsaPss,  ///< RSA, restricted to RSASSA-PSS (RFC 4055, section 1.2)
  kEc,      ///< an elliptic curve, for ECDSA
  kOther,   ///< any other, which no signature algorithm of this library uses
};

/// A public key. Immutable; thread-safe. Returned by `Certificate::GetPublicKey` and
/// `PrivateKey::GetPublicKey`.
class TARNIK_EXPORT PublicKey : public virtual Object {
 public:
  /// The kind of this key.
  virtual KeyAlgorithm Algorithm() const noexcept = 0;
  /// The size in bits of the modulus (RSA) or of the order (EC).
  virtual int Bits() const noexcept = 0;
};

}  // namespace Tarnik::Crypto

#endif
