#ifndef TARNIK_CRYPTO_PUBLIC_KEY_IMPL_H
#define TARNIK_CRYPTO_PUBLIC_KEY_IMPL_H

#include <cstddef>

#include <tarnik/core/object_impl.h>
#include <tarnik/crypto/public_key.h>

#include "crypto/hash.h"
#include "crypto/key_context_pool.h"
#include "crypto/signature_scheme.h"
#include "support/openssl.h"

namespace Tarnik::Crypto {

/// The elliptic curves that signatures may use.
enum class Curve : unsigned char { kNone, kP256, kP384, kP521 };

/// The only implementation of `PublicKey`.
class PublicKeyImpl final : public PublicKey, public ObjectImpl {
 public:
  explicit PublicKeyImpl(OpenSsl::OwnedKey key);
  ~PublicKeyImpl() override;

  KeyAlgorithm Algorithm() const noexcept override { return algorithm_; }
  int Bits() const noexcept override { return bits_; }

  /// `Curve::kNone` for keys that are not on one of the named curves.
  Curve NamedCurve() const noexcept { return curve_; }
  /// Length in bytes of the group's order for EC keys: of each of r and s.
  std::size_t OrderLength() const noexcept { return (static_cast<std::size_t>(bits_) + 7) / 8; }
  /// Length in bytes of the longest signature value. All RSA signatures have this length.
  std::size_t ValueLength() const noexcept { return valueLength_; }
  EVP_PKEY* Handle() const noexcept { return key_.get(); }

  /// True when `signature` is a signature of `digest`, which was computed with `hash`. An ECDSA
  /// signature is in the form of RFC 3279, section 2.2.3. Throws `CryptoException` when the key
  /// cannot be used with `scheme`.
  bool Verify(SignatureScheme scheme, Hash hash, const unsigned char* digest,
              const unsigned char* signature, std::size_t signatureLength) const;

 private:
  OpenSsl::OwnedKey key_;
  KeyAlgorithm algorithm_;
  int bits_;
  std::size_t valueLength_;
  Curve curve_ = Curve::kNone;
  mutable KeyContextPool contexts_{KeyOperation::kVerify};
};

}  // namespace Tarnik::Crypto

#endif
