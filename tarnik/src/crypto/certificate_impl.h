#ifndef TARNIK_CRYPTO_CERTIFICATE_IMPL_H
#define TARNIK_CRYPTO_CERTIFICATE_IMPL_H

#include <atomic>
#include <cstddef>
#include <string>
#include <vector>

#include <tarnik/core/object_impl.h>
#include <tarnik/crypto/certificate.h>

#include "crypto/distinguished_name.h"
#include "support/openssl.h"

namespace Tarnik::Crypto {

/// The implementation of `Certificate` for everything that this library decodes. Callers may pass
/// objects of their own classes.
class CertificateImpl final : public Certificate, public ObjectImpl {
 public:
  /// `decoded` is the certificate of `der`.
  CertificateImpl(std::vector<unsigned char> der, X509* decoded);
  ~CertificateImpl() override;

  const unsigned char* DerBytes() const noexcept override { return der_.data(); }
  std::size_t DerLength() const noexcept override { return der_.size(); }
  const std::string& SubjectName() const override { return subjectName_; }
  const std::string& IssuerName() const override { return issuerName_; }
  const std::string& SerialNumber() const override { return serialNumber_; }
  System::DateTime NotBefore() const override { return notBefore_; }
  System::DateTime NotAfter() const override { return notAfter_; }
  const std::vector<unsigned char>& SubjectKeyIdentifier() const override {
    return subjectKeyIdentifier_;
  }
  Ref<const PublicKey> GetPublicKey() const override;
  std::string ToString() const override;

  /// The public key with its algorithm as the certificate contains it: SubjectPublicKeyInfo (RFC
  /// 5280, section 4.1.2.7) in DER.
  const std::vector<unsigned char>& SubjectPublicKeyInfo() const noexcept { return keyInfo_; }
  const DistinguishedName& Subject() const noexcept { return subject_; }
  const DistinguishedName& Issuer() const noexcept { return issuer_; }
  /// The SubjectKeyIdentifier extension; when it is absent, the SHA-1 hash that usually identifies
  /// the key (RFC 5280, section 4.2.1.2, method 1), or nothing if OpenSSL does not provide SHA-1.
  const std::vector<unsigned char>& KeyIdentifier() const noexcept {
    return subjectKeyIdentifier_.empty() ? computedKeyIdentifier_ : subjectKeyIdentifier_;
  }
  /// See `Crypto::Fingerprint`.
  Sha256Digest Fingerprint() const;

 private:
  std::vector<unsigned char> der_;
  std::string subjectName_;
  std::string issuerName_;
  DistinguishedName subject_;
  DistinguishedName issuer_;
  std::string serialNumber_;
  System::DateTime notBefore_;
  System::DateTime notAfter_;
  std::vector<unsigned char> subjectKeyIdentifier_;
  std::vector<unsigned char> computedKeyIdentifier_;
  std::vector<unsigned char> keyInfo_;
  Ref<const PublicKey> publicKey_;  // null when OpenSSL does not know the kind of key
  // Written under `ObjectLock(this)`, and only before the flag is set.
  mutable Sha256Digest fingerprint_{};
  mutable std::atomic<bool> hasFingerprint_{false};
};

}  // namespace Tarnik::Crypto

#endif
