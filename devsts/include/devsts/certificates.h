#ifndef DEVSTS_CERTIFICATES_H
#define DEVSTS_CERTIFICATES_H

#include <chrono>
#include <string>
#include <vector>

/// Keys and certificates made on the spot. All texts are PEM. Functions are thread-safe and throw
/// `std::runtime_error` when OpenSSL fails.
namespace DevSts {

/// A certificate with its private key.
struct Credential {
  std::string certificatePem;
  std::string privateKeyPem;  ///< PKCS#8, unencrypted
};

enum class KeyType {
  Rsa2048,
  Rsa3072,
  Rsa1024,  ///< only to make what a careful reader refuses
  EcP256,
  EcP384,
};

/// What `MakeCertificate` puts into a certificate (RFC 5280).
struct CertificateSpec {
  std::string commonName;
  /// subjectAltName dNSName entries, byte for byte (a NUL inside is kept).
  std::vector<std::string> dnsNames;
  /// subjectAltName iPAddress entries, in their text form.
  std::vector<std::string> addresses;
  bool isAuthority = false;
  /// Validity relative to now.
  std::chrono::seconds notBefore{-3600};
  std::chrono::seconds notAfter{30L * 24 * 3600};
  KeyType keyType = KeyType::EcP256;
  /// Draws a key for this certificate alone. Otherwise keys are shared by every certificate of the
  /// same common name and key type in this process, for drawing RSA keys is slow.
  bool freshKey = false;
};

/// Makes a certificate signed by `issuer`, or by itself if `issuer` is null.
Credential MakeCertificate(const CertificateSpec& spec, const Credential* issuer = nullptr);

}  // namespace DevSts

#endif
