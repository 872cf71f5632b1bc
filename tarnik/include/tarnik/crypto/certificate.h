#ifndef TARNIK_CRYPTO_CERTIFICATE_H
#define TARNIK_CRYPTO_CERTIFICATE_H

#include <cstddef>
#include <string>
#include <string_view>
#include <vector>

#include <tarnik/core/ref.h>
#include <tarnik/crypto/digest.h>
#include <tarnik/crypto/public_key.h>
#include <tarnik/system/date_time.h>

namespace Tarnik::Crypto {

/// An X.509 certificate (RFC 5280). Immutable; thread-safe.
class TARNIK_EXPORT Certificate : public virtual Object {
 public:
  /// The DER encoding and its length in bytes; valid as long as the certificate.
  virtual const unsigned char* DerBytes() const noexcept = 0;
  /// The number of these bytes.
  virtual std::size_t DerLength() const noexcept = 0;
  /// Distinguished names in the form of RFC 2253 (most specific part first).
  virtual const std::string& SubjectName() const = 0;
  /// The name of the issuer in the same form.
  virtual const std::string& IssuerName() const = 0;
  /// The serial number in decimal.
  virtual const std::string& SerialNumber() const = 0;
  /// The beginning of its validity (RFC 5280, section 4.1.2.5), in UTC.
  virtual System::DateTime NotBefore() const = 0;
  /// The last moment of its validity, in UTC.
  virtual System::DateTime NotAfter() const = 0;
  /// The SubjectKeyIdentifier extension; empty when it is absent.
  virtual const std::vector<unsigned char>& SubjectKeyIdentifier() const = 0;
  /// Throws `CryptoException` when the key cannot be decoded or is of an unknown kind.
  virtual Ref<const PublicKey> GetPublicKey() const = 0;
};

/// Decodes one certificate. Certificates are cached by their bytes, so the result may be an object
/// that was returned before. Throws `CryptoException` when the bytes are not exactly one
/// certificate.
TARNIK_EXPORT Ref<const Certificate> CreateCertificateFromDer(const unsigned char* bytes,
                                                              std::size_t length);
/// Reads every CERTIFICATE block of a PEM text (RFC 7468), in order. Throws `CryptoException` when
/// it contains no certificate or one cannot be decoded.
TARNIK_EXPORT std::vector<Ref<const Certificate>> CreateCertificatesFromPem(std::string_view pem);
/// Reads a file of PEM certificates. Throws `IOException` when it cannot be read, and otherwise as
/// above.
TARNIK_EXPORT std::vector<Ref<const Certificate>> LoadCertificates(const std::string& path);
/// Reads the content of a certificate file in either usual form: one certificate in DER, or a PEM
/// text as above. Throws as these do.
TARNIK_EXPORT std::vector<Ref<const Certificate>> CreateCertificatesFromPemOrDer(
    std::string_view content);
/// Reads a file of either form. Throws `IOException` when it cannot be read, and otherwise as
/// above.
TARNIK_EXPORT std::vector<Ref<const Certificate>> LoadPemOrDerCertificates(const std::string& path);

/// True when both have the same DER encoding. Takes constant time for encodings of one length; only
/// the lengths may show in the time.
TARNIK_EXPORT bool IsSameCertificate(const Certificate& a, const Certificate& b) noexcept;
/// The SHA-256 digest of the DER encoding. A certificate that this library has decoded computes it
/// once. Throws `CryptoException` when it cannot be computed.
TARNIK_EXPORT Sha256Digest Fingerprint(const Certificate& certificate);
/// The fingerprint as tools print it: 32 pairs of upper-case hexadecimal digits with colons between
/// them, "0A:1B:...". Throws as above.
TARNIK_EXPORT std::string FingerprintText(const Certificate& certificate);

}  // namespace Tarnik::Crypto

#endif
