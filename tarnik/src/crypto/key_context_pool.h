#ifndef TARNIK_CRYPTO_KEY_CONTEXT_POOL_H
#define TARNIK_CRYPTO_KEY_CONTEXT_POOL_H

#include <mutex>
#include <vector>

#include "crypto/algorithms.h"
#include "support/openssl.h"

namespace Tarnik::Crypto {

enum class KeyOperation : unsigned char { kVerify, kSign };

/// OpenSSL's contexts that were set up for one operation with one key and stand idle. Setting one
/// up makes OpenSSL look up algorithms by name, so they are kept and used again. Safe from many
/// threads.
class KeyContextPool {
 public:
  explicit KeyContextPool(KeyOperation operation) noexcept : operation_(operation) {}
  KeyContextPool(const KeyContextPool&) = delete;
  KeyContextPool& operator=(const KeyContextPool&) = delete;

  /// A context for `key`, which is always the same one. Throws `CryptoException` when the key
  /// cannot do the operation with `scheme`.
  OpenSsl::OwnedKeyContext Take(EVP_PKEY* key, SignatureScheme scheme, Hash hash);
  /// Gives back a context whose last use has succeeded.
  void Keep(SignatureScheme scheme, Hash hash, OpenSsl::OwnedKeyContext context);

 private:
  struct IdleContexts {
    std::mutex mutex;
    std::vector<OpenSsl::OwnedKeyContext> contexts;
  };

  OpenSsl::OwnedKeyContext TakeIdle(SignatureScheme scheme, Hash hash);
  IdleContexts& IdleFor(SignatureScheme scheme, Hash hash) noexcept;

  KeyOperation operation_;
  IdleContexts idle_[kSignatureSchemeCount * kHashCount];
};

}  // namespace Tarnik::Crypto

#endif
