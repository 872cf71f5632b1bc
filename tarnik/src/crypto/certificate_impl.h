#ifndef TARNIK_CRYPTO_CERTIFICATE_IMPL_H
#define TARNIK_CRYPTO_CERTIFICATE_IMPL_H

#include <tarnik/core/object_impl.h>
#include <tarnik/crypto/certificate.h>
#include <string>
#include <vector>

#include "support/openssl.h"

namespace Tarnik::Crypto {

/// The one implementation of `Certificate`.
class CertificateImpl final : public Certificate, public ObjectImpl {
 public:
  /// Decodes. Throws `CryptoException` as `CreateCertificateFromDer` does.
  explicit CertificateImpl(std::vector<unsigned char> der);
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

  X509* Handle() const noexcept { return certificate_.get(); }

 private:
  std::vector<unsigned char> der_;
  OpenSsl::OwnedCertificate certificate_;
  std::string subjectName_;
  std::string issuerName_;
  std::string serialNumber_;
  System::DateTime notBefore_;
  System::DateTime notAfter_;
  std::vector<unsigned char> subjectKeyIdentifier_;
  // Null when the key is of a kind that OpenSSL does not know.
  Ref<const PublicKey> publicKey_;
};

}  // namespace Tarnik::Crypto

#endif
