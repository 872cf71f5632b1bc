#ifndef TARNIK_XML_SECURITY_KEY_INFO_RESOLVER_H
#define TARNIK_XML_SECURITY_KEY_INFO_RESOLVER_H

#include <vector>

#include <tarnik/core/object.h>
#include <tarnik/core/ref.h>
#include <tarnik/crypto/certificate.h>
#include <tarnik/xml/security/key_info.h>

namespace Tarnik::Xml::Security {

/// Decides which key a signature is verified with. It is the only source of trust in a
/// verification. Callers may implement it; implementations must be thread-safe.
class TARNIK_EXPORT KeyInfoResolver : public virtual Object {
 public:
  /// The trusted key for a signature with `keyInfo`, or null when there is no trusted key. Its
  /// exceptions pass through the verification unchanged.
  virtual Ref<const Crypto::PublicKey> Resolve(const KeyInfo& keyInfo) const = 0;
};

/// Trusts exactly `certificates`. A signature with certificates or other X.509 hints is verified
/// with the trusted certificate that they name. Only the first kind of hint that is present is
/// used, in this order: certificates (one must equal a trusted one byte for byte), issuer and
/// serial number, subject key identifier, subject name. Hints of the last three kinds that name
/// several trusted certificates select none. A signature without hints is verified if only a single
/// certificate is trusted. The validity periods of the certificates are not checked. Throws
/// `InvalidArgumentException` when the list is empty or contains null.
TARNIK_EXPORT Ref<const KeyInfoResolver> CreateTrustedCertificatesResolver(
    std::vector<Ref<const Crypto::Certificate>> certificates);

/// As above, but the certificate is selected by the issuer that the KeyInfo names: the
/// X509IssuerSerial, or else the issuer and serial number of the first certificate in the KeyInfo.
/// A signature that names no issuer is rejected.
TARNIK_EXPORT Ref<const KeyInfoResolver> CreateCertificateIssuerResolver(
    std::vector<Ref<const Crypto::Certificate>> certificates);

}  // namespace Tarnik::Xml::Security

#endif
