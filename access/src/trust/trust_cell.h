#ifndef SSOCLIENT_ACCESS_TRUST_TRUST_CELL_H
#define SSOCLIENT_ACCESS_TRUST_TRUST_CELL_H

#include <atomic>
#include <cstdint>
#include <memory>
#include <string>

#include <tarnik/system/date_time.h>

#include "instant.h"
#include "trust/trust_builder.h"

namespace SsoClient::Access {

/// The trust in use, with the last attempt to read the files. Immutable; `trust` is not null.
struct TrustState {
  std::shared_ptr<const Trust> trust;
  Tarnik::System::DateTime loadedAt;
  std::string failure;  ///< `TrustDescription::failure`
};

/// The state when files have been read at `loadedAt`.
std::shared_ptr<const TrustState> MakeTrustState(std::shared_ptr<const Trust> trust,
                                                 Instant::Wall loadedAt);

/// Contains the state of a store. Thread-safe. A child that is forked at any time has the whole
/// state of its parent.
class TrustCell {
 public:
  explicit TrustCell(std::shared_ptr<const TrustState> state) noexcept;

  /// Never null.
  std::shared_ptr<const TrustState> Get() const;
  void Set(std::shared_ptr<const TrustState> state);
  /// That of the snapshot in use, without a lock.
  std::uint64_t Version() const noexcept { return version_.load(std::memory_order_acquire); }

 private:
  std::shared_ptr<const TrustState> state_;
  std::atomic<std::uint64_t> version_;
};

}  // namespace SsoClient::Access

#endif
