#include "certificate_values.h"

#include <stdexcept>
#include <vector>

#include "base64.h"
#include "openssl_handles.h"

namespace DevSts {

std::string CertificateFromBase64(const std::string& der) {
  const std::vector<unsigned char> octets = FromBase64(der);
  const unsigned char* at = octets.data();
  const CertificateHandle certificate(d2i_X509(nullptr, &at, static_cast<long>(octets.size())));
  if (!certificate) {
    ThrowOpenSslError("certificate does not load");
  }
  if (at != octets.data() + octets.size()) {
    throw std::runtime_error("octets behind a certificate");
  }
  return CertificateToPem(certificate.get());
}

std::string CertificateToBase64(const std::string& pem) {
  const CertificateHandle certificate = LoadCertificate(pem);
  const int size = i2d_X509(certificate.get(), nullptr);
  if (size <= 0) {
    ThrowOpenSslError("certificate cannot be written");
  }
  std::vector<unsigned char> octets(static_cast<std::size_t>(size));
  unsigned char* at = octets.data();
  i2d_X509(certificate.get(), &at);
  return ToBase64(octets);
}

std::string PlainPem(const std::string& pem) {
  return CertificateToPem(LoadCertificate(pem).get());
}

bool IsCurrent(const std::string& pem) {
  const CertificateHandle certificate = LoadCertificate(pem);
  return X509_cmp_current_time(X509_get0_notBefore(certificate.get())) < 0 &&
         X509_cmp_current_time(X509_get0_notAfter(certificate.get())) > 0;
}

bool HasSameKey(const std::string& onePem, const std::string& otherPem) {
  const CertificateHandle one = LoadCertificate(onePem);
  const CertificateHandle other = LoadCertificate(otherPem);
  return EVP_PKEY_eq(X509_get0_pubkey(one.get()), X509_get0_pubkey(other.get())) == 1;
}

bool HasStrongRsaKey(const std::string& pem) {
  const CertificateHandle certificate = LoadCertificate(pem);
  const EVP_PKEY* key = X509_get0_pubkey(certificate.get());
  return key != nullptr && EVP_PKEY_is_a(key, "RSA") == 1 && EVP_PKEY_get_bits(key) >= 2048;
}

}  // namespace DevSts
