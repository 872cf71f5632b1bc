#include "crypto/certificate_cache.h"

#include <iterator>
#include <mutex>

#include "support/object_lock.h"

namespace Tarnik::Crypto {
namespace {

constexpr std::size_t kProcessCapacity = 256;
// Usual certificates have 1 to 4 KiB. Anyone can send larger ones, which would stay in memory.
constexpr std::size_t kMaxKeptBytes = std::size_t{16} * 1024;

std::string_view BytesOf(const Certificate& certificate) noexcept {
  return {reinterpret_cast<const char*>(certificate.DerBytes()), certificate.DerLength()};
}

}  // namespace

Ref<const Certificate> CertificateCache::Find(std::string_view der) {
  const std::lock_guard lock(ObjectLock(this));
  const auto position = positions_.find(der);
  if (position == positions_.end()) {
    return nullptr;
  }
  order_.splice(order_.begin(), order_, position->second);
  return *position->second;
}

void CertificateCache::Add(const Ref<const Certificate>& certificate) {
  if (certificate->DerLength() > kMaxKeptBytes) {
    return;
  }
  // Destroyed after the lock is released.
  Order removed;
  const std::lock_guard lock(ObjectLock(this));
  // Two threads may have decoded the same bytes at the same time.
  if (positions_.count(BytesOf(*certificate)) != 0) {
    return;
  }
  order_.push_front(certificate);
  positions_.emplace(BytesOf(*certificate), order_.begin());
  if (order_.size() > capacity_) {
    positions_.erase(BytesOf(*order_.back()));
    removed.splice(removed.begin(), order_, std::prev(order_.end()));
  }
}

std::size_t CertificateCache::Size() const {
  const std::lock_guard lock(ObjectLock(this));
  return order_.size();
}

CertificateCache& ProcessCertificateCache() {
  // Never destroyed, since threads may use it while the process ends.
  static auto* const cache = new CertificateCache(kProcessCapacity);
  return *cache;
}

namespace {

// At load, so that no thread can be inside the initialisation while another forks.
[[maybe_unused]] const bool kHasCertificateCacheAtLoad = (ProcessCertificateCache(), true);

}  // namespace

}  // namespace Tarnik::Crypto
