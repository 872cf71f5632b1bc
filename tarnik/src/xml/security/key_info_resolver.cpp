#include <utility>

#include <tarnik/core/object_impl.h>
#include <tarnik/xml/security/key_info_resolver.h>

#include "xml/security/trusted_certificates.h"

namespace Tarnik::Xml::Security {
namespace {

using CertificateList = TrustedCertificates::CertificateList;
using Keys = TrustedCertificates::Keys;

Ref<const Crypto::PublicKey> OnlyOneOf(const Keys& keys) {
  return keys.size() == 1 ? keys.front() : nullptr;
}

class TrustedCertificatesResolver final : public CertificateCandidatesResolver, public ObjectImpl {
 public:
  explicit TrustedCertificatesResolver(CertificateList trusted) : trusted_(std::move(trusted)) {}

  Ref<const Crypto::PublicKey> Resolve(const KeyInfo& keyInfo) const override {
    return OnlyOneOf(trusted_.NamedBy(keyInfo));
  }
  Keys Candidates(const KeyInfo& keyInfo) const override { return trusted_.NamedBy(keyInfo); }
  CertificateList CandidateCertificates(const KeyInfo& keyInfo) const override {
    return trusted_.CertificatesNamedBy(keyInfo);
  }

 private:
  const TrustedCertificates trusted_;
};

class CertificateIssuerResolver final : public KeyInfoResolver, public ObjectImpl {
 public:
  explicit CertificateIssuerResolver(CertificateList trusted) : trusted_(std::move(trusted)) {}

  Ref<const Crypto::PublicKey> Resolve(const KeyInfo& keyInfo) const override {
    return OnlyOneOf(trusted_.NamedByIssuer(keyInfo));
  }

 private:
  const TrustedCertificates trusted_;
};

}  // namespace

Ref<const KeyInfoResolver> CreateTrustedCertificatesResolver(CertificateList certificates) {
  return MakeRef<TrustedCertificatesResolver>(std::move(certificates));
}

Ref<const KeyInfoResolver> CreateCertificateIssuerResolver(CertificateList certificates) {
  return MakeRef<CertificateIssuerResolver>(std::move(certificates));
}

}  // namespace Tarnik::Xml::Security
