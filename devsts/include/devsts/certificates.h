#ifndef DEVSTS_CERTIFICATES_H
#define DEVSTS_CERTIFICATES_H

#include <chrono>
#include <string>
#include <vector>

/// Generates keys and certificates. All texts are PEM. Functions are thread-safe and throw
/// `std::runtime_error` if OpenSSL fails.
namespace DevSts {

/// A certificate with its private key.
struct Credential {
  std::string certificatePem;
  std::string privateKeyPem;  ///< PKCS#8, unencrypted
};

enum class KeyType {
  Rsa2048,
  Rsa3072,
  Rsa1024,  ///< only for input that verifiers must refuse
  EcP256,
  EcP384,
};

/// The validity of the certificates of a server: long enough that clients do not warn that one
/// expires soon.
inline constexpr std::chrono::hours kCertificateLifetime{90L * 24};

/// What `MakeCertificate` puts into a certificate (RFC 5280).
struct CertificateSpec {
  std::string commonName;
  /// subjectAltName dNSName entries, byte for byte (embedded NULs are kept).
  std::vector<std::string> dnsNames;
  /// subjectAltName iPAddress entries, in their text form.
  std::vector<std::string> addresses;
  bool isAuthority = false;
  /// Validity relative to now.
  std::chrono::seconds notBefore{-3600};
  std::chrono::seconds notAfter{30L * 24 * 3600};
  KeyType keyType = KeyType::EcP256;
  /// Generates a key for this certificate only. Otherwise all certificates with the same common
  /// name and key type share one key in this process, because generating RSA keys is slow.
  bool freshKey = false;
};

/// Makes a certificate signed by `issuer`, or a self-signed one if `issuer` is null.
Credential MakeCertificate(const CertificateSpec& spec, const Credential* issuer = nullptr);

/// Makes a certificate revocation list (RFC 5280, section 5) of `issuer`, which must be an
/// authority, with the given certificates. It is valid for `validity` from now, and its number
/// grows from one call to a later one.
std::string MakeRevocationList(const Credential& issuer,
                               const std::vector<std::string>& revokedCertificatePems,
                               std::chrono::seconds validity = std::chrono::hours(30L * 24));

}  // namespace DevSts

#endif
