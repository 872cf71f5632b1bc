#ifndef TARNIK_CRYPTO_PRIVATE_KEY_IMPL_H
#define TARNIK_CRYPTO_PRIVATE_KEY_IMPL_H

#include <string>
#include <vector>

#include <tarnik/core/object_impl.h>
#include <tarnik/crypto/private_key.h>

#include "crypto/key_context_pool.h"
#include "crypto/public_key_impl.h"
#include "support/openssl.h"

namespace Tarnik::Crypto {

/// The only implementation of `PrivateKey`.
class PrivateKeyImpl final : public PrivateKey, public ObjectImpl {
 public:
  /// Throws `CryptoException` when the key has no public half.
  explicit PrivateKeyImpl(OpenSsl::OwnedKey key);
  ~PrivateKeyImpl() override;

  Ref<const PublicKey> GetPublicKey() const override { return publicKey_; }
  bool Matches(const Certificate& certificate) const override;
  std::string ToString() const override;

  const PublicKeyImpl& Public() const noexcept { return *publicKey_; }
  EVP_PKEY* Handle() const noexcept { return key_.get(); }

  /// Signs `digest`, which was computed with `hash`. An ECDSA signature is in the form of RFC 3279,
  /// section 2.2.3. Throws `CryptoException` when the key cannot be used with `scheme` or the
  /// operation fails.
  std::vector<unsigned char> Sign(SignatureScheme scheme, Hash hash,
                                  const unsigned char* digest) const;

 private:
  OpenSsl::OwnedKey key_;
  Ref<const PublicKeyImpl> publicKey_;
  mutable KeyContextPool contexts_{KeyOperation::kSign};
};

}  // namespace Tarnik::Crypto

#endif
