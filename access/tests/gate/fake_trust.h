#ifndef SSOCLIENT_ACCESS_TESTS_GATE_FAKE_TRUST_H
#define SSOCLIENT_ACCESS_TESTS_GATE_FAKE_TRUST_H

#include <atomic>
#include <cstdint>
#include <map>
#include <memory>
#include <mutex>
#include <string>
#include <vector>

#include <devsts/certificates.h>

#include "trust/trust_snapshot.h"
#include "trust/trust_store_impl.h"

namespace SsoClient::Access::Testing {

/// The signer with this certificate, whose revocation is not checked.
Signer SignerOf(const DevSts::Credential& credential);

/// A trust store without files, whose trust a test sets.
class FakeTrust final : public TrustStoreImpl {
 public:
  using Named = std::map<std::string, std::vector<Signer>>;

  /// From now on, the tokens of these issuers may be signed by these.
  void Set(const Named& signers);

  void Reload() override {}
  TrustDescription Describe() const override { return {}; }
  std::shared_ptr<const TrustSnapshot> Current() const override;
  std::uint64_t Version() const noexcept override { return version_; }

 private:
  mutable std::mutex mutex_;
  std::shared_ptr<const TrustSnapshot> current_;
  std::atomic<std::uint64_t> version_{0};
};

}  // namespace SsoClient::Access::Testing

#endif
