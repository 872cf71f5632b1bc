#ifndef TARNIK_XML_SECURITY_KEY_INFO_RESOLVER_H
#define TARNIK_XML_SECURITY_KEY_INFO_RESOLVER_H

#include <vector>

#include <tarnik/core/object.h>
#include <tarnik/core/ref.h>
#include <tarnik/crypto/certificate.h>
#include <tarnik/xml/security/key_info.h>

namespace Tarnik::Xml::Security {

/// Decides which key a signature is verified with. It is the only source of trust in a
/// verification. Callers may implement it; implementations must be thread-safe. `KeyInfo` and
/// `ReadKeyHints` return what the message says about its key, which is only a hint.
class TARNIK_EXPORT KeyInfoResolver : public virtual Object {
 public:
  /// The trusted key for a signature with `keyInfo`, or null when there is no trusted key. Its
  /// exceptions pass through the verification unchanged.
  virtual Ref<const Crypto::PublicKey> Resolve(const KeyInfo& keyInfo) const = 0;
};

/// A resolver that may know several keys for a signature, for example while a signer changes its
/// key. Callers may implement it; implementations must be thread-safe.
class TARNIK_EXPORT KeyCandidatesResolver : public KeyInfoResolver {
 public:
  /// The trusted keys that a signature with `keyInfo` may have been made with; empty when there is
  /// no trusted key. A verification calls this function and not `Resolve`. It tries the keys in
  /// this order, until one verifies the signature value. If there is more than one, it skips keys
  /// that do not fit the signature algorithm or are too weak, and tries at most 16. Null is
  /// skipped. Exceptions pass through the verification unchanged.
  virtual std::vector<Ref<const Crypto::PublicKey>> Candidates(const KeyInfo& keyInfo) const = 0;
};

/// A resolver whose keys are those of certificates, and that returns these too. A program can then
/// check the signer's certificate, for example whether it is revoked. Callers may implement it;
/// implementations must be thread-safe.
class TARNIK_EXPORT CertificateCandidatesResolver : public KeyCandidatesResolver {
 public:
  /// The trusted certificates that a signature with `keyInfo` may have been made with, selected by
  /// the rules of `Candidates` and in the same order; their keys are the keys that it returns.
  /// Several certificates of one key are all returned, and `Candidates` returns that key once.
  /// Certificates whose key cannot be used are not returned; if it is the only one that is
  /// selected, `CryptoException` is thrown, as `Candidates` does.
  virtual std::vector<Ref<const Crypto::Certificate>> CandidateCertificates(
      const KeyInfo& keyInfo) const = 0;
};

/// Trusts exactly `certificates`. What the message says about its key only selects among them:
///  - Only the first kind of hint that is present is used, in this order: X509Certificate (one must
///    equal a trusted one byte for byte), X509IssuerSerial, X509SKI, X509SubjectName, X509Digest
///    with SHA-256, SHA-384 or SHA-512, and keys (KeyValue, DEREncodedKeyValue). A hint that names
///    no trusted certificate or cannot be read selects none, whatever other kinds say.
///  - Of each kind, the first 16 hints are used.
///  - Names are equal as in RFC 5280, section 7.1; their texts may be in the forms of RFC 4514, RFC
///    2253 and RFC 1779 and those that Java, .NET and OpenSSL write. A certificate without a
///    SubjectKeyIdentifier has the one of RFC 5280, section 4.2.1.2, method 1.
///  - If several certificates are selected, their keys are tried as described at
///    `KeyCandidatesResolver::Candidates`, in the order of the list.
///  - Without any of these hints, all certificates are selected. KeyName is not a hint, since
///    certificates have no such names. If the list has only one certificate, X509Digest and keys
///    are not hints either.
/// `Resolve` returns the selected key if there is exactly one. The validity periods of the
/// certificates are not checked. The result also is a `CertificateCandidatesResolver`. Throws
/// `InvalidArgumentException` when the list is empty or contains null.
TARNIK_EXPORT Ref<const KeyInfoResolver> CreateTrustedCertificatesResolver(
    std::vector<Ref<const Crypto::Certificate>> certificates);

/// As above, but the certificate is selected by the issuer that the KeyInfo names: the
/// X509IssuerSerial, or else the issuer and serial number of the first certificate in the KeyInfo.
/// A signature that names no issuer, or several certificates with different keys, is rejected.
TARNIK_EXPORT Ref<const KeyInfoResolver> CreateCertificateIssuerResolver(
    std::vector<Ref<const Crypto::Certificate>> certificates);

}  // namespace Tarnik::Xml::Security

#endif
