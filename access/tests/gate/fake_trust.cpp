#include "gate/fake_trust.h"

#include <utility>

#include <tarnik/core/object_impl.h>
#include <tarnik/crypto/certificate.h>

namespace SsoClient::Access::Testing {
namespace {

using Tarnik::Ref;
using Tarnik::Crypto::Certificate;
using Tarnik::Xml::Security::CertificateCandidatesResolver;
using Tarnik::Xml::Security::KeyInfo;

// Selects the certificate in the KeyInfo, or all without one.
class Selection final : public CertificateCandidatesResolver, public Tarnik::ObjectImpl {
 public:
  explicit Selection(std::vector<Ref<const Certificate>> certificates)
      : certificates_(std::move(certificates)) {}

  Ref<const Tarnik::Crypto::PublicKey> Resolve(const KeyInfo&) const override { return nullptr; }
  std::vector<Ref<const Tarnik::Crypto::PublicKey>> Candidates(const KeyInfo&) const override {
    return {};
  }
  std::vector<Ref<const Certificate>> CandidateCertificates(const KeyInfo& keyInfo) const override {
    std::vector<Ref<const Certificate>> selected;
    for (const auto& certificate : certificates_) {
      if (keyInfo.certificates.empty() || IsIn(*certificate, keyInfo)) {
        selected.push_back(certificate);
      }
    }
    return selected;
  }

 private:
  static bool IsIn(const Certificate& certificate, const KeyInfo& keyInfo) {
    for (const auto& bytes : keyInfo.certificates) {
      if (std::vector<unsigned char>(certificate.DerBytes(),
                                     certificate.DerBytes() + certificate.DerLength()) == bytes) {
        return true;
      }
    }
    return false;
  }

  const std::vector<Ref<const Certificate>> certificates_;
};

IssuerTrust TrustOf(const std::vector<Signer>& signers) {
  std::vector<Ref<const Certificate>> certificates;
  for (const Signer& signer : signers) {
    certificates.push_back(signer.certificate);
  }
  return {signers, Tarnik::MakeRef<Selection>(certificates)};
}

std::uint64_t NewVersion() {
  // Unlike the versions of real stores.
  static std::atomic<std::uint64_t> next{1'000'000'000};
  return next++;
}

}  // namespace

Signer SignerOf(const DevSts::Credential& credential) {
  Signer signer;
  signer.certificate = Tarnik::Crypto::CreateCertificatesFromPem(credential.certificatePem).front();
  signer.notBefore = signer.certificate->NotBefore();
  signer.notAfter = signer.certificate->NotAfter();
  signer.resolver = Tarnik::Xml::Security::CreateTrustedCertificatesResolver({signer.certificate});
  signer.name = signer.certificate->SubjectName() + " (SHA-256 " +
                Tarnik::Crypto::FingerprintText(*signer.certificate).substr(0, 23) + "...)";
  return signer;
}

void FakeTrust::Set(const Named& signers) {
  std::map<std::string, IssuerTrust, std::less<>> named;
  for (const auto& [issuer, ofIssuer] : signers) {
    named.emplace(issuer, TrustOf(ofIssuer));
  }
  const std::uint64_t version = NewVersion();
  const auto made = std::make_shared<const TrustSnapshot>(std::move(named), IssuerTrust{}, version);
  const std::lock_guard lock(mutex_);
  current_ = made;
  version_ = version;
}

std::shared_ptr<const TrustSnapshot> FakeTrust::Current() const {
  const std::lock_guard lock(mutex_);
  return current_;
}

}  // namespace SsoClient::Access::Testing
