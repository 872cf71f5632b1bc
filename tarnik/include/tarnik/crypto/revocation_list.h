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
  virtual System::DateTime NextUpdate() const = 0;
  /// True when the key of `issuer` signed the list and may: the subject is the list's issuer (RFC
  /// 5280, section 7.1), a keyUsage extension includes cRLSign, the list's authority key identifier
  /// does not name another key or certificate, the algorithm has SHA-256, SHA-384 or SHA-512, and
  /// `VerifyData` accepts the key with it. False otherwise; also when `issuer` cannot be decoded.
  /// Throws `CryptoException` when OpenSSL fails or memory runs out.
  ///
  /// The signature is verified in each call, which takes as long as that of a token.
  virtual bool IsFrom(const Certificate& issuer) const = 0;
  /// True when `certificate` has the list's issuer (RFC 5280, section 7.1). False when it cannot be
  /// decoded.
  virtual bool Covers(const Certificate& certificate) const = 0;
  /// Since when `certificate` is revoked, or none when it is not on the list or `Covers` is false
  /// for it. A certificate on hold (reason certificateHold) is revoked.
  virtual boost::optional<System::DateTime> RevokedSince(const Certificate& certificate) const = 0;
};

/// Decodes one list. Throws `CryptoException` when
///  - the bytes are not exactly one list in DER,
///  - it has no nextUpdate (RFC 5280, section 5.1.2.5), or one that is before thisUpdate,
///  - it is a delta list, or its issuingDistributionPoint says that it is indirect or does not
///    contain all reasons or all kinds of certificates (RFC 5280, sections 5.2.4 and 5.2.5),
///  - it or an entry has another critical extension, an extension twice or one that is broken, or
///  - an entry names another issuer, is removeFromCRL, or has a serial number that is already
///    listed, longer than 64 bytes.
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
