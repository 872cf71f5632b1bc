#ifndef TARNIK_CRYPTO_REVOCATION_LIST_H
#define TARNIK_CRYPTO_REVOCATION_LIST_H

#include <cstddef>
#include <string>
#include <string_view>
#include <vector>

#include <boost/optional.hpp>

#include <tarnik/core/ref.h>
#include <tarnik/crypto/certificate.h>
#include <tarnik/system/date_time.h>

namespace Tarnik::Crypto {

/// A certificate revocation list (RFC 5280, section 5): complete, and of certificates of its own
/// issuer. Immutable; thread-safe. Created only by the functions below.
///
/// A list says nothing until `IsFrom` is true for a trusted certificate of the issuer. The caller
/// checks that the current time is between `ThisUpdate` and `NextUpdate`.
class TARNIK_EXPORT RevocationList : public virtual Object {
 public:
  /// The distinguished name in the form of `Certificate::IssuerName`.
  virtual const std::string& IssuerName() const = 0;
  /// When the list was issued, and by when the next one will be.
  virtual System::DateTime ThisUpdate() const = 0;
  /// By when the next list is issued.
  virtual System::DateTime NextUpdate() const = 0;
  /// True when `issuer` made the list and was allowed to: its subject is the list's issuer (RFC
  /// 5280, section 7.1), its keyUsage, if there is one, includes cRLSign, the list's authority key
  /// identifier names no other key or certificate, and the signature, by an algorithm with SHA-256,
  /// SHA-384 or SHA-512, verifies with its key, which fulfils the rules of `VerifyData`. Throws
  /// `CryptoException` when the certificate, which may be of a caller's own class, or its key
  /// cannot be decoded, when its key is restricted to other parameters, and when OpenSSL fails.
  ///
  /// Each call decodes the certificate and verifies the signature.
  virtual bool IsFrom(const Certificate& issuer) const = 0;
  /// True when `certificate` has the list's issuer (RFC 5280, section 7.1). Throws
  /// `CryptoException` when it is of a caller's own class and cannot be decoded.
  virtual bool Covers(const Certificate& certificate) const = 0;
  /// Since when `certificate` is revoked, also if only until further notice (reason
  /// certificateHold). None when it is not on the list or the list does not cover it. Throws as
  /// above. Takes the time of a binary search.
  virtual boost::optional<System::DateTime> RevokedSince(const Certificate& certificate) const = 0;
};

/// Decodes one list. Throws `CryptoException` when
///  - the bytes are not exactly one list, or it names no issuer,
///  - it has no nextUpdate (RFC 5280, section 5.1.2.5), or one before thisUpdate,
///  - it is a delta list (section 5.2.4),
///  - it has an issuingDistributionPoint (section 5.2.5), so that it may be indirect or leave out
///    certificates or reasons,
///  - an entry has another issuer or the reason removeFromCRL (sections 5.3.3 and 5.3.1), or
///  - it or an entry has another critical extension, an extension twice, one of the above that
///    cannot be decoded, or a serial number of more than 64 bytes.
/// A serial number that is listed twice is revoked since the earlier time.
TARNIK_EXPORT Ref<const RevocationList> CreateRevocationListFromDer(const unsigned char* bytes,
                                                                    std::size_t length);
/// Reads every X509 CRL block of a PEM text (RFC 7468, section 7), in order; other blocks are
/// skipped. Throws `CryptoException` when it contains no list or one cannot be decoded or used.
TARNIK_EXPORT std::vector<Ref<const RevocationList>> CreateRevocationListsFromPem(
    std::string_view pem);
/// Reads the content of a file in either usual form: one list in DER, or a PEM text as above.
TARNIK_EXPORT std::vector<Ref<const RevocationList>> CreateRevocationListsFromPemOrDer(
    std::string_view content);
/// Reads a file of either form. Throws `IOException` when it cannot be read, and otherwise as
/// above.
TARNIK_EXPORT std::vector<Ref<const RevocationList>> LoadRevocationLists(const std::string& path);

}  // namespace Tarnik::Crypto

#endif
