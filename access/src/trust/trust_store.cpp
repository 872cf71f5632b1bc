#include <chrono>
#include <utility>

#include <ssoclient/access/trust_store.h>
#include <tarnik/core/exception.h>

#include "per_process.h"
#include "trust/trust_builder.h"
#include "trust/trust_cell.h"
#include "trust/trust_config.h"
#include "trust/trust_files.h"
#include "trust/trust_store_impl.h"
#include "trust/trust_watch.h"

namespace SsoClient::Access {

namespace {

constexpr std::chrono::seconds kStoreEndLimit{1};

class WatchedTrustStore final : public TrustStoreImpl {
 public:
  explicit WatchedTrustStore(std::shared_ptr<TrustParts> parts) : parts_(std::move(parts)) {
    Follow();
  }
  ~WatchedTrustStore() override {
    if (const auto* const watch = watch_.Find()) {
      (*watch)->Stop(kStoreEndLimit);
    }
  }
  WatchedTrustStore(const WatchedTrustStore&) = delete;
  WatchedTrustStore& operator=(const WatchedTrustStore&) = delete;

  void Reload() override {
    Follow();
    // The listener may release this store.
    const std::shared_ptr<TrustWatch> watch = OwnWatch();
    watch->Reload();
  }

  TrustDescription Describe() const override {
    Follow();
    const auto state = parts_->cell.Get();
    const Trust& trust = *state->trust;
    return {trust.signers, trust.issuersWithoutSigners, state->loadedAt, state->failure};
  }

  std::shared_ptr<const TrustSnapshot> Current() const override {
    Follow();
    auto state = parts_->cell.Get();
    const TrustSnapshot* const snapshot = &state->trust->snapshot;
    return {std::move(state), snapshot};
  }

  std::uint64_t Version() const noexcept override {
    Follow();
    return parts_->cell.Version();
  }

 private:
  const std::shared_ptr<TrustWatch>& OwnWatch() const {
    return watch_.Get([this] { return std::make_shared<TrustWatch>(parts_); });
  }

  // Begins to watch, if that is due: at first, in a forked child, and after a shortage.
  void Follow() const noexcept {
    if (!parts_->config.isWatching) {
      return;
    }
    const auto* const watch = watch_.Find();
    if (watch != nullptr && (*watch)->IsWatching()) {
      return;
    }
    try {
      OwnWatch()->Begin();
    } catch (...) {
      // The next call tries again.
    }
  }

  const std::shared_ptr<TrustParts> parts_;
  PerProcess<std::shared_ptr<TrustWatch>> watch_;
};

}  // namespace

TrustStore::~TrustStore() = default;

std::shared_ptr<TrustStoreImpl> CreateTrustStore(TrustStoreConfig config,
                                                 std::shared_ptr<Runtime> runtime) {
  CheckTrustConfig(config);
  MakePathsAbsolute(config);
  TrustListing listing;
  auto trust = BuildTrust(config.issuers, ReadUnchanged(config.issuers, listing));
  if (trust->signers.empty()) {
    ThrowNoCertificate(config);
  }
  auto state = MakeTrustState(std::move(trust), runtime->Now().wall);
  return std::make_shared<WatchedTrustStore>(
      std::make_shared<TrustParts>(std::move(config), std::move(runtime), std::move(state)));
}

std::shared_ptr<TrustStore> CreateTrustStore(TrustStoreConfig config) {
  return CreateTrustStore(std::move(config), CreateSystemRuntime());
}

}  // namespace SsoClient::Access
