#ifndef TARNIK_CRYPTO_CERTIFICATE_CACHE_H
#define TARNIK_CRYPTO_CERTIFICATE_CACHE_H

#include <cstddef>
#include <list>
#include <string_view>
#include <unordered_map>

#include <tarnik/core/ref.h>
#include <tarnik/crypto/certificate.h>

namespace Tarnik::Crypto {

/// Keeps the most recently used certificates, which are found by their DER bytes. Safe from many
/// threads.
class CertificateCache {
 public:
  explicit CertificateCache(std::size_t capacity) : capacity_(capacity) {}

  /// The certificate with these bytes, or null.
  Ref<const Certificate> Find(std::string_view der);
  /// Adds a certificate; if the cache is full, the least recently used one is removed.
  void Add(const Ref<const Certificate>& certificate);
  std::size_t Size() const;

 private:
  using Order = std::list<Ref<const Certificate>>;

  const std::size_t capacity_;
  // Both under `ObjectLock(this)`.
  Order order_;  // the most recently used one first
  // The keys are the bytes inside the certificates.
  std::unordered_map<std::string_view, Order::iterator> positions_;
};

/// The cache of the process.
CertificateCache& ProcessCertificateCache();

}  // namespace Tarnik::Crypto

#endif
