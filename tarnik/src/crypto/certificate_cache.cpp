#include "crypto/certificate_cache.h"

namespace Tarnik::Crypto {
namespace {

constexpr std::size_t kProcessCapacity = 256;

std::string_view BytesOf(const Certificate& certificate) noexcept {
  return {reinterpret_cast<const char*>(certificate.DerBytes()), certificate.DerLength()};
}

}  // namespace

Ref<const Certificate> CertificateCache::Find(std::string_view der) {
  const std::lock_guard lock(mutex_);
  const auto position = positions_.find(der);
  if (position == positions_.end()) {
    return nullptr;
  }
  order_.splice(order_.begin(), order_, position->second);
  return *position->second;
}

void CertificateCache::Add(const Ref<const Certificate>& certificate) {
  const std::lock_guard lock(mutex_);
  // Two threads may have decoded the same bytes at the same time.
  if (positions_.count(BytesOf(*certificate)) != 0) {
    return;
  }
  order_.push_front(certificate);
  positions_.emplace(BytesOf(*certificate), order_.begin());
  if (order_.size() > capacity_) {
    positions_.erase(BytesOf(*order_.back()));
    order_.pop_back();
  }
}

std::size_t CertificateCache::Size() const {
  const std::lock_guard lock(mutex_);
  return order_.size();
}

CertificateCache& ProcessCertificateCache() {
  // Never destroyed, since threads may use it while the process ends.
  static auto* const cache = new CertificateCache(kProcessCapacity);
  return *cache;
}

}  // namespace Tarnik::Crypto
