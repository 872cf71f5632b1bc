#ifndef TARNIK_CRYPTO_KEY_CONTEXT_POOL_H
#define TARNIK_CRYPTO_KEY_CONTEXT_POOL_H

#include <vector>

#include "crypto/hash.h"
#include "crypto/signature_scheme.h"
#include "support/openssl.h"

namespace Tarnik::Crypto {

enum class KeyOperation : unsigned char { kVerify, kSign };

/// Idle OpenSSL contexts that were set up for one operation with one key. They are reused, since
/// setting one up makes OpenSSL look up algorithms by name. Thread-safe.
class KeyContextPool {
 public:
  explicit KeyContextPool(KeyOperation operation) noexcept : operation_(operation) {}
  KeyContextPool(const KeyContextPool&) = delete;
  KeyContextPool& operator=(const KeyContextPool&) = delete;

  /// A context for `key`, which must be the same key in every call. Throws `CryptoException` when
  /// the key cannot do the operation with `scheme`.
  OpenSsl::OwnedKeyContext Take(EVP_PKEY* key, SignatureScheme scheme, Hash hash);
  /// Keeps a context whose last use succeeded.
  void Keep(SignatureScheme scheme, Hash hash, OpenSsl::OwnedKeyContext context);

 private:
  /// Under `ObjectLock` of the object.
  using IdleContexts = std::vector<OpenSsl::OwnedKeyContext>;

  OpenSsl::OwnedKeyContext TakeIdle(SignatureScheme scheme, Hash hash);
  IdleContexts& IdleFor(SignatureScheme scheme, Hash hash) noexcept;

  KeyOperation operation_;
  IdleContexts idle_[kSignatureSchemeCount * kHashCount];
};

}  // namespace Tarnik::Crypto

#endif
