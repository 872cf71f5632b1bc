#ifndef DEVSTS_SIGNING_CERTIFICATES_H
#define DEVSTS_SIGNING_CERTIFICATES_H

#include <string>

#include "devsts/certificates.h"

namespace DevSts {

// Certificates as PEM texts. Two texts from these functions are equal when the certificates are.
// Each throws std::runtime_error for a certificate that does not load.
std::string CertificateFromBase64(const std::string& der);
std::string CertificateToBase64(const std::string& pem);
std::string PlainPem(const std::string& pem);

// Whether the time now is within the certificate's validity.
bool IsCurrent(const std::string& pem);
bool HasSameKey(const std::string& onePem, const std::string& otherPem);
// An RSA key that NIST SP 800-131A still allows for signatures.
bool HasStrongRsaKey(const std::string& pem);

}  // namespace DevSts

#endif
