#include <memory>

#include <ssoclient/access/trust_store.h>
#include <tarnik/service/log.h>

namespace SsoClient::Access {

namespace {

using Tarnik::Service::LogInternal;

constexpr int kKeptLevel = 2;
constexpr int kReplacedLevel = 4;

const Tarnik::Service::StaticLogger& TrustLogger() {
  static const Tarnik::Service::StaticLogger logger("TrustStore");
  return logger;
}

class TrustLogListener final : public TrustListener {
 public:
  void OnTrustReplaced(const TrustRecord& record) override {
    LogInternal(TrustLogger(), kReplacedLevel,
                "Store '%1': the trust is that of the files: %2 certificates, %3 added, %4 removed",
                {record.store, record.signers, record.added, record.removed});
  }

  void OnTrustKept(const TrustRecord& record) override {
    LogInternal(TrustLogger(), kKeptLevel,
                "Store '%1': the trust stays as it was, %2 certificates: %3",
                {record.store, record.signers, record.failure});
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
