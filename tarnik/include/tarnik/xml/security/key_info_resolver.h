#ifndef TARNIK_XML_SECURITY_KEY_INFO_RESOLVER_H
#define TARNIK_XML_SECURITY_KEY_INFO_RESOLVER_H

#include <vector>

#include <tarnik/core/object.h>
#include <tarnik/core/ref.h>
#include <tarnik/crypto/certificate.h>
#include <tarnik/xml/security/key_info.h>

namespace Tarnik::Xml::Security {

/// Decides which key a signature is verified with: the one root of trust of verification. Callers
/// may supply their own; it must be safe to use from many threads.
class TARNIK_EXPORT KeyInfoResolver : public virtual Object {
 public:
  /// The trusted key for a signature that carries `keyInfo`, or null when none is trusted. What it
  /// throws passes through the verification unchanged.
  virtual Ref<const Crypto::PublicKey> Resolve(const KeyInfo& keyInfo) const = 0;
};

/// Trusts exactly `certificates`. A signature that carries certificates or other X.509 hints is
/// verified with the trusted certificate that they name; the most telling kind of hint that is
/// there decides alone: carried certificates (one must equal a trusted one byte for byte), issuer
/// and serial number, subject key identifier, subject name. Hints that name several trusted
/// certificates choose none. A signature that carries no hint is verified if a single certificate
/// is trusted. Validity dates of the certificates are not judged. Throws
/// `InvalidArgumentException` when the list is empty or holds null.
TARNIK_EXPORT Ref<const KeyInfoResolver> CreateTrustedCertificatesResolver(
    std::vector<Ref<const Crypto::Certificate>> certificates);

/// As above, but a signature's certificate is chosen by the issuer that the KeyInfo names: the
/// X509IssuerSerial, or else the issuer and serial number of the first certificate that is carried.
/// A signature that names no issuer is refused.
TARNIK_EXPORT Ref<const KeyInfoResolver> CreateCertificateIssuerResolver(
    std::vector<Ref<const Crypto::Certificate>> certificates);

}  // namespace Tarnik::Xml::Security

#endif
