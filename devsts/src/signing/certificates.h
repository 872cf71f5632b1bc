#ifndef DEVSTS_SIGNING_CERTIFICATES_H
#define DEVSTS_SIGNING_CERTIFICATES_H

#include <string>

#include "devsts/certificates.h"

namespace DevSts {

// Certificates as PEM texts. Two texts that these functions return are equal if and only if the
// certificates are equal. Each function throws std::runtime_error if a certificate does not load.
std::string CertificateFromBase64(const std::string& der);
std::string CertificateToBase64(const std::string& pem);
std::string PlainPem(const std::string& pem);

// Whether the certificate is valid at the current time.
bool IsCurrent(const std::string& pem);
bool HasSameKey(const std::string& onePem, const std::string& otherPem);
// Whether the key is an RSA key that NIST SP 800-131A still allows for signatures.
bool HasStrongRsaKey(const std::string& pem);

}  // namespace DevSts

#endif
