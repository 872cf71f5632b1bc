#include <cstddef>
#include <memory>
#include <string>
#include <vector>

#include <ssoclient/access/trust_store.h>
#include <tarnik/service/log.h>
#include <tarnik/text/display_text.h>

#include "trust/trust_text.h"

namespace SsoClient::Access {

namespace {

using Tarnik::Service::LogInternal;

constexpr int kKeptLevel = 2;
constexpr int kReplacedLevel = 4;
constexpr std::size_t kLongestIssuers = 500;

const Tarnik::Service::StaticLogger& TrustLogger() {
  static const Tarnik::Service::StaticLogger logger("TrustStore");
  return logger;
}

std::string Signers(std::size_t number) {
  return std::to_string(number) + (number == 1 ? " signer" : " signers");
}

std::string WithoutSigners(const std::vector<std::string>& issuers) {
  std::string text;
  for (const std::string& issuer : issuers) {
    text += (text.empty() ? "; without signers: " : ", ") + IssuerText(issuer);
  }
  return Tarnik::ToDisplayText(text, kLongestIssuers);
}

class TrustLogListener final : public TrustListener {
 public:
  void OnTrustReplaced(const TrustRecord& record) override {
    LogInternal(TrustLogger(), kReplacedLevel,
                "Store '%1': the trust is that of the files: %2, %3 added, %4 removed, %5 revoked, "
                "%6 without a revocation list%7",
                {record.store, Signers(record.signers), record.added, record.removed,
                 record.revoked, record.uncovered, WithoutSigners(record.issuersWithoutSigners)});
  }

  void OnTrustKept(const TrustRecord& record) override {
    LogInternal(TrustLogger(), kKeptLevel, "Store '%1': the trust stays as it was, %2: %3",
                {record.store, Signers(record.signers), record.failure});
  }
};

}  // namespace

TrustListener::~TrustListener() = default;
void TrustListener::OnTrustReplaced(const TrustRecord&) {}
void TrustListener::OnTrustKept(const TrustRecord&) {}

std::shared_ptr<TrustListener> CreateTrustLogListener() {
  return std::make_shared<TrustLogListener>();
}

}  // namespace SsoClient::Access
