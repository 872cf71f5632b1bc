#ifndef SSOCLIENT_ACCESS_TRUST_TRUST_STORE_IMPL_H
#define SSOCLIENT_ACCESS_TRUST_TRUST_STORE_IMPL_H

#include <cstdint>
#include <memory>

#include <ssoclient/access/trust_store.h>

#include "runtime.h"
#include "trust/trust_snapshot.h"

namespace SsoClient::Access {

/// The only implementation of `TrustStore`.
class TrustStoreImpl : public TrustStore {
 public:
  /// The trust in use; never null. A lock is held only while a pointer is copied.
  virtual std::shared_ptr<const TrustSnapshot> Current() const = 0;
  /// The version of the trust in use, without a lock.
  virtual std::uint64_t Version() const noexcept = 0;
};

/// The public function, with a runtime.
std::shared_ptr<TrustStoreImpl> CreateTrustStore(TrustStoreConfig config,
                                                 std::shared_ptr<Runtime> runtime);

}  // namespace SsoClient::Access

#endif
