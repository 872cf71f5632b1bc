#ifndef TARNIK_CRYPTO_PUBLIC_KEY_IMPL_H
#define TARNIK_CRYPTO_PUBLIC_KEY_IMPL_H

#include <tarnik/core/object_impl.h>
#include <tarnik/crypto/public_key.h>
#include <cstddef>
#include <mutex>
#include <vector>

#include "crypto/algorithms.h"
#include "support/openssl.h"

namespace Tarnik::Crypto {

/// The elliptic curves that signatures are verified on.
enum class Curve : unsigned char { kNone, kP256, kP384, kP521 };

/// The one implementation of `PublicKey`.
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
  /// Length in bytes of the longest signature value: for RSA the only length.
  std::size_t ValueLength() const noexcept { return valueLength_; }
  EVP_PKEY* Handle() const noexcept { return key_.get(); }

  /// True when `signature` is one of `digest`, which was made with `hash`. The ECDSA signature is
  /// in the form of RFC 3279 section 2.2.3. Throws `CryptoException` when the key cannot be used
  /// with `scheme`.
  bool Verify(SignatureScheme scheme, Hash hash, const unsigned char* digest,
              const unsigned char* signature, std::size_t signatureLength) const;

 private:
  /// Contexts that were set up for verification and stand idle. Setting one up makes OpenSSL look
  /// up algorithms by name, so they are kept and used again.
  struct IdleContexts {
    std::mutex mutex;
    std::vector<OpenSsl::OwnedKeyContext> contexts;
  };

  OpenSsl::OwnedKeyContext TakeContext(SignatureScheme scheme, Hash hash) const;
  void KeepContext(SignatureScheme scheme, Hash hash, OpenSsl::OwnedKeyContext context) const;
  IdleContexts& IdleFor(SignatureScheme scheme, Hash hash) const noexcept;

  OpenSsl::OwnedKey key_;
  KeyAlgorithm algorithm_;
  int bits_;
  std::size_t valueLength_;
  Curve curve_ = Curve::kNone;
  mutable IdleContexts idle_[kSignatureSchemeCount * kHashCount];
};

}  // namespace Tarnik::Crypto

#endif
